// Failures of chosen platform calls, and what must hold after them.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// Whether one call fails or, as when a service has died, every call from that one on.
enum class Extent { once, fromThenOn };

/// Fails the `number`-th call of those that it hears of, the first being 1. Copies share their count. Threads: any.
class Fault {
 public:
  Fault(std::size_t number, Extent extent);

  /// For a device's journal.
  [[nodiscard]] CallJournal::Hook hook() const;
  [[nodiscard]] bool hasHappened() const;
  /// The call that failed, "fileSystem.moveItem /a /b".
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

/// Fails the test when a client has left something open, held, scheduled or half written.
void expectInOrder(FakePlatform& platform);

/// Runs it on another thread, so that a hang ends the program with a word instead of waiting for ever.
void runWithinPatience(std::size_t number, const std::function<void()>& run);

}  // namespace appsync::test
