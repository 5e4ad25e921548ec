// `appsync tap` and `appsync cancel` while a sync runs in another process.
#include <filesystem>
#include <thread>

#include <gmock/gmock.h>

#include "daemon/control/Socket.h"
#include "tests/support/SyncInThisProcess.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::UnorderedElementsAre;

class TapAndCancel : public ToolFixture {
 protected:
  void SetUp() override {
    ToolFixture::SetUp();
    for (const char* identifier : {"org.a", "org.b", "org.c", "org.d"})
      publish(identifier);
  }
  [[nodiscard]] Finished tap(const std::string& identifier) const { return runTool({"tap", device(), identifier}); }
  [[nodiscard]] Finished cancel(const std::string& identifier) const {
    return runTool({"cancel", device(), identifier});
  }
};

TEST_F(TapAndCancel, TappedAppIsSentNext) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  const Finished tapped = tap("org.d");
  EXPECT_EQ(tapped.status, 0) << tapped.err;
  EXPECT_EQ(tapped.out, "org.d is sent before the others.\n");
  sync.waitUntilTold();
  hold.letGo();
  const RecordingReporter& told = sync.finish();
  EXPECT_THAT(told.sent, ElementsAre("org.a", "org.d", "org.b", "org.c"));
  EXPECT_FALSE(told.wentBack);
  EXPECT_EQ(apps().size(), 4U);
}

TEST_F(TapAndCancel, CancelledAppIsSkipped) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  const Finished cancelled = cancel("org.c");
  EXPECT_EQ(cancelled.status, 0) << cancelled.err;
  EXPECT_EQ(cancelled.out, "org.c is cancelled.\n");
  sync.waitUntilTold();
  EXPECT_THAT(apps(), Not(Contains("org.c 1.0?")));
  hold.letGo();
  const RecordingReporter& told = sync.finish();
  EXPECT_EQ(told.ended.front(), "skipped org.c: cancelled on the device") << "it is told late";
  EXPECT_THAT(told.sent, ElementsAre("org.a", "org.b", "org.d"));
  EXPECT_THAT(told.ended, UnorderedElementsAre("installed org.a", "installed org.b", "installed org.d",
                                               "skipped org.c: cancelled on the device"));
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0", "org.b 1.0", "org.d 1.0"));
}

TEST_F(TapAndCancel, CancelsRunningTransfer) {
  StepHold hold("send package", 2);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  EXPECT_EQ(cancel("org.b").status, 0);
  sync.waitUntilTold();
  hold.letGo();
  EXPECT_THAT(sync.finish().ended, UnorderedElementsAre("installed org.a", "installed org.c", "installed org.d",
                                                        "skipped org.b: cancelled on the device"));
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0", "org.c 1.0", "org.d 1.0"));
  EXPECT_TRUE(std::filesystem::is_empty(device() + "/root/var/mobile/Media/PublicStaging"));
}

TEST_F(TapAndCancel, NextSyncOffersCancelledApp) {
  {
    StepHold hold("send package", 1);
    SyncInThisProcess sync(device(), library());
    hold.waitUntilHeld();
    EXPECT_EQ(cancel("org.a").status, 0);
    EXPECT_EQ(cancel("org.d").status, 0);
    sync.waitUntilTold();
  }
  EXPECT_THAT(endsIn(sync({"--json"}).out),
              UnorderedElementsAre("installed org.a", "skipped org.b", "skipped org.c", "installed org.d"));
}

TEST_F(TapAndCancel, CancelledUpdateKeepsOldVersion) {
  ASSERT_EQ(sync().status, 0);
  publish("org.b", "2.0");
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  EXPECT_EQ(cancel("org.b").status, 0);
  sync.waitUntilTold();
  hold.letGo();
  EXPECT_THAT(sync.finish().ended, Contains("skipped org.b: cancelled on the device"));
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0", "org.b 1.0", "org.c 1.0", "org.d 1.0"));
}

