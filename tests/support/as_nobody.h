#pragma once

#include <unistd.h>

namespace quorelastic::testing {

// As long as it lives, a test that root runs has no more rights to files than anybody has. For one thread: the
// system's files are not for it either, so what it needs has to be made before.
class AsNobody {
 public:
  AsNobody() {
    if (is_root_ && seteuid(65534) != 0) is_root_ = false;
  }
  AsNobody(const AsNobody&) = delete;
  AsNobody& operator=(const AsNobody&) = delete;
  ~AsNobody() {
    if (is_root_ && seteuid(0) != 0) _exit(1);
  }

 private:
  bool is_root_ = geteuid() == 0;
};

}  // namespace quorelastic::testing
