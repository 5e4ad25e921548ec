// A set of bundle identifiers that several threads share.
#pragma once

#include <cstddef>
#include <functional>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <utility>

namespace appsync {

using Identifiers = std::set<std::string, std::less<>>;

/// For sets that reports from different threads change and that no queue guards: each operation is whole in itself.
class SharedIdentifierSet {
 public:
  void insert(std::string_view identifier) {
    const std::lock_guard lock(mutex_);
    if (!identifiers_.contains(identifier)) identifiers_.emplace(identifier);
  }

  void erase(std::string_view identifier) {
    const std::lock_guard lock(mutex_);
    const auto found = identifiers_.find(identifier);
    if (found != identifiers_.end()) identifiers_.erase(found);
  }

  void clear() {
    const std::lock_guard lock(mutex_);
    identifiers_.clear();
  }

  [[nodiscard]] std::size_t size() const {
    const std::lock_guard lock(mutex_);
    return identifiers_.size();
  }

  /// A copy of what is in it now.
  [[nodiscard]] Identifiers identifiers() const {
    const std::lock_guard lock(mutex_);
    return identifiers_;
  }

 private:
  mutable std::mutex mutex_;
  Identifiers identifiers_;
};

}  // namespace appsync
