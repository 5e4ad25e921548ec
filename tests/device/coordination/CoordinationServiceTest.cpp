// Rejected operations of the install-coordination service, its operations for tools, and both modes of a device.
#include <filesystem>
#include <optional>

#include <gmock/gmock.h>

#include "base/Semaphore.h"
#include "device/packages/InstallerError.h"
#include "tests/device/coordination/ServiceFixture.h"

namespace appsync::test {
namespace {

using device::CoordinationFailure;
using device::CoordinatorPhase;
using platform::IfMissing;
using platform::TSInstallType;
using testing::ElementsAre;
using testing::IsEmpty;

class CoordinationService : public CoordinationTest {
 protected:
  Error refusal(std::string_view identifier) {
    std::optional<Error> error;
    EXPECT_EQ(service().coordinatorForApp(Kind::initiating, identifier, kSync, IfMissing::create, nullptr, &error),
              nullptr);
    return error.value_or(Error{});
  }
  /// Removes an app and returns the error of the completion.
  std::optional<Error> uninstall(const std::string& identifier) {
    std::optional<Error> told;
    int times = 0;
    service().uninstallApp(identifier, platform::UserConfirmation::skip, [&](const std::optional<Error>& error) {
      told = error;
      ++times;
    });
    client_.settle();
    EXPECT_EQ(times, 1);
    return told;
  }
  [[nodiscard]] bool isUninstalled(std::string_view identifier) {
    return device_.services().uninstalledApps().lookupUninstalled()->contains(identifier);
  }
};

}  // namespace

// Rejected operations.

TEST_F(CoordinationService, RejectsInvalidBundleIdentifiers) {
  EXPECT_EQ(refusal("com/a").text,
            "\"com/a\" is not a bundle identifier: it may have only letters, digits, '-', '.' and '_', at most 200 and "
            "no dot first");
  for (const std::string& identifier : {std::string(), std::string("../a"), std::string(".a"), std::string("a b"),
                                        std::string("a\0b", 3), std::string("\xC3\xA4"), std::string(65536, 'a')}) {
    const Error error = refusal(identifier);
    EXPECT_EQ(error.domain, platform::kInstallCoordinationErrorDomain);
    EXPECT_EQ(error.code, static_cast<long>(CoordinationFailure::badIdentifier));
    EXPECT_LT(error.text.size(), 300U);
    EXPECT_EQ(service().initAppPlaceholder("N", identifier, TSInstallType::Sync, kSync), nullptr);
  }
  EXPECT_THAT(*service().list(), IsEmpty());
}

TEST_F(CoordinationService, OnlyCreatorChangesCoordinator) {
  CoordinationClient store(device_, kStore);
  const auto own = client_.make("com.a");
  const auto foreign = store.make("com.a");
  EXPECT_EQ(foreign->creatorIdentifier(), kSync);
  EXPECT_EQ(failureOf(foreign->setInstallOptions(CoordinationClient::options())), CoordinationFailure::foreignClient);
  EXPECT_EQ(failureOf(foreign->setInitialODRAssetPromises({})), CoordinationFailure::foreignClient);
  EXPECT_EQ(failureOf(foreign->setAppAssetPromise(store.promise("p"))), CoordinationFailure::foreignClient);
  EXPECT_EQ(failureOf(foreign->setPlaceholderPromise(store.placeholder("com.a"))), CoordinationFailure::foreignClient);
  EXPECT_FALSE(own->hasInstallOptions());
}

TEST_F(CoordinationService, ResponsibleClientSetsAppAsset) {
  CoordinationClient store(device_, kStore);
  const auto own = client_.make("com.a", Kind::restoring);
  ASSERT_TRUE(own->setAppAssetPromiseResponsibleClient(kStore).ok());
  EXPECT_EQ(own->appAssetPromiseResponsibleClient(nullptr), kStore);
  EXPECT_EQ(failureOf(own->setAppAssetPromise(client_.promise("p"))), CoordinationFailure::foreignClient);
  ASSERT_TRUE(own->setPlaceholderPromise(client_.placeholder("com.a")).ok());
  const auto foreign = store.find("com.a");
  ASSERT_TRUE(foreign->setAppAssetPromise(store.promise("p")).ok());
  CoordinationClient::deliver(foreign, stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(CoordinationService, RejectsPromisesOfOtherDevice) {
  TestDevice other(device::InstallMode::coordinated);
  CoordinationClient elsewhere(other);
  const auto coordinator = client_.make("com.a");
  EXPECT_EQ(failureOf(coordinator->setAppAssetPromise(elsewhere.promise("p"))), CoordinationFailure::notUsable);
  EXPECT_EQ(failureOf(coordinator->setPlaceholderPromise(elsewhere.placeholder("com.a"))),
            CoordinationFailure::notUsable);
}

TEST_F(CoordinationService, UserPresentableErrorHasTextOfUnderlyingError) {
  const Error error = service().createUserPresentableError(1, {}, kEnough);
  EXPECT_EQ(error, (Error{std::string(platform::kInstallCoordinationErrorDomain), 1, kEnough.text, nullptr}));
  ASSERT_NE(error.underlying, nullptr);
  EXPECT_EQ(*error.underlying, kEnough);
}

TEST_F(CoordinationService, HandlesChangeNothingAfterEnd) {
  const auto connection = listen(delegate_);
  const auto coordinator = client_.prepare("com.a");
  const auto promise = coordinator->appAssetPromise();
  const auto placeholder = service().initAppPlaceholder("N", "com.b", TSInstallType::Sync, kSync);
  device_.close();
  promise->setTransferPath({"/x"});
  promise->setPercentComplete(0.5);
  promise->setComplete(true);
  EXPECT_FALSE(promise->isComplete());
  EXPECT_EQ(failureOf(promise->cancelForReason(kEnough, kSync)), CoordinationFailure::closed);
  EXPECT_EQ(failureOf(coordinator->setUserDataPromise(nullptr)), CoordinationFailure::closed);
  EXPECT_EQ(failureOf(coordinator->cancelForReason(kEnough, kSync)), CoordinationFailure::closed);
  EXPECT_EQ(failureOf(placeholder->setConfigurationComplete()), CoordinationFailure::closed);
  EXPECT_TRUE(coordinator->hasPlaceholderPromise());
}

TEST_F(CoordinationService, HandlesHaveDescriptions) {
  const auto coordinator = client_.prepare("com.a", Kind::restoringDemoted);
  EXPECT_EQ(coordinator->description(), "<restoring demoted coordinator com.a of client 3>");
  const auto promise = coordinator->appAssetPromise();
  promise->setPercentComplete(0.5);
  EXPECT_EQ(promise->description(), "<promise com.a-Asset 0.5>");
  promise->setTransferPath({"/x.zip"});
  ASSERT_TRUE(promise->cancelForReason(kEnough, kSync).ok());
  EXPECT_EQ(promise->description(), "<promise com.a-Asset 0.5 at /x.zip cancelled>");
  EXPECT_EQ(client_.placeholder("com.a")->description(), "<placeholder com.a>");
}

// Removals.

TEST_F(CoordinationService, UninstallCancelsCoordinators) {
  const auto connection = listen(delegate_);
  device_.install("com.a");
  const auto coordinator = client_.prepare("com.a", Kind::updating);
  client_.settle();
  EXPECT_EQ(uninstall("com.a"), std::nullopt);
  EXPECT_EQ(state("com.a"), "none");
  EXPECT_TRUE(isUninstalled("com.a"));
  EXPECT_EQ(coordinator->coordinatorError()->text, "the app is being removed");
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "cancelled com.a by 2: the app is being removed"));
}

TEST_F(CoordinationService, UninstallRemovesPlaceholder) {
  static_cast<void>(client_.prepare("com.a"));
  EXPECT_EQ(uninstall("com.a"), std::nullopt);
  EXPECT_EQ(state("com.a"), "none");
  EXPECT_FALSE(isUninstalled("com.a"));
}

TEST_F(CoordinationService, UninstallRejectsUnknownApp) {
  EXPECT_EQ(uninstall("com.a"),
            device::installerError(device::InstallerFailure::unknownApp, "there is no app \"com.a\" to remove"));
}

TEST_F(CoordinationService, UninstallWaitsForRunningInstall) {
  CoordinationClient::deliver(client_.prepare("com.a"), stage("com.a"));
  EXPECT_EQ(uninstall("com.a"), std::nullopt);
  EXPECT_EQ(state("com.a"), "none");
  EXPECT_EQ(device_.containers(), 0);
}

TEST_F(CoordinationService, CompletesEveryUninstallBeforeEnd) {
  constexpr int kRemovals = 20;
  int answers = 0;
  for (int number = 0; number < kRemovals; ++number) {
    device_.install("com.a" + std::to_string(number));
    service().uninstallApp("com.a" + std::to_string(number), platform::UserConfirmation::skip,
                           [&answers](const std::optional<Error>& error) {
                             EXPECT_EQ(error, std::nullopt);
                             ++answers;
                           });
  }
  device_.close();
  EXPECT_EQ(answers, kRemovals);
}

// Operations for tools.

TEST_F(CoordinationService, PrioritizesTappedApp) {
  const auto connection = listen(delegate_);
  static_cast<void>(client_.prepare("com.a"));
  static_cast<void>(client_.prepare("com.b"));
  EXPECT_TRUE(service().prioritize("com.b"));
  EXPECT_FALSE(service().prioritize("com.c"));
  client_.settle();
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "placeholder com.b", "prioritize com.b"));
  const device::InstallOrder order = device_.registry().runningInstalls().order();
  ASSERT_EQ(order.prioritized.size(), 2U);
  EXPECT_EQ(order.prioritized.front()->applicationIdentifier(), "com.b");
}

