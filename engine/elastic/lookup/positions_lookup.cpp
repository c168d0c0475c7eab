#include "elastic/lookup/positions_lookup.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <string>

#include "elastic/common/quoted.h"
#include "elastic/common/text.h"
#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/positions.h"
#include "elastic/format/segment/postings.h"
#include "elastic/format/segment/skip_list.h"
#include "elastic/lookup/term_place.h"
#include "elastic/segment/dictionary_walk.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::lookup {
namespace {

using format::FieldInfo;
using format::TermCursor;
using format::TermInfo;

constexpr size_t kBufferSize = 4096;

// The lookup in one segment.
class SegmentLookup {
 public:
  SegmentLookup(const OpenedSegment& segment, const WantedTerm& term)
      : segment_(segment),
        term_(term),
        dictionary_(segment.Core(".tis"), TermCursor::File::kDictionary,
                    static_cast<uint32_t>(segment.fields.size()), segment.info.document_count),
        postings_(segment.Core(".frq"), segment.info.document_count, kBufferSize) {}

  // Whether the term is in a live document numbered `target` or higher, within the segment: then the library looks
  // no further.
  bool Finds(int32_t target) {
    const std::optional<TermInfo> info = FindTerm();
    if (!info.has_value()) return false;
    const FieldInfo& field = *segment_.FindField(term_.field);
    Begin(*info, field, target);
    passed_.clear();
    while (postings_.Next()) {
      passed_.push_back(postings_.frequency());
      if (postings_.document() < target) continue;
      if (segment_.deletions != nullptr && segment_.deletions->Contains(postings_.document())) continue;
      if (!field.omits_frequencies) CheckPositions(field);
      return true;
    }
    return false;
  }

 private:
  std::optional<TermInfo> FindTerm() {
    if (dictionary_.count() == 0) return std::nullopt;
    if (!segment_.place.has_value()) {
      throw IndexDamagedError(segment_.Core(".tii")->name(), 0, "no entry stands before all terms");
    }
    CheckWay();
    // An entry of the index repeats a term of the dictionary; where it is the wanted one, the library has it already.
    const format::TermPlace& place = segment_.place->place;
    if (place.field >= 0 && segment_.fields[static_cast<size_t>(place.field)].name == term_.field &&
        (dictionary_.is_utf8() ? place.text.bytes : FromUtf16(place.text.units)) == term_.text) {
      return Indexed(place.info);
    }
    const uint64_t walked = segment_.place->number * static_cast<uint64_t>(dictionary_.index_interval());
    if (walked >= dictionary_.count()) return std::nullopt;
    dictionary_.Resume(place, walked);
    return FindFurtherOn(walked);
  }

  // A wrong bit in the index over the dictionary could lead past the term, which would then seem not to be there.
  void CheckWay() const {
    try {
      format::DictionaryWalk walk(
          segment_.Core(".tis"), segment_.Core(".tii"), segment_.fields, segment_.info.document_count,
          {.kind = format::TermSelection::Kind::kExact, .field = term_.field, .text = term_.text});
      while (walk.Next()) {
      }
    } catch (const format::EndOfFileError& error) {
      // The library may not come by there.
      throw IndexDamagedError(error.path(), error.offset(), "a term goes on past the end of the file");
    }
  }

  std::optional<TermInfo> FindFurtherOn(uint64_t walked) {
    TermComparison comparison(segment_.fields, term_);
    for (; walked < dictionary_.count() && dictionary_.Next(); ++walked) {
      if (!dictionary_.HasKeptText()) {
        dictionary_.Damaged("term " + Quoted(dictionary_.text()) + " is no text that can be kept");
      }
      const int next = comparison.Compare(dictionary_);
      if (next == 0) return Indexed(dictionary_.info());
      if (next > 0) break;
    }
    return std::nullopt;
  }

  // The library has no positions open where no field that is indexed has any.
  TermInfo Indexed(const TermInfo& info) const {
    const FieldInfo& field = *segment_.FindField(term_.field);
    if (field.indexed) return info;
    throw IndexDamagedError(dictionary_.name(), dictionary_.offset(),
                            "term of field " + Quoted(field.name) + ", which is not indexed");
  }

  // Moves the postings to where the library begins to read them.
  void Begin(const TermInfo& info, const FieldInfo& field, int32_t target) {
    postings_.Seek(info, field.omits_frequencies);
    positions_pointer_ = info.positions_pointer;
    payload_length_.reset();
    // Of dictionaries before this format, the library reads no skip data.
    if (dictionary_.format() > format::kFormatWithSkipLists ||
        info.document_frequency < dictionary_.skip_interval())
      return;
    RequireSkipLevels(info);
    format::SkipListReader skips(segment_.Core(".frq"), dictionary_.skip_interval(),
                                 dictionary_.most_skip_levels());
    skips.Seek(info.postings_pointer + info.skip_offset, info.document_frequency, field.has_payloads);
    const auto landing = skips.SkipTo(target, segment_.info.document_count);
    if (landing.passed == 0) return;
    postings_.Resume(info.postings_pointer + landing.entry.postings_distance,
                     static_cast<int32_t>(landing.entry.document), info.document_frequency - landing.passed,
                     field.omits_frequencies);
    positions_pointer_ += landing.entry.positions_distance;
    payload_length_ = landing.entry.payload_length.value_or(0);
  }

  // The library computes the number of levels by logarithms, which are a little off for some intervals.
  void RequireSkipLevels(const TermInfo& info) const {
    const int32_t interval = dictionary_.skip_interval();
    const int32_t most = dictionary_.most_skip_levels();
    int32_t by_division = 0;
    for (int32_t left = info.document_frequency; interval > 1 && left >= interval; left /= interval)
      ++by_division;
    const auto by_logarithm =
        interval > 1
            ? static_cast<int32_t>(std::floor(std::log(info.document_frequency) / std::log(interval)))
            : 0;
    if (interval > 1 && most >= 1 && most <= format::kMostSkipLevels && by_division == by_logarithm) return;
    throw IndexDamagedError(dictionary_.name(), 0,
                            "skip interval " + std::to_string(interval) + " and " + std::to_string(most) +
                                " skip levels cannot be read");
  }

  void CheckPositions(const FieldInfo& field) const {
    format::PositionsReader positions(segment_.Core(".prx"), kBufferSize);
    positions.Seek(positions_pointer_, field.has_payloads, payload_length_);
    for (const uint32_t frequency : passed_) positions.PassDocument(frequency);
  }

  const OpenedSegment& segment_;
  const WantedTerm& term_;
  TermCursor dictionary_;
  format::PostingsReader postings_;
  uint64_t positions_pointer_ = 0;
  std::optional<uint32_t> payload_length_;
  std::vector<uint32_t> passed_;  // frequencies of the documents whose positions the library passes
};

}  // namespace

void CheckPositionsLookup(const std::vector<OpenedSegment>& segments, const WantedTerm& term,
                          int32_t document) {
  int64_t target = document;
  for (const OpenedSegment& segment : segments) {
    try {
      if (SegmentLookup(segment, term).Finds(static_cast<int32_t>(std::max<int64_t>(target, 0)))) return;
    } catch (const format::EndOfFileError&) {
      return;
    }
    target -= segment.info.document_count;
  }
}

}  // namespace vantrel::elastic::lookup
