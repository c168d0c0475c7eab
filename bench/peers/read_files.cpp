// Reads every file of the folders in a folder from begin to end, in the order of their names, in large pieces, into
// one buffer.

#include <iostream>

#include "support/read_folder.h"

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_read_files FOLDER\n";
    return 2;
  }
  return quorelastic::bench::ReadFolder(argv[1], size_t{4} << 20, [](auto /*piece*/) {}) ? 0 : 1;
}
