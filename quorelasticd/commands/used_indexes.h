#pragma once

#include <json/value.h>

#include <memory>
#include <string>
#include <vector>

#include "commands/shape.h"
#include "data_root/index_registry.h"

namespace quorelasticd {

// The indexes that a request names in "indice", kept from being deleted as long as this lives.
class UsedIndexes {
 public:
  // `names` is of the shape below. Throws like IndexRegistry::Use(), and RequestError where a name comes twice.
  UsedIndexes(IndexRegistry& registry, const Json::Value& names);

  static Shape Names();

  // In the order of the request.
  const std::vector<std::shared_ptr<OpenIndex>>& open() const { return open_; }

 private:
  std::vector<std::shared_ptr<OpenIndex>> open_;
};

}  // namespace quorelasticd