TEST_F(CoordinationService, UserCancelsAllCoordinatorsOfApp) {
  const auto connection = listen(delegate_);
  device_.install("com.a");
  const auto first = client_.prepare("com.a");
  const auto second = CoordinationClient(device_, kStore).make("com.a", Kind::updating);
  client_.settle();
  EXPECT_TRUE(service().cancelByUser("com.a").ok());
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_FALSE(isUninstalled("com.a"));
  EXPECT_TRUE(second->coordinatorError().has_value());
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "cancelled com.a by 2: cancelled on the device"));
  const Status again = service().cancelByUser("com.a");
  EXPECT_EQ(failureOf(again), CoordinationFailure::noCoordinator);
  EXPECT_EQ(again.error().text, "\"com.a\" is not being installed");
}

TEST_F(CoordinationService, ListsCoordinatorsWithTheirPhase) {
  static_cast<void>(CoordinationClient(device_, kStore).make("com.z", Kind::restoring));
  const auto loading = client_.prepare("com.b");
  loading->appAssetPromise()->setPercentComplete(0.25);
  const auto waiting = client_.prepare("com.a");
  ASSERT_TRUE(waiting->setUserDataPromise(service().makePromisedOutOfBandTransfer("d", kSync, 0)).ok());
  CoordinationClient::deliver(waiting, stage("com.a"));
  const auto list = service().list();
  ASSERT_TRUE(list.ok());
  ASSERT_EQ(list->size(), 3U);
  EXPECT_EQ((*list)[0].identifier, "com.z");
  EXPECT_EQ((*list)[0].name, "com.z");
  EXPECT_EQ((*list)[0].kind, Kind::restoring);
  EXPECT_EQ((*list)[0].creator, kStore);
  EXPECT_EQ((*list)[0].phase, CoordinatorPhase::preparing);
  EXPECT_EQ((*list)[1].name, "Notes");
  EXPECT_EQ((*list)[1].phase, CoordinatorPhase::loading);
  EXPECT_EQ((*list)[1].fraction, 0.25);
  EXPECT_EQ((*list)[2].phase, CoordinatorPhase::waiting);
}

