#pragma once

#include <sys/stat.h>

#include <string>

namespace quorelasticd {

// The socket that clients connect to: one handed over by the service manager, or one that we bind ourselves.
class Listener {
 public:
  // Takes the socket that the service manager has open for us, if there is one, else binds `path` with mode
  // 0660. A socket file that is left over there is replaced, but only when nobody answers on it. Throws
  // std::runtime_error, with the path and the reason.
  explicit Listener(const std::string& path);
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;

  // Removes the file of a socket that we bound ourselves. What Release() gave away stays open.
  ~Listener();

  // Where the socket is; empty where the service manager's has no path.
  const std::string& path() const { return path_; }

  // Gives the listening descriptor away.
  int Release();

 private:
  std::string path_;
  bool is_bound_here_ = false;  // else the service manager owns the file
  struct stat bound_file_ {};
  int sock_ = -1;
};

}  // namespace quorelasticd
