// What a fake install-coordination service keeps, and what it does of itself.
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

/// Where callbacks run.
enum class CallbackOn { ownThread, callingThread };

/// For `CoordinationState::failures`: the home screen cannot show an app's placeholder.
inline constexpr std::string_view kShowingPlaceholder = "showingPlaceholder";

/// An error of the service's own domain.
[[nodiscard]] Error coordinationError(std::string text);

/// Shared by the service and everything that it hands out. Threads: any.
class CoordinationState : public std::enable_shared_from_this<CoordinationState> {
 public:
  using Coordinator = std::shared_ptr<FakeCoordinator>;
  using Report = std::function<void(platform::InstallObserverDelegate&, platform::InstallCoordinator&)>;
  /// Made with the lock held; an error says that nothing was changed.
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

  /// Notes a call that is about `subject` and tells whether it is to fail.
  [[nodiscard]] std::optional<Error> begin(std::string_view operation, std::string_view subject,
                                           std::string_view arguments = {});

  /// Makes a change, then whatever follows from it; what is to be told is told on that thread.
  [[nodiscard]] Status change(const Change& change, CallbackOn where = CallbackOn::ownThread);
  /// A change that cannot be refused.
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

  // In changes.
  [[nodiscard]] Coordinator find(platform::CoordinatorKind kind, std::string_view identifier,
                                 platform::ClientIdentity client) const;
  void end(const Coordinator& coordinator, std::optional<Error> error);
  Status cancel(const Coordinator& coordinator, FakeCancellation cancellation);
  void showPlaceholder(const Coordinator& coordinator, std::optional<Error> error);
  void tell(const Coordinator& coordinator, const Report& report);

  /// Runs `work` on the service's thread.
  void post(std::function<void()> work);

  // Looked at in `read`, changed in changes.
  std::vector<Coordinator> living;
  std::vector<FakeCoordinator> ended;
  std::vector<std::shared_ptr<FakePlaceholder>> placeholders;
  std::vector<std::shared_ptr<FakePromise>> promises;
  std::vector<Connection> connections;
  bool isEnabled = false;
  bool isAutomatic = false;
  CallbackOn uninstallCompletion = CallbackOn::ownThread;

  // At any time.
  FailurePlan<std::string> failures;
  Gate gate;
  /// How many things that it handed out are held.
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
  /// What the change under way has to tell.
  std::vector<Delivery> deliveries_;
  FakeCallbackThread thread_;
  const FakeCallbackThread::Subscription own_ = thread_.subscribe();
};

}  // namespace appsync::test
