#include "vantrel/elastic/search_plugin.h"

#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/search/built_in_plugins.h"
#include "elastic/search/plugin_folder.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

SearchPlugin::~SearchPlugin() = default;

SearchPluginRegistry::SearchPluginRegistry() {
  for (const auto& plugin : MakeBuiltInPlugins()) Add(plugin);
}

SearchPluginRegistry::~SearchPluginRegistry() = default;

const SearchPluginRegistry& SearchPluginRegistry::BuiltIn() {
  static const SearchPluginRegistry registry;
  return registry;
}

void SearchPluginRegistry::Add(const std::shared_ptr<const SearchPlugin>& plugin) {
  const std::string name = plugin->name();
  if (name.empty()) throw PluginLoadError("search plugin \"\"", "a plugin needs a name");
  if (!plugins_.try_emplace(name, plugin).second) {
    throw PluginLoadError("search plugin " + Quoted(name), "there is one of that name already");
  }
}

std::shared_ptr<const SearchPlugin> SearchPluginRegistry::Find(const std::string& name) const {
  const auto found = plugins_.find(name);
  return found == plugins_.end() ? nullptr : found->second;
}

std::vector<std::shared_ptr<const SearchPlugin>> SearchPluginRegistry::List() const {
  std::vector<std::shared_ptr<const SearchPlugin>> plugins;
  for (const auto& [name, plugin] : plugins_) plugins.push_back(plugin);
  return plugins;
}

size_t SearchPluginRegistry::LoadFolder(const std::string& folder) {
  const PluginFolder files(folder);
  size_t count = 0;
  for (const std::string& name : files.List()) {
    Add(files.Load(name));
    ++count;
  }
  return count;
}

}  // namespace vantrel::elastic
