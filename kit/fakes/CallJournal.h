// Records the calls of all fakes of a platform in one order.
#pragma once

#include <cstddef>
#include <functional>
#include <initializer_list>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"

namespace appsync::test {

/// For fakes: reports that the caller broke a platform contract. Fails the running test; without a running test, as in
/// a daemon on fakes, prints the failure on standard output. Thread-safe.
void misuse(std::string_view contract);

/// The calls of all fakes of a platform in one order: "registry.uninstallApplication com.a", "fileSystem.moveItem /a
/// /b". Calls that a client makes for every message (log categories, the time) are omitted. Thread-safe.
class CallJournal {
 public:
  /// Runs before each call, on the caller's thread. If it returns an error, the call fails as its contract says: with
  /// that error, false, null or nullopt. Calls that cannot fail ignore it.
  using Hook = std::function<std::optional<Error>(std::string_view operation, std::string_view arguments)>;

  /// For fakes: records a call. Returns the error with which it must fail, or nullopt.
  [[nodiscard]] std::optional<Error> beforeCall(std::string_view operation, std::string_view arguments = {});

  /// For fakes: records an event that is not a call, such as the release of an object.
  void note(std::string line);

  /// Return all lines, or those that start with one of the prefixes ("registry.", "fileSystem.moveItem").
  [[nodiscard]] std::vector<std::string> lines() const;
  [[nodiscard]] std::vector<std::string> lines(std::initializer_list<std::string_view> prefixes) const;
  [[nodiscard]] std::size_t count(std::string_view prefix) const;
  [[nodiscard]] bool contains(std::string_view line) const;

  /// Deletes the lines. Hook and number of calls are unchanged.
  void clear();

  void setHook(Hook hook);

  /// Replaces the hook by one that fails the `number`-th call from now; 1 is the next call.
  void failCall(std::size_t number, Error error);

  /// Number of calls since construction.
  [[nodiscard]] std::size_t callCount() const;

 private:
  mutable std::mutex mutex_;
  std::vector<std::string> lines_;
  std::size_t callCount_ = 0;
  Hook hook_;
};

}  // namespace appsync::test
