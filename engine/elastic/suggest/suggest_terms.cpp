#include "elastic/suggest/suggest_terms_in.h"

#include <algorithm>
#include <deque>
#include <limits>
#include <memory>
#include <utility>

#include "elastic/format/io/watched_folder.h"
#include "elastic/segment/segment_files.h"
#include "elastic/suggest/best_terms.h"
#include "elastic/suggest/deadline.h"
#include "elastic/terms/merged_terms.h"
#include "elastic/terms/selected_terms.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

std::vector<std::unique_ptr<SelectedTerms>> OpenSegments(const std::vector<const format::Folder*>& folders,
                                                         const SuggestRequest& request, Deadline& deadline) {
  const format::TermSelection selection = {.field = request.field, .text = request.prefix};
  std::vector<std::unique_ptr<SelectedTerms>> segments;
  for (const format::Folder* const folder : folders) {
    const format::WatchedFolder watched(*folder, deadline);
    AddSelectedTerms(format::OpenNewestSegments(watched, format::Need::kAll), selection, segments);
  }
  return segments;
}

// How many of the best have to be known.
uint64_t Wanted(const SuggestRequest& request) {
  constexpr uint64_t kAll = std::numeric_limits<uint64_t>::max();
  if (request.limit == 0) return 0;
  return request.skip > kAll - request.limit ? kAll : request.skip + request.limit;
}

BestTerms FindBest(const std::vector<const format::Folder*>& folders, const SuggestRequest& request,
                   Deadline& deadline, format::TermOrders order) {
  const uint64_t wanted = Wanted(request);
  BestTerms best(wanted);
  MergedTerms terms(OpenSegments(folders, request, deadline), order);
  while (wanted > 0 && terms.Next()) {
    const uint64_t frequency = terms.document_frequency();
    // In this order: most terms are not among the best, and whether one is live may take long to tell.
    if (best.WouldTake(terms.text(), frequency, terms.same_length()) && terms.IsLive()) {
      best.Add(terms.text(), frequency);
    }
  }
  return best;
}

// Segments of older layouts may be sorted by UTF-16, which shows on the way.
BestTerms FindBestInAnyOrder(const std::vector<const format::Folder*>& folders, const SuggestRequest& request,
                             Deadline& deadline) {
  try {
    return FindBest(folders, request, deadline, format::kByCodePoints);
  } catch (const SortedOtherwise&) {
  }
  try {
    return FindBest(folders, request, deadline, format::kByUtf16);
  } catch (const SortedOtherwise& error) {
    throw IndexError(folders.front()->path(), error.what());
  }
}

}  // namespace

std::vector<SuggestedTerm> SuggestTermsIn(const std::vector<const format::Folder*>& folders,
                                          const SuggestRequest& request) {
  Deadline deadline(request.time_limit);
  std::vector<SuggestedTerm> terms = FindBestInAnyOrder(folders, request, deadline).Take();
  terms.erase(terms.begin(),
              terms.begin() + static_cast<ptrdiff_t>(std::min<uint64_t>(request.skip, terms.size())));
  return terms;
}

std::vector<SuggestedTerm> SuggestTerms(const std::vector<std::string>& folders,
                                        const SuggestRequest& request) {
  std::deque<format::DiskFolder> opened;
  std::vector<const format::Folder*> pointers;
  pointers.reserve(folders.size());
  for (const std::string& path : folders) pointers.push_back(&opened.emplace_back(path));
  return SuggestTermsIn(pointers, request);
}

}  // namespace vantrel::elastic
