// The control socket of a running sync, with valid and hostile clients.
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

/// A client that sends arbitrary bytes.
class RawClient {
 public:
  explicit RawClient(const std::string& devicePath) {
    const auto folder = openControlFolder(devicePath);
    auto connection = connectIn(folder->get());
    EXPECT_TRUE(connection.ok()) << connection.error().text;
    if (connection) connection_ = std::move(connection).value();
    ::fcntl(connection_.get(), F_SETFL, 0);
  }
  void send(std::string_view bytes) const {
    // The server may have disconnected before the end of the text.
    static_cast<void>(::send(connection_.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL));
  }
  void sayNoMore() const { ::shutdown(connection_.get(), SHUT_WR); }
  /// Returns everything up to the end of the connection.
  [[nodiscard]] std::string receive() const {
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
    client.send(bytes);
    client.sayNoMore();
    return client.receive();
  }

  TemporaryFolder folder_;
  std::vector<std::string> requests_;
  ControlAnswer answer_{ControlResult::done, {}};
};

TEST_F(ControlServerTest, CarriesOutRequest) {
  const auto server = open();
  const auto answer = askSync(device(), {ControlVerb::cancel, "org.a"});
  ASSERT_TRUE(answer.ok()) << answer.error().text;
  EXPECT_EQ(*answer, (ControlAnswer{ControlResult::done, {}}));
  EXPECT_THAT(requests_, ElementsAre("org.a"));
}

TEST_F(ControlServerTest, RefusalHasReason) {
  answer_ = {ControlResult::refused, "not now"};
  const auto server = open();
  EXPECT_EQ(*askSync(device(), {ControlVerb::prioritize, "org.a"}), answer_);
}

TEST_F(ControlServerTest, ErrorWithoutSyncSaysWhatToDo) {
  const auto answer = askSync(device(), {ControlVerb::cancel, "org.a"});
  ASSERT_FALSE(answer.ok());
  EXPECT_THAT(answer.error().text, AllOf(HasSubstr("no sync is running"), HasSubstr("`appsync sync`")));
}

TEST_F(ControlServerTest, SocketIsRemovedWithTheServer) {
  { const auto server = open(); }
  EXPECT_FALSE(std::filesystem::exists(socket()));
}

TEST_F(ControlServerTest, OnlyTheOwnerCanConnect) {
  const mode_t before = ::umask(0);
  const auto server = open();
  ::umask(before);
  struct stat status = {};
  ASSERT_EQ(::stat(socket().c_str(), &status), 0);
  EXPECT_TRUE(S_ISSOCK(status.st_mode));
  EXPECT_EQ(status.st_mode & 07777U, 0600U);
}

TEST_F(ControlServerTest, ReplacesSocketOfKilledSync) {
  const auto folder = openControlFolder(device());
  { const auto left = listenIn(folder->get()); }
  ASSERT_TRUE(std::filesystem::exists(socket()));
  EXPECT_THAT(askSync(device(), {ControlVerb::cancel, "org.a"}).error().text, HasSubstr("no sync is running"));
  const auto server = open();
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.a"}).ok());
}

TEST_F(ControlServerTest, ReplacesFileAndLink) {
  std::filesystem::create_symlink("/etc/passwd", socket());
  const auto server = open();
  EXPECT_TRUE(std::filesystem::is_socket(std::filesystem::symlink_status(socket())));
  EXPECT_TRUE(std::filesystem::exists("/etc/passwd"));
}

TEST_F(ControlServerTest, FailsIfTheNameIsAFolder) {
  std::filesystem::create_directory(socket());
  EXPECT_FALSE(ControlServer::open(device(), {}).ok());
}

TEST_F(ControlServerTest, AcceptsLongDevicePath) {
  const std::string path = device() + "/" + std::string(200, 'x');
  std::filesystem::create_directory(path);
  const auto server = open(path);
  EXPECT_TRUE(askSync(path, {ControlVerb::cancel, "org.a"}).ok());
}

TEST_F(ControlServerTest, InvalidRequestIsAnError) {
  using namespace std::string_literals;
  const auto server = open();
  for (const std::string& bytes : {"\n"s, "cancel\n"s, "fly org.a\n"s, "cancel ../../x\n"s, "\0\0\0\n"s, "\xff\xfe\n"s})
    EXPECT_EQ(answerTo(bytes), "error the request is not valid\n") << bytes;
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, IncompleteRequestIsAnError) {
  const auto server = open();
  EXPECT_EQ(answerTo("cancel org.a"), "error the request is incomplete\n");
  EXPECT_EQ(answerTo(""), "error the request is incomplete\n");
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, EndlessRequestIsAnError) {
  const auto server = open();
  const RawClient client(device());
  client.send(std::string(1U << 16U, 'x'));
  EXPECT_EQ(client.receive(), "error the request is too long\n");
  EXPECT_THAT(requests_, IsEmpty());
}

TEST_F(ControlServerTest, ReadsRequestInPieces) {
  const auto server = open();
  const RawClient client(device());
  for (const char* piece : {"can", "cel o", "rg.a", "\n"})
    client.send(piece);
  EXPECT_EQ(client.receive(), "done\n");
}

TEST_F(ControlServerTest, IgnoresFurtherLines) {
  const auto server = open();
  const RawClient client(device());
  client.send("cancel org.a\ncancel org.b\n");
  EXPECT_EQ(client.receive(), "done\n");
  EXPECT_THAT(requests_, ElementsAre("org.a"));
}

TEST_F(ControlServerTest, ClientMayDisconnectEarly) {
  const auto server = open();
  for (int number = 0; number < 50; ++number) {
    const RawClient client(device());
    client.send("cancel org.a\n");
  }
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.b"}).ok());
}

TEST_F(ControlServerTest, DisconnectsSilentClient) {
  const auto server = open();
  const RawClient silent(device());
  EXPECT_TRUE(askSync(device(), {ControlVerb::cancel, "org.a"}).ok());
  EXPECT_EQ(silent.receive(), "error the request is incomplete\n");
}

TEST_F(ControlServerTest, SilentClientDoesNotDelayDestructor) {
  auto server = open();
  const RawClient silent(device());
  const RawClient another(device());
  server.reset();
  EXPECT_THAT(silent.receive(), testing::AnyOf("", "error the request is incomplete\n"));
  EXPECT_EQ(another.receive(), "");
}

TEST_F(ControlServerTest, ServesConcurrentClients) {
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

/// A client of another user; needs the superuser.
class OtherUser : public ControlServerTest {
 protected:
  static constexpr uid_t kNobody = 65534;

  void SetUp() override {
    if (::geteuid() != 0) GTEST_SKIP() << "only the superuser can act as another user";
    ControlServerTest::SetUp();
  }
  /// Returns the answer to that user. The effective user is set for the current thread only.
  [[nodiscard]] Result<std::string> answered() const {
    Result<std::string> answer = std::string();
    const auto folder = openControlFolder(device());
    std::thread([&] {
      ASSERT_EQ(::syscall(SYS_setresuid, kNobody, kNobody, kNobody), 0);
      const auto connection = connectIn(folder->get());
      answer = connection ? readLine(connection->get(), Deadline(std::chrono::minutes(1), -1))
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

TEST_F(OtherUser, IsRefusedByOpenSocket) {
  const auto server = open();
  ASSERT_EQ(::chmod(socket().c_str(), 0666), 0);
  const auto answer = answered();
  ASSERT_TRUE(answer.ok()) << answer.error().text;
  EXPECT_EQ(*answer, "error the sync belongs to another user");
  EXPECT_THAT(requests_, IsEmpty());
}

}  // namespace
}  // namespace appsync::test
