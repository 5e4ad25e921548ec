// Which calls of a fake are to fail.
#pragma once

#include <deque>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "base/Error.h"

namespace appsync::test {

/// Stands for every path or identifier.
inline constexpr std::string_view kAnything = "*";

/// Failures by operation and by what the operation is about (a path, a bundle identifier). Threads: any.
template <class Operation>
class FailurePlan {
 public:
  /// The next call fails once; several wait their turn.
  void failNext(Operation operation, std::string_view subject, Error error) {
    const std::scoped_lock lock(mutex_);
    plans_[{operation, std::string(subject)}].once.push_back(std::move(error));
  }

  /// Every call fails that no `failNext` has a say in.
  void failAlways(Operation operation, std::string_view subject, Error error) {
    const std::scoped_lock lock(mutex_);
    plans_[{operation, std::string(subject)}].always = std::move(error);
  }

  void stopFailing() {
    const std::scoped_lock lock(mutex_);
    plans_.clear();
  }

  /// For fakes: how this call is to fail, if it is.
  [[nodiscard]] std::optional<Error> take(Operation operation, std::string_view subject) {
    const std::scoped_lock lock(mutex_);
    if (std::optional<Error> error = takeExactly(operation, subject)) return error;
    return takeExactly(operation, kAnything);
  }

 private:
  struct Plan {
    std::deque<Error> once;
    std::optional<Error> always;
  };

  std::optional<Error> takeExactly(Operation operation, std::string_view subject) {
    const auto found = plans_.find({operation, std::string(subject)});
    if (found == plans_.end()) return std::nullopt;
    Plan& plan = found->second;
    if (plan.once.empty()) return plan.always;
    Error error = std::move(plan.once.front());
    plan.once.pop_front();
    return error;
  }

  std::mutex mutex_;
  std::map<std::pair<Operation, std::string>, Plan> plans_;
};

}  // namespace appsync::test
