// Writes the lines of a file to standard output, one system call each: the floor under any program that flushes
// after every line.

#include <unistd.h>

#include <cstddef>
#include <fstream>
#include <iostream>
#include <iterator>
#include <sstream>
#include <string>
#include <string_view>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_write_lines FILE\n";
    return 2;
  }
  std::ostringstream text;
  text << std::ifstream(argv[1], std::ios::binary).rdbuf();
  const std::string bytes = text.str();
  std::string_view rest = bytes;
  while (!rest.empty()) {
    const size_t newline = rest.find('\n');
    const size_t length = newline == std::string_view::npos ? rest.size() : newline + 1;
    if (write(STDOUT_FILENO, rest.data(), length) != static_cast<ssize_t>(length)) return 1;
    rest.remove_prefix(length);
  }
  return 0;
}
