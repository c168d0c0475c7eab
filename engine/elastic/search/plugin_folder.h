#pragma once

#include <memory>
#include <string>
#include <vector>

#include "elastic/common/file_descriptor.h"
#include "vantrel/elastic/search_plugin.h"

namespace vantrel::elastic {

// A folder with search plugins, see SearchPluginRegistry::LoadFolder. What is opened is checked, and what was
// checked is loaded: nobody can put another file in its place in between. All of it throws PluginLoadError.
class PluginFolder {
 public:
  explicit PluginFolder(std::string path);

  // The names of the shared objects, sorted.
  std::vector<std::string> List() const;

  std::shared_ptr<const SearchPlugin> Load(const std::string& name) const;

 private:
  std::string path_;
  FileDescriptor folder_;
};

}  // namespace vantrel::elastic
