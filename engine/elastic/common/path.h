#pragma once

#include <string>

namespace vantrel::elastic {

// The path of `name` in `folder`, whether or not the folder's path ends with a slash.
inline std::string JoinPath(const std::string& folder, const std::string& name) {
  return folder.ends_with('/') ? folder + name : folder + "/" + name;
}

}  // namespace vantrel::elastic
