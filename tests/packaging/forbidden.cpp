// forbidden memory|network: tries what a confined service must not be able to do, and says what became of it.

#include <sys/mman.h>
#include <sys/socket.h>

#include <cerrno>
#include <cstring>
#include <iostream>
#include <string>

int main(int argc, char** argv) {
  const std::string what = argc == 2 ? argv[1] : "";
  constexpr size_t kPage = 4096;
  bool is_done = false;
  if (what == "memory") {
    is_done = mmap(nullptr, kPage, PROT_READ | PROT_WRITE | PROT_EXEC, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0) !=
              MAP_FAILED;
  } else if (what == "network") {
    is_done = socket(AF_INET, SOCK_STREAM, 0) != -1;
  } else {
    return 2;
  }
  std::cout << (is_done ? "done" : std::strerror(errno)) << std::endl;
  return 0;
}
