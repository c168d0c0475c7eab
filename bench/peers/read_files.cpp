// Reads every file of the folders in a folder from begin to end, in the order of their names, in large pieces, into
// one buffer.

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <iostream>
#include <string>
#include <vector>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_read_files FOLDER\n";
    return 2;
  }
  std::vector<std::string> paths;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(argv[1])) {
    if (entry.is_regular_file()) paths.push_back(entry.path().string());
  }
  std::sort(paths.begin(), paths.end());
  std::vector<char> buffer(size_t{4} << 20);
  for (const std::string& path : paths) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) return 1;
    ssize_t got = 1;
    while (got > 0) got = read(file, buffer.data(), buffer.size());
    close(file);
    if (got < 0) return 1;
  }
  return 0;
}
