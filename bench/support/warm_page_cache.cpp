// What the tool's "vmtouch" does, for another folder than the daemon's.

#include <iostream>

#include "vantrel/elastic/vm_touch.h"

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: warm_page_cache FOLDER\n";
    return 2;
  }
  return vantrel::elastic::WarmPageCache(argv[1]).is_whole ? 0 : 1;
}
