// Reads every file of a folder from begin to end on one thread and adds up its bytes: the least that a program does
// which looks at each of them.

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <iostream>
#include <numeric>
#include <string>
#include <vector>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_sum_files FOLDER\n";
    return 2;
  }
  std::vector<std::string> paths;
  for (const auto& entry : std::filesystem::directory_iterator(argv[1])) {
    if (entry.is_regular_file()) paths.push_back(entry.path().string());
  }
  std::sort(paths.begin(), paths.end());
  std::vector<uint8_t> buffer(size_t{128} << 10);
  uint64_t sum = 0;
  for (const std::string& path : paths) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) return 1;
    ssize_t got = 1;
    while (got > 0) {
      got = read(file, buffer.data(), buffer.size());
      if (got > 0) sum = std::accumulate(buffer.begin(), buffer.begin() + got, sum);
    }
    close(file);
    if (got < 0) return 1;
  }
  std::cout << sum << '\n';
  return 0;
}
