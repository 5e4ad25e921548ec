// Shows when a captured object goes.
#pragma once

#include <functional>
#include <utility>

namespace appsync::test {

/// Runs a function when it is destroyed, on the thread that destroys it.
class AtEnd {
 public:
  explicit AtEnd(std::function<void()> action) : action_(std::move(action)) {}
  AtEnd(const AtEnd&) = delete;
  AtEnd& operator=(const AtEnd&) = delete;
  ~AtEnd() { action_(); }

 private:
  std::function<void()> action_;
};

}  // namespace appsync::test
