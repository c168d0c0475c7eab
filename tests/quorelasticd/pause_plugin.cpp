// A search plugin that keeps every document, but takes its time, for tests of what goes on meanwhile.

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/Filter.h>
#include <lucene++/OpenBitSet.h>

#include <chrono>
#include <thread>

#include "vantrel/elastic/search_error.h"
#include "vantrel/elastic/search_plugin.h"

namespace {

using vantrel::elastic::SearchPlugin;
using vantrel::elastic::SearchPluginContext;

class PauseFilter : public Lucene::Filter {
 public:
  explicit PauseFilter(std::chrono::milliseconds pause) : pause_(pause) {}

  Lucene::DocIdSetPtr getDocIdSet(const Lucene::IndexReaderPtr& reader) override {
    std::this_thread::sleep_for(pause_);
    const auto bits = Lucene::newLucene<Lucene::OpenBitSet>(reader->maxDoc());
    bits->set(0, reader->maxDoc());
    return bits;
  }

 private:
  std::chrono::milliseconds pause_;
};

class Pause : public SearchPlugin {
 public:
  std::string name() const override { return "pause"; }
  std::string summary() const override { return R"(everything, after a while: {"milliseconds": n})"; }

  Lucene::FilterPtr MakeFilter(const SearchPluginContext& /*context*/,
                               const Json::Value& data) const override {
    if (!data.isObject() || !data["milliseconds"].isUInt()) {
      throw vantrel::elastic::PluginDataError(name(), R"(expected is {"milliseconds": n})");
    }
    return Lucene::newLucene<PauseFilter>(std::chrono::milliseconds(data["milliseconds"].asUInt()));
  }
};

SearchPlugin* Create() { return new Pause; }

}  // namespace

extern "C" VANTREL_ELASTIC_EXPORT const vantrel::elastic::SearchPluginEntry* quorelastic_search_plugin() {
  static const vantrel::elastic::SearchPluginEntry entry = {vantrel::elastic::kSearchPluginVersion, Create};
  return &entry;
}
