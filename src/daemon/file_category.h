#pragma once

#include <map>
#include <string>

// The file-name extensions of each category of files, as a query that finds any of them.
extern const std::map<std::string, std::string> FileCategoryMap;
