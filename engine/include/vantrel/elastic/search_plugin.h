#pragma once

#include <json/value.h>

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/library_types.h"

namespace vantrel::elastic {

struct SearchLimits;

// What a plugin may want to know about the search that its filter is for. Valid during the call only.
struct SearchPluginContext {
  const IndexSettings& settings;  // of the index that is searched
  const SearchLimits& limits;
};

// A kind of filter that a search can ask for by name. One object serves every search: its operations are
// called by any thread, several at a time.
class VANTREL_ELASTIC_EXPORT SearchPlugin {
 public:
  SearchPlugin() = default;
  SearchPlugin(const SearchPlugin&) = delete;
  SearchPlugin& operator=(const SearchPlugin&) = delete;
  virtual ~SearchPlugin();

  // What requests call it; not empty, the same at all times.
  virtual std::string name() const = 0;

  // In one line: what the filter keeps, and the data it takes.
  virtual std::string summary() const = 0;

  // Builds the filter that `data` describes, for one index and one search; never null. The library's rules for
  // filters hold: getDocIdSet is called for each segment's reader, by one thread at a time. Throws
  // PluginDataError where `data` is not what was expected, LimitExceededError where it is too much.
  virtual Lucene::FilterPtr MakeFilter(const SearchPluginContext& context, const Json::Value& data) const = 0;
};

// The plugins that searches can name. Filled before it is shared between threads, constant from then on.
class VANTREL_ELASTIC_EXPORT SearchPluginRegistry {
 public:
  // With the built-in plugins:
  //
  //   term      {"field": name, "values": [text, ...]}   the field holds one of the values: a keyword, or a
  //             word of a text in the form it is indexed in
  //   ids       {"values": [text, ...]}                  the document's id is one of the values
  //   range     {"field": name, "from": bound, "to": bound, "include_lower": bool, "include_upper": bool,
  //              "numeric": bool}                        the field holds a value between the bounds. At least
  //             one of the bounds is given; both count in unless told otherwise. Texts compare by code points.
  //             With "numeric" (default: false) the bounds are numbers, or texts that are decimal numbers, and
  //             so are the values compared; a value that is no number is not in any range. That looks at every
  //             value of the field.
  //   category  {"field": name, "category": name}        the field, a keyword that holds a file name extension
  //             without its dot, in lower case or upper case, belongs to a file category (file_category.h)
  SearchPluginRegistry();
  SearchPluginRegistry(const SearchPluginRegistry&) = delete;
  SearchPluginRegistry& operator=(const SearchPluginRegistry&) = delete;
  ~SearchPluginRegistry();

  // The registry with the built-in plugins alone.
  static const SearchPluginRegistry& BuiltIn();

  // Throws PluginLoadError where the plugin has no name, or there is one of its name.
  void Add(const std::shared_ptr<const SearchPlugin>& plugin);

  // Null where there is none of that name.
  std::shared_ptr<const SearchPlugin> Find(const std::string& name) const;

  // All of them, by name.
  std::vector<std::shared_ptr<const SearchPlugin>> List() const;

  // Adds the plugins that stand in a folder as shared objects, files whose names end in ".so", in the order of
  // their names, and returns how many. Each is loaded for as long as the process lives. The folder, and each of
  // the files, must belong to root or to the user who runs this process and be writable by no other; no symbolic
  // link is followed. Throws PluginLoadError where the folder or one of the files is not so, cannot be loaded,
  // or is made for another version of this interface; what was added before stays.
  size_t LoadFolder(const std::string& folder);

 private:
  std::map<std::string, std::shared_ptr<const SearchPlugin>> plugins_;
};

// What a shared object has to offer to be a search plugin: a function
//
//   extern "C" const vantrel::elastic::SearchPluginEntry* quorelastic_search_plugin();
//
// whose result lives as long as the shared object is loaded. `version` is kSearchPluginVersion as of when the
// plugin was compiled; it is looked at before anything else, and changes whenever a plugin has to be compiled
// anew. `create` makes the plugin, which the caller deletes; null where it cannot.
struct SearchPluginEntry {
  uint32_t version;
  SearchPlugin* (*create)();
};

inline constexpr uint32_t kSearchPluginVersion = 1;
inline constexpr const char* kSearchPluginEntryName = "quorelastic_search_plugin";

}  // namespace vantrel::elastic
