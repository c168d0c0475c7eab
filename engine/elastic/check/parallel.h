#pragma once

#include <functional>
#include <vector>

namespace vantrel::elastic::check {

// Runs the tasks, each once, in order of the list as threads become free; the calling thread is one of `threads`.
// Where the system gives fewer threads, fewer are used. The first exception that leaves a task keeps those that have
// not begun from running, and is thrown when the others have ended.
void RunParallel(const std::vector<std::function<void()>>& tasks, unsigned threads);

}  // namespace vantrel::elastic::check
