#pragma once

#include <sys/types.h>
#include <unistd.h>

#include <cstdlib>
#include <stdexcept>

namespace quorelastic::testing {

// Acts as a user without rights while it lives, where the test is run by one who has them all.
class WithoutRights {
 public:
  WithoutRights() {
    if (before_ == 0 && seteuid(kNobody) != 0) throw std::runtime_error("cannot become another user");
  }
  WithoutRights(const WithoutRights&) = delete;
  WithoutRights& operator=(const WithoutRights&) = delete;
  ~WithoutRights() {
    if (seteuid(before_) != 0) std::abort();
  }

 private:
  static constexpr uid_t kNobody = 65534;
  uid_t before_ = geteuid();
};

}  // namespace quorelastic::testing
