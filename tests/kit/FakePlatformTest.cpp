#include <optional>

#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;

TEST(FakePlatform, ServicesCanBeReplaced) {
  CallJournal otherJournal;
  FakeHomeScreen other(otherJournal);
  FakePlatform platform;
  EXPECT_EQ(&platform.homeScreen(), &platform.screen);
  platform.use(other);
  EXPECT_EQ(&platform.homeScreen(), &other);
  EXPECT_EQ(&platform.defaultRegistry(), &platform.registry);
}

TEST(FakePlatform, ConnectionsCanBeReplaced) {
  CallJournal otherJournal;
  FakeBackups other(otherJournal);
  FakePlatform platform;
  platform.useBackupManagers([&] { return other.connect(); });
  const auto manager = platform.makeBackupManager();
  EXPECT_EQ(other.connections(), 1U);
  EXPECT_EQ(platform.backups.connections(), 0U);

  FakeStore otherStore(otherJournal);
  platform.useSoftwareLibraries([&] { return otherStore.connect(); });
  const auto library = platform.makeSoftwareLibrary();
  EXPECT_EQ(otherStore.connections(), 1U);
  EXPECT_EQ(platform.store.connections(), 0U);
}

TEST(FakePlatform, JournalsCallsOfAllServicesInOneOrder) {
  FakePlatform platform;
  static_cast<void>(platform.homeScreen().blockableServerPort());
  static_cast<void>(platform.fileSystem().fileExists("/a"));
  static_cast<void>(platform.bundles().mainBundleIdentifier());
  EXPECT_EQ(platform.journal.lines(),
            (Lines{"homeScreen.blockableServerPort", "fileSystem.fileExists /a", "bundles.mainBundleIdentifier"}));
}

TEST(FakePlatform, AnyCallCanFailByItsNumber) {
  FakePlatform platform;
  platform.uninstalledList.add("com.a");
  platform.journal.failCall(2, Error{});
  EXPECT_TRUE(platform.uninstalledApps().lookupUninstalled());
  EXPECT_FALSE(platform.uninstalledApps().lookupUninstalled());
  EXPECT_EQ(platform.uninstalledApps().clearUninstalled({"com.a"}), 0);
}

TEST(FakePlatform, DestroysScheduledTasksBeforeTheServices) {
  struct Client {
    explicit Client(FakePlatform& p) : platform(p) { platform.registry.addObserver(observer); }
    ~Client() { platform.registry.removeObserver(observer); }
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;
    FakePlatform& platform;
    platform::AppRegistryObserver observer;
  };
  FakePlatform platform;
  platform.scheduler().after(std::chrono::seconds(30), [client = std::make_shared<Client>(platform)] {});
}

TEST(FakePlatform, EntryBeforeInitializeWithLogFailsTheTest) {
  FakePlatform platform;
  EXPECT_NONFATAL_FAILURE(platform.transactions.logScenario("Harvo Sync", 0, true, "com.a", "text"),
                          "before the transaction log has a log");
  EXPECT_NONFATAL_FAILURE(platform.transactions.initializeWithLog(nullptr), "is given no log");
}

TEST(FakePlatform, LogHandleHasSubsystemAndCategory) {
  FakePlatform platform;
  platform.transactions.initializeWithLog(platform.systemLogs.createHandle("subsystem", "category"));
  ASSERT_NE(platform.transactions.log(), nullptr);
  EXPECT_EQ(platform.transactions.log()->subsystem, "subsystem");
  EXPECT_EQ(platform.transactions.log()->category, "category");
}

TEST(FakeStore, TestsCanCompleteARefresh) {
  FakePlatform platform;
  platform.store.completeRefreshes(RefreshCompletion::whenTold, Error{"Store", 1, "no connection", nullptr});
  const auto library = platform.makeSoftwareLibrary();
  std::optional<Error> failure;
  library->refreshReceipts([&](const std::optional<Error>& error) { failure = error; });
  EXPECT_FALSE(failure);
  platform.store.waitUntilPending(1);
  platform.store.complete();
  ASSERT_TRUE(failure);
  EXPECT_EQ(failure->text, "no connection");
}

TEST(FakeStore, DestroyingALibraryTooEarlyFailsTheTest) {
  FakePlatform platform;
  platform.store.completeRefreshes(RefreshCompletion::whenTold);
  auto library = platform.makeSoftwareLibrary();
  library->refreshReceipts([](const std::optional<Error>&) { FAIL(); });
  EXPECT_NONFATAL_FAILURE(library.reset(), "before its refresh completed");
  platform.store.complete();
}

