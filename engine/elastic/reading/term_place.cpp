#include "elastic/reading/term_place.h"

#include <algorithm>

#include "elastic/format/quoted.h"
#include "elastic/format/term_cursor.h"
#include "elastic/format/text.h"

namespace vantrel::elastic::reading {
namespace {

using format::TermCursor;

// One pass over the index.
class IndexWalk {
 public:
  IndexWalk(const std::shared_ptr<const format::ByteSource>& index,
            const std::vector<format::FieldInfo>& fields, int32_t document_count)
      : cursor_(index, TermCursor::File::kIndex, static_cast<uint32_t>(fields.size()), document_count) {}

  // What lies behind the last entry is not read by the library.
  bool Next() {
    if (walked_ == cursor_.count() || !cursor_.Next()) return false;
    ++walked_;
    if (!format::IsKeptText(cursor_.text())) {
      cursor_.Damaged("term " + format::Quoted(cursor_.text()) + " is no text that can be kept");
    }
    return true;
  }

  const TermCursor& cursor() const { return cursor_; }

 private:
  TermCursor cursor_;
  uint64_t walked_ = 0;
};

}  // namespace

int CompareTerms(const std::vector<format::FieldInfo>& fields, int32_t field, std::string_view text,
                 const WantedTerm& other) {
  if (field < 0) return -1;
  const int by_field = fields[static_cast<size_t>(field)].name.compare(other.field);
  return by_field != 0 ? by_field : text.compare(other.text);
}

std::optional<LookupPlace> FindPlace(const std::shared_ptr<const format::ByteSource>& index,
                                     const std::vector<format::FieldInfo>& fields, int32_t document_count,
                                     const std::optional<WantedTerm>& term) {
  IndexWalk walk(index, fields, document_count);
  std::vector<bool> is_behind;
  LookupPlace last;
  while (walk.Next()) {
    if (!term.has_value()) continue;
    const TermCursor& cursor = walk.cursor();
    is_behind.push_back(CompareTerms(fields, cursor.field(), cursor.text(), *term) > 0);
    if (is_behind.back()) continue;
    last.number = is_behind.size() - 1;
    cursor.CopyPlace(last.place);
  }
  const auto end =
      std::partition_point(is_behind.begin(), is_behind.end(), [](bool behind) { return !behind; });
  if (end == is_behind.begin()) return std::nullopt;
  const auto number = static_cast<uint64_t>(end - is_behind.begin()) - 1;
  if (number == last.number) return last;
  // Out of order.
  IndexWalk again(index, fields, document_count);
  for (uint64_t i = 0; i <= number; ++i) again.Next();
  last.number = number;
  again.cursor().CopyPlace(last.place);
  return last;
}

}  // namespace vantrel::elastic::reading
