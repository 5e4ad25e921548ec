#include "kit/fakes/FakeInstallCoordination.h"

#include <algorithm>
#include <utility>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeInstallCoordinator.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::IfMissing;

namespace {

std::shared_ptr<FakePromise> makePromise(FakePromiseKind kind, std::string_view name, ClientIdentity client,
                                         std::uint64_t diskSpaceNeeded) {
  auto promise = std::make_shared<FakePromise>();
  promise->kind = kind;
  promise->name = name;
  promise->client = client;
  promise->diskSpaceNeeded = diskSpaceNeeded;
  return promise;
}

}  // namespace

class FakeInstallCoordination::Observer final : public platform::InstallObserver {
 public:
  Observer(std::shared_ptr<CoordinationState> state, std::size_t index) : state_(std::move(state)), index_(index) {}
  ~Observer() override {
    Connection connection;
    state_->update([&] {
      state_->connections[index_].isOpen = false;
      connection = state_->connections[index_];
    });
    state_->thread().unsubscribe(connection.subscription);
    state_->journal().note("installCoordination.close " + connection.serviceName);
  }
  Observer(const Observer&) = delete;
  Observer& operator=(const Observer&) = delete;

 private:
  const std::shared_ptr<CoordinationState> state_;
  const std::size_t index_;
};

FakeInstallCoordination::FakeInstallCoordination(CallJournal& journal, FakeFileSystem& files, FakeAppRegistry& registry)
    : FakeInstallCoordination(std::make_shared<CoordinationState>(journal, files, registry)) {}

FakeInstallCoordination::FakeInstallCoordination(std::shared_ptr<CoordinationState> state)
    : failures(state->failures), gate(state->gate), state_(std::move(state)) {}

FakeInstallCoordination::~FakeInstallCoordination() {
  gate.open();
  waitUntilIdle();
  if (std::ranges::any_of(connections(), &Connection::isOpen)) {
    misuse("install coordination is destroyed while a connection is open");
  }
  if (state_->held != 0) misuse("install coordination is destroyed while an object of it is held");
}

bool FakeInstallCoordination::coordinationIsEnabled() {
  if (state_->begin("installCoordination.coordinationIsEnabled", {})) return false;
  return state_->read([this] { return state_->isEnabled; });
}

std::shared_ptr<platform::InstallCoordinator> FakeInstallCoordination::coordinatorForApp(
    CoordinatorKind kind, std::string_view bundleIdentifier, ClientIdentity client, IfMissing ifMissing, bool* created,
    ErrorSlot error) {
  const bool mayCreate = ifMissing == IfMissing::create;
  const std::string call = "installCoordination.coordinatorForApp";
  std::string arguments(nameOf(kind));
  arguments.append(" ").append(bundleIdentifier).append(mayCreate ? " create" : " find");
  std::optional<Error> failure = state_->journal().beforeCall(call, arguments);
  if (!failure) failure = failures.take(call, bundleIdentifier);
  if (failure) {
    setError(error, *std::move(failure));
    return nullptr;
  }
  CoordinationState::Coordinator found;
  bool isNew = false;
  state_->update([&] {
    found = state_->find(kind, bundleIdentifier, client);
    isNew = !found && mayCreate && kind != CoordinatorKind::any;
    if (!isNew) return;
    found = std::make_shared<FakeCoordinator>(FakeCoordinator::of(std::string(bundleIdentifier), kind).madeBy(client));
    state_->living.push_back(found);
  });
  if (!found) return nullptr;
  if (created != nullptr) *created = isNew;
  return std::make_shared<FakeInstallCoordinator>(state_, std::move(found), client);
}

std::shared_ptr<platform::Placeholder> FakeInstallCoordination::initAppPlaceholder(std::string_view bundleName,
                                                                                   std::string_view bundleIdentifier,
                                                                                   platform::TSInstallType installType,
                                                                                   ClientIdentity client) {
  std::string arguments = std::to_string(static_cast<std::uint64_t>(installType));
  arguments.append(" ").append(bundleName);
  if (state_->begin("installCoordination.initAppPlaceholder", bundleIdentifier, arguments)) return nullptr;
  auto placeholder = std::make_shared<FakePlaceholder>();
  placeholder->bundleName = bundleName;
  placeholder->identifier = bundleIdentifier;
  placeholder->installType = installType;
  placeholder->client = client;
  state_->update([&] { state_->placeholders.push_back(placeholder); });
  return std::make_shared<FakeAppPlaceholder>(state_, std::move(placeholder));
}

