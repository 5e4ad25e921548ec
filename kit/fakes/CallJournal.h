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

/// What all fakes of a platform were asked, in one order: "registry.uninstallApplication com.a",
/// "fileSystem.moveItem /a /b". Only questions that a client asks for every message (log categories, the time) are left
/// out. Threads: any.
class CallJournal {
 public:
  /// Asked before a call is carried out, on the caller's thread. An error makes the call fail in whichever way its
  /// contract has: with that error, with false, with nothing. Calls that cannot fail by their contract ignore it.
  using Hook = std::function<std::optional<Error>(std::string_view operation, std::string_view arguments)>;

  /// For fakes: notes a call and tells whether it is to fail.
  [[nodiscard]] std::optional<Error> beforeCall(std::string_view operation, std::string_view arguments = {});

  /// For fakes: notes what is no call but has its place in the order, such as a release.
  void note(std::string line);

  /// All lines so far, or those that start with one of the prefixes ("registry.", "fileSystem.moveItem").
  [[nodiscard]] std::vector<std::string> lines() const;
  [[nodiscard]] std::vector<std::string> lines(std::initializer_list<std::string_view> prefixes) const;
  [[nodiscard]] std::size_t count(std::string_view prefix) const;
  [[nodiscard]] bool contains(std::string_view line) const;

  /// Forgets the lines; hook and number of calls stay.
  void clear();

  void setHook(Hook hook);

  /// Replaces the hook by one that fails the `number`-th call from now, the next one being 1.
  void failCall(std::size_t number, Error error);

  /// Calls since the journal was made.
  [[nodiscard]] std::size_t callCount() const;

 private:
  mutable std::mutex mutex_;
  std::vector<std::string> lines_;
  std::size_t callCount_ = 0;
  Hook hook_;
};

}  // namespace appsync::test
