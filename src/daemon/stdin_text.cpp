#include "daemon/stdin_text.h"

#include <unistd.h>

#include <iostream>
#include <sstream>

namespace {

[[noreturn]] void WaitForever() {
  for (;;) pause();
}

}  // namespace

void ReadStdinText(std::string& text) {
  constexpr std::streamsize kLineSize = 1024;  // the terminating NUL included
  char line[kLineSize];
  std::stringstream collected;
  for (;;) {
    std::cin.getline(line, kLineSize);
    if (std::cin.eof()) break;
    collected << line;
    if (std::cin.fail()) WaitForever();  // a line that is too long
  }
  text = collected.str();
}
