// confine FILE PROGRAM [ARGUMENT ...]: runs a program under what systemd's SystemCallFilter=, MemoryDenyWriteExecute=,
// RestrictAddressFamilies=AF_UNIX and NoNewPrivileges= put it under. FILE names the system calls that are allowed, one
// a line; the others fail with EPERM.

#include <seccomp.h>
#include <sys/mman.h>
#include <sys/shm.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>

namespace {

class Filter {
 public:
  explicit Filter(uint32_t otherwise) : context_(seccomp_init(otherwise)) {
    if (context_ == nullptr) throw std::runtime_error("no filter can be made");
  }
  Filter(const Filter&) = delete;
  Filter& operator=(const Filter&) = delete;
  ~Filter() { seccomp_release(context_); }

  // A call that this processor has not is passed over.
  void Allow(const std::string& call) {
    const int number = seccomp_syscall_resolve_name(call.c_str());
    if (number >= 0) Require(seccomp_rule_add_array(context_, SCMP_ACT_ALLOW, number, 0, nullptr));
  }
  void Refuse(int number, int error, scmp_arg_cmp when) {
    Require(seccomp_rule_add_array(context_, SCMP_ACT_ERRNO(static_cast<uint16_t>(error)), number, 1, &when));
  }
  void Load() { Require(seccomp_load(context_)); }

 private:
  static void Require(int result) {
    if (result < 0) throw std::runtime_error("a filter was refused: error " + std::to_string(-result));
  }

  scmp_filter_ctx context_;
};

scmp_arg_cmp HasBits(unsigned argument, scmp_datum_t bits) {
  return {argument, SCMP_CMP_MASKED_EQ, bits, bits};
}

void Confine(const char* path) {
  Filter calls(SCMP_ACT_ERRNO(EPERM));
  std::ifstream file(path);
  if (!file) throw std::runtime_error(std::string("cannot read ") + path);
  for (std::string name; std::getline(file, name);) calls.Allow(name);

  Filter arguments(SCMP_ACT_ALLOW);
  arguments.Refuse(SCMP_SYS(mmap), EPERM, HasBits(2, PROT_WRITE | PROT_EXEC));
  arguments.Refuse(SCMP_SYS(mprotect), EPERM, HasBits(2, PROT_EXEC));
  arguments.Refuse(SCMP_SYS(pkey_mprotect), EPERM, HasBits(2, PROT_EXEC));
  arguments.Refuse(SCMP_SYS(shmat), EPERM, HasBits(2, SHM_EXEC));
  arguments.Refuse(SCMP_SYS(socket), EAFNOSUPPORT, {0, SCMP_CMP_NE, AF_UNIX, 0});

  // The second one, as loading a filter is a call that the list need not have.
  arguments.Load();
  calls.Load();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 3) {
    std::cerr << "usage: confine FILE PROGRAM [ARGUMENT ...]" << std::endl;
    return 2;
  }
  try {
    Confine(argv[1]);
  } catch (const std::exception& error) {
    std::cerr << "confine: " << error.what() << std::endl;
    return 125;
  }
  execv(argv[2], argv + 2);
  std::cerr << "confine: cannot run " << argv[2] << std::endl;
  return 126;
}
