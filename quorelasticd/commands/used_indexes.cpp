#include "commands/used_indexes.h"

#include <set>

#include "base/text.h"
#include "errors/request_error.h"
#include "vantrel/elastic/search.h"

namespace quorelasticd {

UsedIndexes::UsedIndexes(IndexRegistry& registry, const Json::Value& names) {
  std::set<std::string> told;
  for (const Json::Value& value : names) {
    const std::string name = value.asString();
    if (!told.insert(name).second) {
      throw RequestError(ErrorCode::kBadRequest,
                         "data.indice: expected each index once, found " + Quoted(name) + " twice");
    }
    open_.push_back(registry.Use(name));
  }
}

Shape UsedIndexes::Names() {
  return NonEmptyArrayOf(Text(), static_cast<int64_t>(vantrel::elastic::SearchLimits().indexes));
}

}  // namespace quorelasticd
