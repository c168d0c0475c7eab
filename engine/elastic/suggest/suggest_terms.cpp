#include "elastic/suggest/suggest_terms_in.h"

#include <algorithm>
#include <deque>
#include <limits>
#include <memory>
#include <utility>

#include "elastic/format/segment_files.h"
#include "elastic/format/text.h"
#include "elastic/format/watched_folder.h"
#include "elastic/suggest/best_terms.h"
#include "elastic/suggest/deadline.h"
#include "elastic/suggest/merged_prefix_walk.h"
#include "elastic/suggest/prefix_walk.h"

namespace vantrel::elastic {
namespace {

MergedPrefixWalk OpenWalk(const std::vector<const format::Folder*>& folders, const SuggestRequest& request,
                          Deadline& deadline) {
  std::vector<std::unique_ptr<PrefixWalk>> walks;
  for (const format::Folder* const folder : folders) {
    const format::WatchedFolder watched(*folder, deadline);
    for (format::SegmentFiles& files : format::OpenNewestSegments(watched, format::Need::kAll)) {
      walks.push_back(std::make_unique<PrefixWalk>(std::move(files), request.field, request.prefix));
    }
  }
  return MergedPrefixWalk(std::move(walks));
}

// How many of the best have to be known.
uint64_t Wanted(const SuggestRequest& request) {
  constexpr uint64_t kAll = std::numeric_limits<uint64_t>::max();
  if (request.limit == 0) return 0;
  return request.skip > kAll - request.limit ? kAll : request.skip + request.limit;
}

}  // namespace

std::vector<SuggestedTerm> SuggestTermsIn(const std::vector<const format::Folder*>& folders,
                                          const SuggestRequest& request) {
  Deadline deadline(request.time_limit);
  const uint64_t wanted = Wanted(request);
  BestTerms best(wanted);
  MergedPrefixWalk walk = OpenWalk(folders, request, deadline);
  while (wanted > 0 && walk.Next()) {
    const uint64_t frequency = walk.document_frequency();
    // In this order: most terms are not among the best, and whether one is live may take long to tell.
    if (!best.WouldTake(walk.text(), frequency) || !walk.IsLive()) continue;
    if (!format::IsValidUtf8(walk.text())) walk.Damaged("term is not valid UTF-8");
    best.Add(walk.text(), frequency);
  }
  std::vector<SuggestedTerm> terms = best.Take();
  terms.erase(terms.begin(),
              terms.begin() + static_cast<ptrdiff_t>(std::min<uint64_t>(request.skip, terms.size())));
  return terms;
}

std::vector<SuggestedTerm> SuggestTerms(const std::vector<std::string>& folders,
                                        const SuggestRequest& request) {
  std::deque<format::DiskFolder> opened;
  std::vector<const format::Folder*> pointers;
  for (const std::string& path : folders) pointers.push_back(&opened.emplace_back(path));
  return SuggestTermsIn(pointers, request);
}

}  // namespace vantrel::elastic
