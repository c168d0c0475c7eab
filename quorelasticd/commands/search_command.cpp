#include <limits>
#include <utility>
#include <vector>

#include "base/limits.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "commands/used_indexes.h"
#include "vantrel/elastic/search.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::FieldValues;
using vantrel::elastic::SearchHit;
using vantrel::elastic::SearchRequest;
using vantrel::elastic::SearchResult;

constexpr const char* kPluginFilter = "plugin";

// As documents are given: a string, or an array where there are several values.
Json::Value ToJson(const std::vector<FieldValues>& fields) {
  Json::Value object(Json::objectValue);
  for (const FieldValues& field : fields) {
    Json::Value& values = object[field.name];
    if (field.values.size() == 1) {
      values = field.values.front();
    } else {
      for (const std::string& value : field.values) values.append(value);
    }
  }
  return object;
}

class Search : public RunningCommand {
 public:
  Search(const Daemon& daemon, const Json::Value& data)
      : daemon_(daemon),
        quick_turn_(daemon.searching().quick_turns),
        used_(daemon.registry(), data["indice"]) {
    request_.query = data["query_string"]["query"].asString();
    request_.from = data.get("from", Json::UInt64{request_.from}).asUInt64();
    request_.size = data.get("size", Json::UInt64{request_.size}).asUInt64();
    request_.time_limit = daemon.searching().time_limit;
    for (const Json::Value& filter : data["filters"]) AddFilter(filter["data"]);
    if (!data.isMember("load_field")) return;
    request_.load_fields.emplace();
    for (const Json::Value& field : data["load_field"]) request_.load_fields->push_back(field.asString());
  }

  boost::asio::any_io_executor executor() const override {
    if (quick_turn_.is_taken()) return {};
    return daemon_.searching().executor;
  }

  Outcome Step() override {
    std::vector<std::shared_ptr<vantrel::elastic::Index>> indexes;
    for (const auto& open : used_.open()) indexes.push_back(open->shared_index());
    const SearchResult found = SearchIndexes(indexes, request_, daemon_.searching().plugins);
    Json::Value result(Json::objectValue);
    result["total"] = static_cast<Json::UInt64>(found.total);
    result["max_score"] = found.max_score;
    result["query"] = found.query;
    result["hits"] = Json::arrayValue;
    for (const SearchHit& hit : found.hits) result["hits"].append(Describe(hit));
    for (const std::string& warning : found.warnings) warnings_.append(warning);
    result["warnings"] = std::move(warnings_);
    return Result(std::move(result));
  }

 private:
  void AddFilter(const Json::Value& filter) {
    const std::string plugin = filter["name"].asString();
    vantrel::elastic::JsonValue data;
    static_cast<Json::Value&>(data) = filter.get("data", Json::Value());
    if (plugin.empty() && !data.isNull()) {
      warnings_.append("the data of a filter without a plugin's name is passed over");
    }
    request_.filters.push_back({plugin, std::move(data)});
  }

  Json::Value Describe(const SearchHit& hit) const {
    Json::Value described(Json::objectValue);
    described["index"] = used_.open()[hit.index]->name();
    described["id"] = hit.id;
    described["score"] = hit.score;
    described["fields"] = ToJson(hit.fields);
    return described;
  }

  const Daemon& daemon_;
  Turns::Turn quick_turn_;
  UsedIndexes used_;
  SearchRequest request_;
  Json::Value warnings_ = Json::arrayValue;
};

Shape FilterShape() {
  return Object({
      {"name", true, Choice({kPluginFilter}), "What kind of filter it is."},
      {"data", true,
       Object({
           {"name", true, Text(), "The search plugin; with an empty name it is no filter."},
           {"data", false, Any(), "What the plugin takes."},
       }),
       "The filter itself."},
  });
}

}  // namespace

Command SearchCommand() {
  const vantrel::elastic::SearchLimits limits;
  constexpr int64_t kAnyMost = std::numeric_limits<int64_t>::max();
  return {
      "search", "Finds documents, the best first.",
      Object({
          {"indice", true, UsedIndexes::Names(), "The names of the indexes to search, as if they were one."},
          {"query_string", true, Object({{"query", true, Text(), "The query, see below."}}),
           "What to search for."},
          {"from", false, Integer(0, kAnyMost), "How many hits to pass over; 0 by default."},
          {"size", false, Integer(0, kAnyMost), "How many hits to return at most; 10 by default."},
          {"filters", false, ArrayOf(FilterShape(), static_cast<int64_t>(limits.filters)),
           "What all have to let a document through."},
          {"load_field", false, ArrayOf(Text(), kMostFields),
           "The only stored fields to return; all by default."},
      }),
      [](const Daemon& daemon, Json::Value&& data) -> std::unique_ptr<RunningCommand> {
        return std::make_unique<Search>(daemon, data);
      }};
}

}  // namespace quorelasticd
