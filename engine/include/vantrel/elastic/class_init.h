#pragma once

#include <memory>
#include <utility>

namespace vantrel {

// Creates a T in one shared allocation and completes it by initialize(), whose result is ignored. What either
// of the two throws passes on unchanged, and nothing is left behind.
template <typename T, typename... Arguments>
std::shared_ptr<T> newClassInit(Arguments&&... arguments) {
  auto object = std::make_shared<T>(std::forward<Arguments>(arguments)...);
  object->initialize();
  return object;
}

}  // namespace vantrel
