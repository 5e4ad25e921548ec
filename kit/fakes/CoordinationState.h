// State of a fake install-coordination service, and its automatic actions.
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FailurePlan.h"
#include "kit/fakes/FakeAppRegistry.h"
#include "kit/fakes/FakeCallbackThread.h"
#include "kit/fakes/FakeCoordinator.h"
#include "kit/fakes/FakeFileSystem.h"
#include "kit/fakes/Gate.h"

namespace appsync::test {

/// The thread on which callbacks run.
enum class CallbackOn { ownThread, callingThread };

/// Operation for `CoordinationState::failures`: showing an app's placeholder.
inline constexpr std::string_view kShowingPlaceholder = "showingPlaceholder";

/// Returns an error of the service's domain.
[[nodiscard]] Error coordinationError(std::string text);

/// Shared by the service and every object that it returned. Thread-safe.
class CoordinationState : public std::enable_shared_from_this<CoordinationState> {
 public:
  using Coordinator = std::shared_ptr<FakeCoordinator>;
  using Report = std::function<void(platform::InstallObserverDelegate&, platform::InstallCoordinator&)>;
  /// Runs with the lock held. An error means that it changed nothing.
  using Change = std::function<Status()>;
  struct Connection {
    std::string serviceName;
    std::set<platform::ClientIdentity> clients;
    platform::InstallObserverDelegate* delegate = nullptr;
    bool isOpen = true;
    FakeCallbackThread::Subscription subscription = 0;
  };

  CoordinationState(CallJournal& journal, FakeFileSystem& files, FakeAppRegistry& registry)
      : journal_(journal), files_(files), registry_(registry) {}

  /// Records a call on `subject`. Returns the error with which it must fail, or nullopt.
  [[nodiscard]] std::optional<Error> begin(std::string_view operation, std::string_view subject,
                                           std::string_view arguments = {});

  /// Runs `change` and the automatic actions that result from it. Callbacks run on `where`.
  [[nodiscard]] Status change(const Change& change, CallbackOn where = CallbackOn::ownThread);
  /// Runs a change that cannot fail.
  template <class Update>
  void update(const Update& update, CallbackOn where = CallbackOn::ownThread) {
    const Change wrapped = [&] {
      update();
      return Status();
    };
    change(wrapped, where).ignore();
  }
  template <class Read>
  [[nodiscard]] auto read(const Read& read) const {
    const std::scoped_lock lock(mutex_);
    return read();
  }

  // Only within a change.
  [[nodiscard]] Coordinator find(platform::CoordinatorKind kind, std::string_view identifier,
                                 platform::ClientIdentity client) const;
  void end(const Coordinator& coordinator, std::optional<Error> error);
  Status cancel(const Coordinator& coordinator, FakeCancellation cancellation);
  void showPlaceholder(const Coordinator& coordinator, std::optional<Error> error);
  void notify(const Coordinator& coordinator, const Report& report);

  /// Runs `work` on the service's thread.
  void post(std::function<void()> work);

  // Read only within `read`, changed only within a change.
  std::vector<Coordinator> living;
  std::vector<FakeCoordinator> ended;
  std::vector<std::shared_ptr<FakePlaceholder>> placeholders;
  std::vector<std::shared_ptr<FakePromise>> promises;
  std::vector<Connection> connections;
  bool isEnabled = false;
  bool isAutomatic = false;
  CallbackOn uninstallCompletion = CallbackOn::ownThread;

  // Thread-safe.
  FailurePlan<std::string> failures;
  Gate gate;
  /// Number of objects that the service returned and clients still hold.
  std::atomic<std::size_t> held = 0;

  [[nodiscard]] CallJournal& journal() { return journal_; }
  [[nodiscard]] FakeAppRegistry& registry() { return registry_; }
  [[nodiscard]] FakeCallbackThread& thread() { return thread_; }

 private:
  struct Delivery {
    FakeCallbackThread::Subscription subscription;
    std::function<void()> call;
  };

  void advance();
  [[nodiscard]] bool isFulfilled(const FakeCoordinator& coordinator) const;
  void install(const Coordinator& coordinator);
  [[nodiscard]] Status installPackage(const FakeCoordinator& coordinator);
  void removePackage(const FakeCoordinator& coordinator);

  CallJournal& journal_;
  FakeFileSystem& files_;
  FakeAppRegistry& registry_;
  mutable std::mutex mutex_;
  /// Callbacks of the running change.
  std::vector<Delivery> deliveries_;
  FakeCallbackThread thread_;
  const FakeCallbackThread::Subscription own_ = thread_.subscribe();
};

}  // namespace appsync::test
