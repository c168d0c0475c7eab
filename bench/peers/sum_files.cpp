// Reads every file of a folder from begin to end on one thread and adds up its bytes: the least that a program does
// which looks at each of them.

#include <cstdint>
#include <iostream>
#include <numeric>

#include "support/read_folder.h"

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_sum_files FOLDER\n";
    return 2;
  }
  uint64_t sum = 0;
  const auto add = [&](auto piece) { sum = std::accumulate(piece.begin(), piece.end(), sum); };
  if (!quorelastic::bench::ReadFolder(argv[1], size_t{128} << 10, add)) return 1;
  std::cout << sum << '\n';
  return 0;
}