TEST_F(TapAndCancel, CancelsEveryApp) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  for (const char* identifier : {"org.a", "org.b", "org.c", "org.d"})
    EXPECT_EQ(cancel(identifier).status, 0);
  sync.waitUntilTold();
  hold.letGo();
  EXPECT_THAT(sync.finish().ended,
              UnorderedElementsAre("skipped org.a: cancelled on the device", "skipped org.b: cancelled on the device",
                                   "skipped org.c: cancelled on the device", "skipped org.d: cancelled on the device"));
  EXPECT_THAT(apps(), IsEmpty());
}

TEST_F(TapAndCancel, RefusesAppThatIsNotBeingInstalled) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  EXPECT_EQ(cancel("org.b").status, 0);
  for (const char* identifier : {"org.x", "org.b"}) {
    for (const Finished& asked : {tap(identifier), cancel(identifier)}) {
      EXPECT_EQ(asked.status, 1);
      EXPECT_EQ(asked.out, "");
      EXPECT_THAT(asked.err, AllOf(HasSubstr(identifier), HasSubstr("is not being installed")));
    }
  }
}

TEST_F(TapAndCancel, ServesTwoClients) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  ToolRun first({"cancel", device(), "org.b"});
  ToolRun second({"cancel", device(), "org.c"});
  EXPECT_EQ(first.wait().status, 0);
  EXPECT_EQ(second.wait().status, 0);
  sync.waitUntilTold();
  hold.letGo();
  EXPECT_THAT(sync.finish().sent, ElementsAre("org.a", "org.d"));
}

TEST_F(TapAndCancel, CancelsAppOnlyOnce) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  ToolRun first({"cancel", device(), "org.b"});
  ToolRun second({"cancel", device(), "org.b"});
  EXPECT_EQ(first.wait().status + second.wait().status, 1);
}

TEST_F(TapAndCancel, ErrorWithoutSyncSaysWhatToDo) {
  for (const Finished& asked : {tap("org.a"), cancel("org.a")}) {
    EXPECT_EQ(asked.status, 3);
    EXPECT_EQ(asked.out, "");
    EXPECT_THAT(asked.err, AllOf(HasSubstr("no sync is running"), HasSubstr("`appsync sync`")));
  }
}

TEST_F(TapAndCancel, SocketIsRemovedWithTheSync) {
  ASSERT_EQ(sync().status, 0);
  EXPECT_FALSE(std::filesystem::exists(device() + "/control"));
}

TEST_F(TapAndCancel, RefusesDirectDevice) {
  ASSERT_EQ(runTool({"set", device(), "coordination=off"}).status, 0);
  for (const Finished& asked : {tap("org.a"), cancel("org.a")}) {
    EXPECT_EQ(asked.status, 3);
    EXPECT_THAT(asked.err, AllOf(HasSubstr("installs directly"), HasSubstr("coordination=on")));
  }
}

TEST_F(TapAndCancel, RefusesMissingDevice) {
  EXPECT_THAT(runTool({"tap", library(), "org.a"}).err, HasSubstr("is not a device"));
}

TEST_F(TapAndCancel, RefusesInvalidIdentifier) {
  for (const char* identifier : {"", "../x", "two words", "\x1b[2J"}) {
    const Finished asked = cancel(identifier);
    EXPECT_EQ(asked.status, 2) << identifier;
    EXPECT_THAT(asked.err, Not(HasSubstr("\x1b")));
  }
}

TEST_F(TapAndCancel, HostileClientsDoNotDelayTheSync) {
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  const auto folder = daemon::openControlFolder(device());
  std::vector<device::FileDescriptor> clients;
  for (const std::string& said : {std::string(), std::string("cancel org.a"), std::string(5000, 'x')}) {
    auto client = daemon::connectIn(folder->get());
    ASSERT_TRUE(client.ok());
    daemon::writeLine(client->get(), said, daemon::Deadline(std::chrono::minutes(1), -1)).ignore();
    clients.push_back(std::move(client).value());
  }
  hold.letGo();
  EXPECT_THAT(sync.finish().ended,
              UnorderedElementsAre("installed org.a", "installed org.b", "installed org.c", "installed org.d"));
}

}  // namespace

}  // namespace appsync::test
