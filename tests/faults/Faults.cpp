#include "tests/faults/Faults.h"

#include <future>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "kit/fakes/Patience.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "platform/ZTClient.h"

namespace appsync::test {

namespace {

const Error kInjected{"POSIX", 5, "Input/output error", nullptr};

}  // namespace

Fault::Fault(std::size_t number, Extent extent) : number_(number), extent_(extent) {}

CallJournal::Hook Fault::hook() const {
  return [self = *this](std::string_view operation, std::string_view arguments) -> std::optional<Error> {
    const std::scoped_lock lock(self.state_->mutex);
    const std::size_t call = ++self.state_->calls;
    if (call == self.number_) self.state_->failed = std::string(operation) + " " + std::string(arguments);
    // No call changes the mode of the device.
    if (operation == "installCoordination.coordinationIsEnabled") return std::nullopt;
    const bool fails = self.extent_ == Extent::once ? call == self.number_ : call >= self.number_;
    return fails ? std::optional(kInjected) : std::nullopt;
  };
}

bool Fault::hasHappened() const {
  return !call().empty();
}

std::string Fault::call() const {
  const std::scoped_lock lock(state_->mutex);
  return state_->failed;
}

void expectNothingPending(FakePlatform& platform) {
  EXPECT_EQ(platform.time.pendingTasks(), 0U);
  EXPECT_TRUE(platform.screen.held().empty()) << "a termination assertion is still held";
  EXPECT_EQ(platform.registry.observerCount(), 0U);
  EXPECT_EQ(platform.notify.observerCount(platform::kZTStartupCompleteNotification), 0U);
  EXPECT_EQ(platform.backups.connections(), 0U);
  EXPECT_EQ(platform.store.connections(), 0U);
  for (const auto& connection : platform.coordination.connections())
    EXPECT_FALSE(connection.isOpen);
  for (const std::string& path : platform.files.paths()) {
    if (!path.ends_with(".plist")) continue;
    EXPECT_TRUE(propertyListAt(platform.files, path)) << path << " is half written";
  }
}

void runWithTimeout(std::size_t number, const std::function<void()>& run) {
  const auto done = std::async(std::launch::async, run);
  awaitReady(done, "call " + std::to_string(number) + " fails");
}

}  // namespace appsync::test
