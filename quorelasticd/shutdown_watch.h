#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>

namespace quorelasticd {

// Ends the process, with status 1 and without further ado, when its orderly end takes too long: a search within the
// index library cannot be interrupted. What is committed is safe from that.
class ShutdownWatch {
 public:
  explicit ShutdownWatch(std::chrono::seconds limit) : limit_(limit) {}
  ShutdownWatch(const ShutdownWatch&) = delete;
  ShutdownWatch& operator=(const ShutdownWatch&) = delete;
  ~ShutdownWatch() { Stop(); }

  // The time begins. To be called once; does not throw.
  void Start() noexcept;

  // What may take long has ended.
  void Stop();

 private:
  void Wait();

  std::chrono::seconds limit_;
  std::mutex mutex_;
  std::condition_variable stopped_;
  bool is_stopped_ = false;
  std::thread thread_;
};

}  // namespace quorelasticd
