// A search plugin made for a version of the interface that is not there yet.

#include <cstdlib>

#include "vantrel/elastic/search_plugin.h"

namespace {

// Not to be called: nobody knows what it would have to be by then.
vantrel::elastic::SearchPlugin* Create() { std::abort(); }

}  // namespace

extern "C" VANTREL_ELASTIC_EXPORT const vantrel::elastic::SearchPluginEntry* quorelastic_search_plugin() {
  static const vantrel::elastic::SearchPluginEntry entry = {vantrel::elastic::kSearchPluginVersion + 1,
                                                            Create};
  return &entry;
}
