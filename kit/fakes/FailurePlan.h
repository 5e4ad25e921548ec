// Planned failures of a fake's calls.
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

/// Matches every path or identifier.
inline constexpr std::string_view kAnything = "*";

/// Failures by operation and subject (a path, a bundle identifier). Thread-safe.
template <class Operation>
class FailurePlan {
 public:
  /// Makes the next call fail. Several failures apply to consecutive calls.
  void failNext(Operation operation, std::string_view subject, Error error) {
    const std::scoped_lock lock(mutex_);
    plans_[{operation, std::string(subject)}].once.push_back(std::move(error));
  }

  /// Makes every call fail for which no `failNext` is pending.
  void failAlways(Operation operation, std::string_view subject, Error error) {
    const std::scoped_lock lock(mutex_);
    plans_[{operation, std::string(subject)}].always = std::move(error);
  }

  void stopFailing() {
    const std::scoped_lock lock(mutex_);
    plans_.clear();
  }

  /// For fakes: returns the failure of this call, or nullopt.
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