TEST_F(CoordinationService, ReadersListCoordinators) {
  static_cast<void>(client_.prepare("com.a"));
  const auto reader = device::Device::open(device_.path(), device::Access::readOnly);
  ASSERT_TRUE(reader.ok());
  auto& service = (*reader)->services().installCoordination();
  EXPECT_TRUE(service.coordinationIsEnabled());
  const auto list = service.list();
  ASSERT_TRUE(list.ok());
  ASSERT_EQ(list->size(), 1U);
  EXPECT_EQ(list->front().phase, CoordinatorPhase::loading);
  std::optional<Error> error;
  EXPECT_EQ(service.coordinatorForApp(Kind::initiating, "com.b", kSync, IfMissing::create, nullptr, &error), nullptr);
  EXPECT_TRUE(error.has_value());
}

// Observers.

TEST_F(CoordinationService, NotifiesDelegateOnce) {
  const auto first = listen(delegate_);
  const auto second = listen(delegate_);
  const std::shared_ptr<RecordingDelegate> own(&delegate_, [](RecordingDelegate*) {});
  const auto coordinator = client_.make("com.a");
  coordinator->setObserver(own);
  ASSERT_TRUE(coordinator->setPlaceholderPromise(client_.placeholder("com.a")).ok());
  client_.settle();
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a"));
}

