#include "vantrel/elastic/term_listing.h"

#include <utility>
#include <vector>

#include "elastic/format/io/folder.h"
#include "elastic/segment/segment_files.h"
#include "elastic/terms/merged_terms.h"
#include "elastic/terms/selected_terms.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

std::vector<std::unique_ptr<SelectedTerms>> OpenSegments(const std::string& path,
                                                         const TermListingRequest& request) {
  const format::TermSelection selection = {.field = request.field, .text = request.prefix};
  const format::DiskFolder folder(path);
  std::vector<std::unique_ptr<SelectedTerms>> segments;
  AddSelectedTerms(
      format::OpenNewestSegments(folder, request.live_only ? format::Need::kAll : format::Need::kTerms),
      selection, segments);
  return segments;
}

}  // namespace

class TermListing::Walk {
 public:
  Walk(const std::string& folder, const TermListingRequest& request)
      : folder_(folder), live_only_(request.live_only), terms_(OpenSegments(folder, request)) {}

  Move Next() {
    switch (Step()) {
      case MergedTerms::Move::kEnd:
        return Move::kEnd;
      case MergedTerms::Move::kPassedOver:
        return Move::kPassedOver;
      case MergedTerms::Move::kTerm:
        break;
    }
    return live_only_ && !terms_.IsLive() ? Move::kPassedOver : Move::kTerm;
  }

  const MergedTerms& terms() const { return terms_; }

 private:
  MergedTerms::Move Step() {
    try {
      return terms_.Step();
    } catch (const SortedOtherwise& error) {
      throw IndexError(folder_, error.what());
    }
  }

  std::string folder_;
  bool live_only_;
  MergedTerms terms_;
};

TermListing::TermListing(const std::string& folder, const TermListingRequest& request)
    : walk_(std::make_unique<Walk>(folder, request)) {}

TermListing::~TermListing() = default;

TermListing::Move TermListing::Next() { return walk_->Next(); }

const std::string& TermListing::field() const { return walk_->terms().field(); }

const std::string& TermListing::text() const { return walk_->terms().text(); }

}  // namespace vantrel::elastic
