#include "elastic/lookup/term_place.h"

#include <algorithm>

#include "elastic/common/quoted.h"
#include "elastic/format/segment/term_order.h"

namespace vantrel::elastic::lookup {
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
    if (!cursor_.HasKeptText()) {
      cursor_.Damaged("term " + Quoted(cursor_.text()) + " is no text that can be kept");
    }
    return true;
  }

  const TermCursor& cursor() const { return cursor_; }

 private:
  TermCursor cursor_;
  uint64_t walked_ = 0;
};

}  // namespace

int TermComparison::Compare(const TermCursor& cursor) {
  const std::string_view text = cursor.text();
  same_ = format::SameLength(text, other_.text, std::min(same_, cursor.term_text().same_length()));
  if (cursor.field() < 0) return -1;
  const int by_field = fields_[static_cast<size_t>(cursor.field())].name.compare(other_.field);
  return by_field != 0 ? by_field : text.substr(same_).compare(std::string_view(other_.text).substr(same_));
}

std::optional<LookupPlace> FindPlace(const std::shared_ptr<const format::ByteSource>& index,
                                     const std::vector<format::FieldInfo>& fields, int32_t document_count,
                                     const std::optional<WantedTerm>& term,
                                     const std::function<void(const TermCursor&)>& count) {
  IndexWalk walk(index, fields, document_count);
  if (!term.has_value()) {
    while (walk.Next()) count(walk.cursor());
    return std::nullopt;
  }
  TermComparison comparison(fields, *term);
  std::vector<bool> is_behind;
  uint64_t before = 0;  // so many entries come before all those that are behind the term
  LookupPlace place;
  while (walk.Next()) {
    count(walk.cursor());
    is_behind.push_back(comparison.Compare(walk.cursor()) > 0);
    if (before + 1 != is_behind.size() || is_behind.back()) continue;
    ++before;
    walk.cursor().UpdateCopy(place.place);
  }
  const auto end =
      std::partition_point(is_behind.begin(), is_behind.end(), [](bool behind) { return !behind; });
  if (end == is_behind.begin()) return std::nullopt;
  place.number = static_cast<uint64_t>(end - is_behind.begin()) - 1;
  if (place.number + 1 == before) return place;
  // Out of order.
  place.place = {};
  IndexWalk again(index, fields, document_count);
  for (uint64_t i = 0; i <= place.number && again.Next(); ++i) again.cursor().UpdateCopy(place.place);
  return place;
}

}  // namespace vantrel::elastic::lookup
