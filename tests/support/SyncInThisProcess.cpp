#include "tests/support/SyncInThisProcess.h"

#include <algorithm>
#include <chrono>

#include <gtest/gtest.h>

#include "daemon/ClientModule.h"
#include "daemon/Daemon.h"
#include "device/storage/FaultPoint.h"

namespace appsync::test {

namespace {

std::atomic<StepHold*> currentHold = nullptr;

}  // namespace

StepHold::StepHold(std::string_view step, std::size_t time) : step_(step), due_(time) {
  gate_.close();
  currentHold = this;
  device::setFaultHook(passStep);
}

StepHold::~StepHold() {
  letGo();
  device::setFaultHook(nullptr);
  currentHold = nullptr;
}

int StepHold::passStep(const char* name) {
  StepHold* hold = currentHold;
  if (hold != nullptr && hold->step_ == name && ++hold->times_ == hold->due_) hold->gate_.pass();
  return 0;
}

void RecordingReporter::progressed(const host::AppProgress& progress) {
  wentBack |= progress.overall < overall;
  overall = progress.overall;
  const std::string& identifier = progress.name.identifier;
  if (std::ranges::find(sent, identifier) == sent.end()) sent.push_back(identifier);
}

void RecordingReporter::finished(const host::AppOutcome& outcome) {
  std::string line(wordFor(outcome.event));
  line += " " + outcome.name.identifier;
  if (!outcome.reason.empty()) line += ": " + outcome.reason;
  ended.push_back(line);
}

SyncInThisProcess::SyncInThisProcess(const std::string& devicePath, const std::string& libraryPath) {
  auto device = device::Device::open(devicePath, device::Access::exclusive);
  if (!device) throw std::runtime_error(device.error().text);
  device_ = std::move(device).value();
  thread_ = std::thread([this, libraryPath] {
    const auto library = host::readLibrary(libraryPath);
    ASSERT_TRUE(library.ok());
    const host::InterruptSignals interruption;
    host::SyncProgress progress(reporter_);
    const auto client = daemon::makeClient(device_->platform());
    ASSERT_TRUE(client.ok()) << client.error().text;
    EXPECT_TRUE(daemon::Daemon(*device_, **client, progress, interruption).sync({*library, {}, {}}).ok());
  });
}

SyncInThisProcess::~SyncInThisProcess() {
  finish();
}

void SyncInThisProcess::waitUntilTold() {
  ASSERT_TRUE(services().installCoordination().waitUntilIdle(std::chrono::minutes(1)));
}

const RecordingReporter& SyncInThisProcess::finish() {
  // A sync that is held would never come to its end.
  if (StepHold* hold = currentHold) hold->letGo();
  if (thread_.joinable()) thread_.join();
  device_.reset();
  return reporter_;
}

}  // namespace appsync::test
