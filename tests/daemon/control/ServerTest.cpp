// The socket of a running sync, and whoever may knock at it.
#include <atomic>
#include <cerrno>
#include <filesystem>
#include <string>
#include <thread>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "daemon/control/Client.h"
#include "daemon/control/Server.h"
#include "daemon/control/Socket.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {
namespace {

using namespace daemon;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

/// A client that says whatever it likes.
class RawClient {
 public:
  explicit RawClient(const std::string& devicePath) {
    const auto folder = openControlFolder(devicePath);
    auto connection = connectIn(folder->get());
    EXPECT_TRUE(connection.ok()) << connection.error().text;
    if (connection) connection_ = std::move(connection).value();
    ::fcntl(connection_.get(), F_SETFL, 0);
  }
  void say(std::string_view bytes) const {
    // A server that has heard enough may have closed its end.
    static_cast<void>(::send(connection_.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL));
  }
  void sayNoMore() const { ::shutdown(connection_.get(), SHUT_WR); }
  /// Everything until the server closes.
  [[nodiscard]] std::string hear() const {
    std::string heard;
    char piece[4096];
    for (ssize_t count = 0; (count = ::recv(connection_.get(), piece, sizeof piece, 0)) > 0;)
      heard.append(piece, static_cast<std::size_t>(count));
    return heard;
  }

 private:
  device::FileDescriptor connection_;
};

class ControlServerTest : public testing::Test {
 protected:
  void SetUp() override { std::filesystem::create_directory(device()); }
  [[nodiscard]] std::string device() const { return folder_.path("device"); }
  [[nodiscard]] std::string socket() const { return device() + "/control"; }

  [[nodiscard]] std::unique_ptr<ControlServer> open(const std::string& path) {
    auto server = ControlServer::open(path, [this](const ControlRequest& request) {
      requests_.push_back(request.identifier);
      return answer_;
    });
    EXPECT_TRUE(server.ok()) << server.error().text;
    return server ? std::move(server).value() : nullptr;
  }
  [[nodiscard]] std::unique_ptr<ControlServer> open() { return open(device()); }
  [[nodiscard]] std::string answerTo(std::string_view bytes) const {
    const RawClient client(device());
    client.say(bytes);
    client.sayNoMore();
    return client.hear();
  }