TEST_F(CoordinationService, ReleasesDelegateAfterCallback) {
  struct Last final : platform::InstallObserverDelegate {
    explicit Last(Semaphore& gone) : gone_(gone) {}
    ~Last() override { gone_.signal(); }
    void coordinatorShouldPrioritize(platform::InstallCoordinator&) override { self = nullptr; }
    std::shared_ptr<Last> self;
    std::unique_ptr<platform::InstallObserver> connection;
    Semaphore& gone_;
  };
  Semaphore gone(device_.services().clock(), 0);
  auto last = std::make_shared<Last>(gone);
  last->self = last;
  last->connection = listen(*last);
  const auto coordinator = client_.make("com.a");
  coordinator->setObserver(last);
  last.reset();
  service().prioritize("com.a");
  EXPECT_TRUE(gone.wait());
}

// Modes.

TEST_F(CoordinationService, SettingTakesEffectAtOpening) {
  EXPECT_TRUE(service().coordinationIsEnabled());
  ASSERT_TRUE(device_.services().settings().assign("coordination=off").ok());
  EXPECT_TRUE(service().coordinationIsEnabled());
  device_.reopen();
  EXPECT_FALSE(service().coordinationIsEnabled());
}

TEST_F(CoordinationService, ReturnsNothingWhileOff) {
  TestDevice direct;
  CoordinationClient client(direct);
  EXPECT_FALSE(client.service().coordinationIsEnabled());
  std::optional<Error> error;
  EXPECT_EQ(client.service().coordinatorForApp(Kind::any, "com.a", kSync, IfMissing::findNothing, nullptr, &error),
            nullptr);
  EXPECT_EQ(error->text, "install coordination is off");
  EXPECT_EQ(client.promise("p"), nullptr);
  EXPECT_EQ(client.service().makePromisedOutOfBandTransfer("p", kSync, 0), nullptr);
  EXPECT_EQ(client.service().initAppPlaceholder("N", "com.a", TSInstallType::Sync, kSync), nullptr);
  EXPECT_FALSE(client.service().prioritize("com.a"));
  EXPECT_NE(client.service().initWithMachServiceName("name", {kSync}, delegate_), nullptr);
}

TEST_F(CoordinationService, UninstallsAppsWhileOff) {
  TestDevice direct;
  direct.install("com.a");
  CoordinationClient client(direct);
  client.service().uninstallApp("com.a", platform::UserConfirmation::skip,
                                [](const auto& error) { EXPECT_EQ(error, std::nullopt); });
  client.settle();
  EXPECT_EQ(direct.record("com.a"), nullptr);
}

TEST_F(CoordinationService, ConnectionsMayOutliveService) {
  auto connection = listen(delegate_);
  device_.close();
  connection.reset();
}

}  // namespace appsync::test
