#pragma once

#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// What a search throws when the request, not the index, is at fault. what() is one line about the request,
// fit to be shown to whoever sent it. An index that cannot be read is an IndexError instead.
class VANTREL_ELASTIC_EXPORT SearchError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// The query string does not follow the syntax.
class VANTREL_ELASTIC_EXPORT QuerySyntaxError : public SearchError {
 public:
  QuerySyntaxError(uint64_t position, const std::string& problem);

  // Where, in characters (code points) from 0; the query's length where it ends too early. In a query that is
  // not valid UTF-8, 0.
  uint64_t position() const { return position_; }

 private:
  uint64_t position_;
};

// The request asks for more than one of SearchLimits allows.
class VANTREL_ELASTIC_EXPORT LimitExceededError : public SearchError {
 public:
  // `limit` is the name of a member of SearchLimits, `most` its value.
  LimitExceededError(const std::string& limit, uint64_t most, const std::string& problem);

  const std::string& limit() const { return limit_; }
  uint64_t most() const { return most_; }

 private:
  std::string limit_;
  uint64_t most_;
};

// A filter names a search plugin that there is not.
class VANTREL_ELASTIC_EXPORT UnknownPluginError : public SearchError {
 public:
  explicit UnknownPluginError(const std::string& plugin);

  const std::string& plugin() const { return plugin_; }

 private:
  std::string plugin_;
};

// The data of a filter is not what its plugin takes. what() says what was expected.
class VANTREL_ELASTIC_EXPORT PluginDataError : public SearchError {
 public:
  PluginDataError(const std::string& plugin, const std::string& problem);

  const std::string& plugin() const { return plugin_; }

 private:
  std::string plugin_;
};

// The search was given up after SearchRequest::time_limit.
class VANTREL_ELASTIC_EXPORT SearchTimeoutError : public SearchError {
 public:
  SearchTimeoutError();
};

// A search plugin could not be loaded or added. what() begins with the path of the file or folder, or with
// the name of the plugin.
class VANTREL_ELASTIC_EXPORT PluginLoadError : public SearchError {
 public:
  PluginLoadError(const std::string& subject, const std::string& problem);
};

}  // namespace vantrel::elastic