  TemporaryFolder folder_;
  std::vector<std::string> requests_;
  ControlAnswer answer_{ControlResult::done, {}};
};

TEST_F(ControlServerTest, CarriesARequestOutAndAnswers) {
  const auto server = open();
  const auto answer = askSync(device(), {ControlVerb::cancel, "org.a"});
  ASSERT_TRUE(answer.ok()) << answer.error().text;
  EXPECT_EQ(*answer, (ControlAnswer{ControlResult::done, {}}));
  EXPECT_THAT(requests_, ElementsAre("org.a"));
}

TEST_F(ControlServerTest, ARefusalSaysWhy) {
  answer_ = {ControlResult::refused, "not now"};
  const auto server = open();
  EXPECT_EQ(*askSync(device(), {ControlVerb::prioritize, "org.a"}), answer_);
}

TEST_F(ControlServerTest, WithoutASyncTheSentenceSaysWhatToDo) {
  const auto answer = askSync(device(), {ControlVerb::cancel, "org.a"});
  ASSERT_FALSE(answer.ok());
  EXPECT_THAT(answer.error().text, AllOf(HasSubstr("no sync is running"), HasSubstr("`appsync sync`")));
}

TEST_F(ControlServerTest, TheSocketGoesWithTheSync) {
  { const auto server = open(); }
  EXPECT_FALSE(std::filesystem::exists(socket()));
}

TEST_F(ControlServerTest, OnlyTheOwnerMayOpenItWhateverTheUmask) {
  const mode_t before = ::umask(0);
  const auto server = open();
  ::umask(before);
  struct stat status = {};
  ASSERT_EQ(::stat(socket().c_str(), &status), 0);
  EXPECT_TRUE(S_ISSOCK(status.st_mode));
  EXPECT_EQ(status.st_mode & 07777U, 0600U);
}

TEST_F(ControlServerTest, WhatAKilledSyncLeftIsReplaced) {
  const auto folder = openControlFolder(device());
  { const auto left = listenIn(folder->get()); }
  ASSERT_TRUE(std::filesystem::exists(socket()));
  EXPECT_THAT(askSync(device(), {ControlVerb::cancel, "org.a"}).error().text, HasSubstr("no sync is running"));
  const auto server = open();
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.a"}).ok());
}

TEST_F(ControlServerTest, AFileOfThatNameIsReplacedAndALinkNotFollowed) {
  std::filesystem::create_symlink("/etc/passwd", socket());
  const auto server = open();
  EXPECT_TRUE(std::filesystem::is_socket(std::filesystem::symlink_status(socket())));
  EXPECT_TRUE(std::filesystem::exists("/etc/passwd"));
}

TEST_F(ControlServerTest, AFolderOfThatNameIsAnError) {
  std::filesystem::create_directory(socket());
  EXPECT_FALSE(ControlServer::open(device(), {}).ok());
}

TEST_F(ControlServerTest, APathLongerThanASocketsAddressWorks) {
  const std::string path = device() + "/" + std::string(200, 'x');
  std::filesystem::create_directory(path);
  const auto server = open(path);
  EXPECT_TRUE(askSync(path, {ControlVerb::cancel, "org.a"}).ok());
}

TEST_F(ControlServerTest, WhatIsNoRequestIsAnsweredWithAnError) {
  using namespace std::string_literals;
  const auto server = open();
  for (const std::string& bytes : {"\n"s, "cancel\n"s, "fly org.a\n"s, "cancel ../../x\n"s, "\0\0\0\n"s, "\xff\xfe\n"s})
    EXPECT_EQ(answerTo(bytes), "error the request is not understood\n") << bytes;
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, ARequestWithoutAnEndIsAnsweredWithAnError) {
  const auto server = open();
  EXPECT_EQ(answerTo("cancel org.a"), "error the request did not come to its end\n");
  EXPECT_EQ(answerTo(""), "error the request did not come to its end\n");
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, AnEndlessRequestIsAnsweredAfterItsFirstPart) {
  const auto server = open();
  const RawClient client(device());
  client.say(std::string(1U << 16U, 'x'));
  EXPECT_EQ(client.hear(), "error the request is too long\n");
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, ARequestMayComeInPieces) {
  const auto server = open();
  const RawClient client(device());
  for (const char* piece : {"can", "cel o", "rg.a", "\n"})
    client.say(piece);
  EXPECT_EQ(client.hear(), "done\n");
}

TEST_F(ControlServerTest, OnlyTheFirstLineCounts) {
  const auto server = open();
  const RawClient client(device());
  client.say("cancel org.a\ncancel org.b\n");
  EXPECT_EQ(client.hear(), "done\n");
  EXPECT_THAT(requests_, ElementsAre("org.a"));
}

TEST_F(ControlServerTest, WhoLeavesWithoutWaitingDoesNoHarm) {
  const auto server = open();
  for (int number = 0; number < 50; ++number) {
    const RawClient client(device());
    client.say("cancel org.a\n");
  }
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.b"}).ok());
}

TEST_F(ControlServerTest, WhoSaysNothingIsGivenUpAndTheNextIsServed) {
  const auto server = open();
  const RawClient silent(device());
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.a"}).ok());
  EXPECT_EQ(silent.hear(), "error the request did not come to its end\n");
}

TEST_F(ControlServerTest, WhoSaysNothingDoesNotHoldUpTheEnd) {
  auto server = open();
  const RawClient silent(device());
  const RawClient another(device());
  server.reset();
  EXPECT_THAT(silent.hear(), testing::AnyOf("", "error the request did not come to its end\n"));
  EXPECT_EQ(another.hear(), "");
}

TEST_F(ControlServerTest, SeveralAtOnceAreServedOneAfterTheOther) {
  const auto server = open();
  std::vector<std::thread> askers;
  std::atomic<int> served = 0;
  for (int number = 0; number < 8; ++number) {
    askers.emplace_back([&] { served += askSync(device(), {ControlVerb::cancel, "org.a"}).ok() ? 1 : 0; });
  }
  for (std::thread& asker : askers)
    asker.join();
  EXPECT_EQ(served, 8);
  EXPECT_EQ(requests_.size(), 8U);
}

/// Another user, which only the superuser can play.
class OtherUser : public ControlServerTest {
 protected:
  static constexpr uid_t kNobody = 65534;

  void SetUp() override {
    if (::geteuid() != 0) GTEST_SKIP() << "only the superuser can act as another user";
    ControlServerTest::SetUp();
  }
  /// What that user is answered; each thread has a user of its own.
  [[nodiscard]] Result<std::string> answered() const {
    Result<std::string> answer = std::string();
    const auto folder = openControlFolder(device());
    std::thread([&] {
      ASSERT_EQ(::syscall(SYS_setresuid, kNobody, kNobody, kNobody), 0);
      const auto connection = connectIn(folder->get());
      answer = connection ? readLine(connection->get(), ControlPatience(std::chrono::minutes(1), -1))
                          : Result<std::string>(connection.error());
    }).join();
    return answer;
  }
};

TEST_F(OtherUser, CannotConnect) {
  const auto server = open();
  const auto answer = answered();
  ASSERT_FALSE(answer.ok()) << *answer;
  EXPECT_EQ(answer.error().code, EACCES);
}

TEST_F(OtherUser, IsRefusedEvenThroughASocketThatEverybodyMayOpen) {
  const auto server = open();
  ASSERT_EQ(::chmod(socket().c_str(), 0666), 0);
  const auto answer = answered();
  ASSERT_TRUE(answer.ok()) << answer.error().text;
  EXPECT_EQ(*answer, "error the sync is another user's");
  EXPECT_THAT(requests_, IsEmpty());
}

}  // namespace
}  // namespace appsync::test
