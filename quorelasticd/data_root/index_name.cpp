#include "data_root/index_name.h"

#include <algorithm>
#include <cstddef>

namespace quorelasticd {

bool IsIndexName(std::string_view name) {
  constexpr size_t kLongest = 64;
  const auto is_alphanumeric = [](char c) { return (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9'); };
  return !name.empty() && name.size() <= kLongest && is_alphanumeric(name.front()) && name != "import" &&
         std::all_of(name.begin(), name.end(),
                     [&](char c) { return is_alphanumeric(c) || c == '_' || c == '-'; });
}

}  // namespace quorelasticd
