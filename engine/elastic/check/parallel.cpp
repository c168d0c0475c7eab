#include "elastic/check/parallel.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <mutex>
#include <new>
#include <system_error>
#include <thread>

namespace vantrel::elastic::check {

void RunParallel(const std::vector<std::function<void()>>& tasks, unsigned threads) {
  std::atomic<size_t> next = 0;
  std::mutex failing;
  std::exception_ptr failure;
  const auto work = [&] {
    for (size_t number = next++; number < tasks.size(); number = next++) {
      try {
        tasks[number]();
      } catch (...) {
        const std::lock_guard lock(failing);
        if (failure == nullptr) failure = std::current_exception();
        next = tasks.size();
      }
    }
  };
  std::vector<std::jthread> started;
  const size_t wanted = std::min<size_t>(threads, tasks.size());
  // One thread suffices.
  try {
    started.reserve(wanted);
    while (started.size() + 1 < wanted) started.emplace_back(work);
  } catch (const std::system_error&) {
  } catch (const std::bad_alloc&) {
  }
  work();
  started.clear();  // joins
  if (failure != nullptr) std::rethrow_exception(failure);
}

}  // namespace vantrel::elastic::check