std::shared_ptr<platform::PromisedTransferToPath> FakeInstallCoordination::makePromisedTransferToPath(
    std::string_view name, ClientIdentity client, const std::optional<platform::FileLocation>& transferPath,
    std::uint64_t diskSpaceNeeded) {
  std::string arguments = std::to_string(diskSpaceNeeded);
  if (transferPath) arguments += " " + transferPath->path;
  if (state_->begin("installCoordination.makePromisedTransferToPath", name, arguments)) return nullptr;
  const auto promise = makePromise(FakePromiseKind::transferToPath, name, client, diskSpaceNeeded);
  promise->transferPath = transferPath;
  state_->update([&] { state_->promises.push_back(promise); });
  return std::make_shared<FakePromisedTransferToPath>(state_, promise);
}

std::shared_ptr<platform::PromisedOutOfBandTransfer> FakeInstallCoordination::makePromisedOutOfBandTransfer(
    std::string_view name, ClientIdentity client, std::uint64_t diskSpaceNeeded) {
  const std::string arguments = std::to_string(diskSpaceNeeded);
  if (state_->begin("installCoordination.makePromisedOutOfBandTransfer", name, arguments)) return nullptr;
  const auto promise = makePromise(FakePromiseKind::outOfBand, name, client, diskSpaceNeeded);
  state_->update([&] { state_->promises.push_back(promise); });
  return std::make_shared<FakePromisedOutOfBandTransfer>(state_, promise);
}

void FakeInstallCoordination::uninstallApp(std::string_view bundleIdentifier, platform::UserConfirmation confirmation,
                                           UninstallCompletion completion) {
  const std::string arguments = confirmation == platform::UserConfirmation::ask ? "ask" : "";
  std::optional<Error> failure = state_->begin("installCoordination.uninstallApp", bundleIdentifier, arguments);
  auto work = [this, failure = std::move(failure), identifier = std::string(bundleIdentifier),
               completion = std::move(completion)] { completion(failure ? failure : uninstall(identifier).failure()); };
  if (state_->read([this] { return state_->uninstallCompletion; }) == CallbackOn::callingThread) return work();
  state_->post(std::move(work));
}

Status FakeInstallCoordination::uninstall(const std::string& identifier) {
  const Error reason = coordinationError("the app is uninstalled");
  bool hadCoordinator = false;
  state_->update([&] {
    while (const auto coordinator = state_->find(CoordinatorKind::any, identifier, ClientIdentity::CXClientUser)) {
      if (!state_->cancel(coordinator, {reason, ClientIdentity::CXClientUser})) break;
      hadCoordinator = true;
    }
  });
  if (hadCoordinator && !state_->registry().app(identifier)) return {};
  return state_->registry().uninstall(identifier);
}

Error FakeInstallCoordination::createUserPresentableError(long code, const plist::Dictionary&,
                                                          const Error& underlying) {
  static_cast<void>(state_->begin("installCoordination.createUserPresentableError", std::to_string(code)));
  return {std::string(platform::kInstallCoordinationErrorDomain), code, underlying.text,
          std::make_shared<const Error>(underlying)};
}

std::unique_ptr<platform::InstallObserver> FakeInstallCoordination::initWithMachServiceName(
    std::string_view serviceName, const std::set<ClientIdentity>& clients,
    platform::InstallObserverDelegate& delegate) {
  static_cast<void>(state_->begin("installCoordination.initWithMachServiceName", serviceName));
  std::size_t index = 0;
  state_->update([&] {
    index = state_->connections.size();
    const auto subscription = state_->thread().subscribe();
    state_->connections.push_back({std::string(serviceName), clients, &delegate, true, subscription});
  });
  return std::make_unique<Observer>(state_, index);
}

}  // namespace appsync::test
