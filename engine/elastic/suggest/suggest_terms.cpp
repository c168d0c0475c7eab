#include "vantrel/elastic/suggest_terms.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <utility>

#include "elastic/format/folder.h"
#include "elastic/format/segment_files.h"
#include "elastic/format/text.h"
#include "elastic/suggest/best_terms.h"
#include "elastic/suggest/deadline.h"
#include "elastic/suggest/merged_prefix_walk.h"
#include "elastic/suggest/prefix_walk.h"

namespace vantrel::elastic {
namespace {

MergedPrefixWalk OpenWalk(const std::vector<std::string>& folders, const SuggestRequest& request,
                          Deadline& deadline) {
  std::vector<std::unique_ptr<PrefixWalk>> walks;
  for (const std::string& path : folders) {
    const format::DiskFolder folder(path);
    for (format::SegmentFiles& files : format::OpenNewestSegments(folder, format::Need::kAll)) {
      walks.push_back(
          std::make_unique<PrefixWalk>(std::move(files), request.field, request.prefix, deadline));
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

std::vector<SuggestedTerm> SuggestTerms(const std::vector<std::string>& folders,
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

}  // namespace vantrel::elastic
