#pragma once

#include <memory>
#include <vector>

#include "vantrel/elastic/search_plugin.h"

namespace vantrel::elastic {

// The plugins that every registry has; see there.
std::vector<std::shared_ptr<const SearchPlugin>> MakeBuiltInPlugins();

}  // namespace vantrel::elastic
