#include "vantrel/elastic/to_lower_pre_proc.h"

#include <lucene++/LuceneHeaders.h>

// Not without the index library's main header.
#include <lucene++/CharFolder.h>

#include <stdexcept>
#include <string_view>

#include "elastic/format/quoted.h"
#include "elastic/format/text.h"

namespace vantrel::elastic {
namespace {

std::string ToLower(std::string_view text) {
  std::string lower;
  lower.reserve(text.size());
  while (!text.empty()) {
    char32_t code_point = 0;
    if (format::TakeCodePoint(text, code_point)) {
      const wchar_t folded = Lucene::CharFolder::toLower(static_cast<wchar_t>(code_point));
      format::AppendUtf8(static_cast<char32_t>(folded), lower);
    } else {
      lower.push_back(text.front());
      text.remove_prefix(1);
    }
  }
  return lower;
}

class LowerTokens : public FieldTokens {
 public:
  explicit LowerTokens(std::unique_ptr<FieldTokens> wrapped) : wrapped_(std::move(wrapped)) {}

  bool Next(FieldToken& token) override {
    if (!wrapped_->Next(token)) return false;
    token.text = ToLower(token.text);
    return true;
  }

 private:
  std::unique_ptr<FieldTokens> wrapped_;
};

}  // namespace

std::unique_ptr<FieldTokens> ToLowerPreProc::Process(const std::string& text) const {
  return std::make_unique<LowerTokens>(ProcessWrapped(text));
}

void ToLowerPreProc::CheckArgument(const std::string& argument) {
  if (!argument.empty()) {
    throw std::invalid_argument("\"tolower\" takes no argument, but got " + format::Quoted(argument));
  }
}

}  // namespace vantrel::elastic
