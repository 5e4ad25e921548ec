// Failures of selected platform calls, and invariants after them.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// Whether one call fails or, as after the crash of a service, all calls from that one on.
enum class Extent { once, fromThenOn };

/// Fails the `number`-th call, starting at 1. Copies share their count. Thread-safe.
class Fault {
 public:
  Fault(std::size_t number, Extent extent);

  /// Hook for a journal.
  [[nodiscard]] CallJournal::Hook hook() const;
  [[nodiscard]] bool hasHappened() const;
  /// Returns the failed call, "fileSystem.moveItem /a /b".
  [[nodiscard]] std::string call() const;

 private:
  struct State {
    std::mutex mutex;
    std::size_t calls = 0;
    std::string failed;
  };

  std::size_t number_;
  Extent extent_;
  std::shared_ptr<State> state_ = std::make_shared<State>();
};

/// Fails the test if a client has left something open, held, scheduled or incomplete.
void expectNothingPending(FakePlatform& platform);

/// Calls `run` on another thread. If it hangs, ends the program with a message that contains `number`.
void runWithTimeout(std::size_t number, const std::function<void()>& run);

}  // namespace appsync::test
