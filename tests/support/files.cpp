#include "support/files.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace quorelastic::testing {

std::string ReadFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  std::ostringstream bytes;
  if (file.peek() != std::ifstream::traits_type::eof()) bytes << file.rdbuf();
  if (!file.is_open() || file.bad()) throw std::runtime_error("cannot read " + path);
  return bytes.str();
}

void WriteFile(const std::string& path, const std::string& bytes) {
  std::ofstream file(path, std::ios::binary | std::ios::trunc);
  file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  file.close();
  if (!file) throw std::runtime_error("cannot write " + path);
}

std::vector<std::string> ListFolder(const std::string& path) {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(path))
    names.push_back(entry.path().filename());
  std::sort(names.begin(), names.end());
  return names;
}

std::string FindFile(const std::string& folder, const std::string& ending) {
  std::string found;
  for (const std::string& name : ListFolder(folder)) {
    if (!name.ends_with(ending)) continue;
    if (!found.empty()) throw std::runtime_error("more than one *" + ending + " in " + folder);
    found = name;
  }
  if (found.empty()) throw std::runtime_error("no *" + ending + " in " + folder);
  return found;
}

void CopyFolder(const std::string& from, const std::string& to) {
  std::filesystem::copy(from, to, std::filesystem::copy_options::recursive);
}

}  // namespace quorelastic::testing
