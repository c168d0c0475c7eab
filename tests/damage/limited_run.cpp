#include "damage/limited_run.h"

#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <stdexcept>
#include <system_error>

#include "support/child_limits.h"
#include "support/sanitized.h"

namespace quorelastic::testing {
namespace {

// A file in memory that takes what the program prints.
class Capture {
 public:
  Capture() : descriptor_(memfd_create("capture", MFD_CLOEXEC)) {
    if (descriptor_ < 0) throw std::system_error(errno, std::generic_category(), "memfd_create");
  }
  Capture(const Capture&) = delete;
  Capture& operator=(const Capture&) = delete;
  ~Capture() { close(descriptor_); }

  int descriptor() const { return descriptor_; }

  std::string Text() const {
    const off_t size = lseek(descriptor_, 0, SEEK_END);
    std::string text(static_cast<size_t>(size), '\0');
    if (pread(descriptor_, text.data(), text.size(), 0) != size)
      throw std::runtime_error("cannot read output");
    return text;
  }

 private:
  int descriptor_;
};

[[noreturn]] void BecomeProgram(std::vector<char*> arguments, const Capture& output, const Capture& errors) {
  dup2(output.descriptor(), STDOUT_FILENO);
  dup2(errors.descriptor(), STDERR_FILENO);
  LimitChild();
  // To look for leaks takes as long as the run. Tests within one process look for those of the same readers.
  if (kIsSanitized) setenv("LSAN_OPTIONS", "detect_leaks=0", 1);
  execv(arguments[0], arguments.data());
  _exit(127);
}

}  // namespace

LimitedRun RunToolLimited(const std::vector<std::string>& arguments) {
  return RunLimited(QUORELASTIC_TOOL, arguments);
}

LimitedRun RunLimited(const std::string& program, const std::vector<std::string>& arguments) {
  std::vector<std::string> copies = {program};
  copies.insert(copies.end(), arguments.begin(), arguments.end());
  std::vector<char*> pointers;
  pointers.reserve(copies.size() + 1);
  for (std::string& argument : copies) pointers.push_back(argument.data());
  pointers.push_back(nullptr);
  const Capture output;
  const Capture errors;
  const pid_t child = fork();
  if (child < 0) throw std::system_error(errno, std::generic_category(), "fork");
  if (child == 0) BecomeProgram(std::move(pointers), output, errors);
  LimitedRun run;
  rusage usage{};
  while (wait4(child, &run.status, 0, &usage) < 0) {
    if (errno != EINTR) throw std::system_error(errno, std::generic_category(), "wait4");
  }
  run.peak_bytes = int64_t{usage.ru_maxrss} * 1024;
  run.output = output.Text();
  run.errors = errors.Text();
  return run;
}

}  // namespace quorelastic::testing
