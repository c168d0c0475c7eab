#include "elastic/search/common_searcher.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace vantrel::elastic {
namespace {

// A sum in the library's type for counts, at its end where it would leave it.
int32_t Sum(int32_t a, int32_t b) {
  return static_cast<int32_t>(std::min<int64_t>(int64_t{a} + b, std::numeric_limits<int32_t>::max()));
}

}  // namespace

CommonStatistics::CommonStatistics(std::vector<Lucene::IndexReaderPtr> readers)
    : readers_(std::move(readers)) {
  for (const Lucene::IndexReaderPtr& reader : readers_) documents_ = Sum(documents_, reader->maxDoc());
}

int32_t CommonStatistics::CountDocumentsWith(const Lucene::TermPtr& term) {
  const auto [place, is_new] = known_.try_emplace({term->field(), term->text()}, 0);
  if (is_new) {
    for (const Lucene::IndexReaderPtr& reader : readers_) {
      place->second = Sum(place->second, reader->docFreq(term));
    }
  }
  return place->second;
}

double CommonScale::queryNorm(double sum_of_squared_weights) {
  if (scale_ > 0) return scale_;
  const double scale = DefaultSimilarity::queryNorm(sum_of_squared_weights);
  if (!std::isfinite(scale) || scale <= 0) return 1;  // nothing was looked for in this index
  return scale_ = scale;
}

CommonSearcher::CommonSearcher(const Lucene::IndexReaderPtr& index_reader,
                               std::shared_ptr<CommonStatistics> statistics)
    : IndexSearcher(index_reader), statistics_(std::move(statistics)) {}

}  // namespace vantrel::elastic