TEST(FakeInstallCoordination, RecordsConnectionsWithTheirArguments) {
  FakePlatform platform;
  platform::InstallObserverDelegate delegate;
  auto connection =
      platform.coordination.initWithMachServiceName("name", {platform::ClientIdentity::CXClientSync}, delegate);
  ASSERT_EQ(platform.coordination.connections().size(), 1U);
  EXPECT_EQ(platform.coordination.connections()[0].serviceName, "name");
  EXPECT_EQ(platform.coordination.connections()[0].delegate, &delegate);
  EXPECT_TRUE(platform.coordination.connections()[0].isOpen);
  connection.reset();
  EXPECT_FALSE(platform.coordination.connections()[0].isOpen);
  EXPECT_FALSE(platform.coordination.coordinationIsEnabled());
  platform.coordination.enable();
  EXPECT_TRUE(platform.coordination.coordinationIsEnabled());
}

TEST(FakeSystemNotify, RecordsPostsWithTheirStates) {
  FakePlatform platform;
  const auto registration = platform.notify.registerCheck("name");
  platform.notify.setState(registration.token, 1);
  platform.notify.post("name");
  platform.notify.setState(registration.token, 0);
  platform.notify.post("name");
  EXPECT_EQ(platform.notify.posts(), (std::vector<Post>{{"name", 1}, {"name", 0}}));
}

TEST(FakeSystemNotify, RegistrationsCanFail) {
  FakePlatform platform;
  platform.notify.failRegistrationsWith(9);
  EXPECT_EQ(platform.notify.registerCheck("name").status, 9U);
  EXPECT_NONFATAL_FAILURE(platform.notify.setState(0, 1), "without a token");
}

TEST(FakeSystemNotify, DeliverCallsObserversBeforeItReturns) {
  FakePlatform platform;
  int calls = 0;
  const auto count = [](void* context, std::string_view, const void*) { ++*static_cast<int*>(context); };
  platform.notify.addObserver(&calls, count, "name", nullptr, platform::SuspensionBehavior::drop);
  EXPECT_EQ(platform.notify.observerCount("name"), 1U);
  platform.notify.deliver("name");
  EXPECT_EQ(calls, 1);
  EXPECT_EQ(platform.notify.posts(), std::vector<Post>());
  platform.notify.removeObserver(&calls, "name");
}

TEST(FakeSyncFramework, RecoverabilityCanBeSet) {
  FakePlatform platform;
  EXPECT_FALSE(platform.framework.ZTIsRecoverableError(Error{"POSIX", 4, "", nullptr}));
  platform.framework.judgeErrorsBy([](const Error& error) { return error.domain == "POSIX"; });
  EXPECT_TRUE(platform.framework.ZTIsRecoverableError(Error{"POSIX", 4, "", nullptr}));
  EXPECT_FALSE(platform.framework.ZTIsRecoverableError(Error{"Other", 4, "", nullptr}));
}

TEST(FakeSyncFramework, ReclassifiedAssetReturnsValuesInOrder) {
  const ReclassifiedAsset asset("com.a", {true, false});
  EXPECT_TRUE(asset.isRestore());
  EXPECT_FALSE(asset.isRestore());
  EXPECT_FALSE(asset.isRestore());
}

TEST(SyncFileBuilder, ReturnsTheOperationOfTheFirstEntry) {
  FakePlatform platform;
  EXPECT_EQ(operationWord(platform.files, "com.a"), std::nullopt);
  platform.files.put(kTodoListPath,
                     binaryForm(plist::Array{removeEntry("com.b"), installEntry("com.a"), entry("com.a", "FAILED")}));
  EXPECT_EQ(operationWord(platform.files, "com.a"), "install");
  EXPECT_EQ(operationWord(platform.files, "com.b"), "remove");
  EXPECT_EQ(operationWord(platform.files, "com.c"), std::nullopt);
}

TEST(SyncFileBuilder, AppDirectoryHasARenderableIcon) {
  FakePlatform platform;
  putAppFolder(platform.files, "/A.app", "com.a", "A");
  const auto bundle = platform.bundles().openBundle({"/A.app", true});
  ASSERT_NE(bundle, nullptr);
  EXPECT_NE(platform.iconRenderer().createHomeScreenIconImage(*bundle), nullptr);
}

}  // namespace
}  // namespace appsync::test
