#include "vantrel/elastic/search_error.h"

#include "elastic/common/quoted.h"

namespace vantrel::elastic {

QuerySyntaxError::QuerySyntaxError(uint64_t position, const std::string& problem)
    : SearchError("the query, at character " + std::to_string(position) + ": " + problem),
      position_(position) {}

LimitExceededError::LimitExceededError(const std::string& limit, uint64_t most, const std::string& problem)
    : SearchError(problem + "; at most " + std::to_string(most) + " (limit " + limit + ")"),
      limit_(limit),
      most_(most) {}

UnknownPluginError::UnknownPluginError(const std::string& plugin)
    : SearchError("there is no search plugin " + Quoted(plugin)), plugin_(plugin) {}

PluginDataError::PluginDataError(const std::string& plugin, const std::string& problem)
    : SearchError("search plugin " + Quoted(plugin) + ": " + problem), plugin_(plugin) {}

SearchTimeoutError::SearchTimeoutError() : SearchError("the search took longer than its time limit") {}

PluginLoadError::PluginLoadError(const std::string& subject, const std::string& problem)
    : SearchError(subject + ": " + problem) {}

}  // namespace vantrel::elastic
