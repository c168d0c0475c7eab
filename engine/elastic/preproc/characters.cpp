#include "elastic/preproc/characters.h"

#include "elastic/common/text.h"

namespace vantrel::elastic {

size_t FirstCharacterLength(std::string_view text) {
  std::string_view rest = text;
  char32_t code_point = 0;
  return TakeCodePoint(rest, code_point) ? text.size() - rest.size() : 1;
}

uint64_t CountCharacters(std::string_view text) {
  uint64_t count = 0;
  for (; !text.empty(); ++count) text.remove_prefix(FirstCharacterLength(text));
  return count;
}

}  // namespace vantrel::elastic
