// Which users a running daemon serves.

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <string>
#include <system_error>

#include "apps/vmqd/peer_credentials.h"
#include "tests/apps/vmqd/test_daemon.h"

namespace {

using ::testing::HasSubstr;

constexpr uid_t somebody = 54321;
constexpr int couldNotConnect = 200;

/// The HTTP status that a process of that user gets for GET /v1, less 300; couldNotConnect when it may not even
/// connect. REQUIRES: root.
int outcomeFor(uid_t user, const std::string& socket) {
  const pid_t child = fork();
  if (child == 0) {
    if (setgid(user) != 0 || setuid(user) != 0) _exit(255);
    try {
      const HttpReply reply = HttpClient(socket).get("/v1");
      _exit(reply.status == 403 && errorCode(reply) != "not_allowed" ? 254 : reply.status - 300 + 100);
    } catch (const std::system_error& error) {
      _exit(error.code().value() == EACCES ? couldNotConnect : 253);
    }
  }
  int status = 0;
  EXPECT_EQ(child, waitpid(child, &status, 0));
  EXPECT_TRUE(WIFEXITED(status));
  return WEXITSTATUS(status);
}
constexpr int served = 200 - 300 + 100;
constexpr int notAllowed = 403 - 300 + 100;

/// A daemon whose directory every user can enter. Any user but root asserts the socket's mode, and can do no more.
class PeersTest : public ::testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() == 0) return;
    const TestDaemon daemon;
    struct stat status;
    ASSERT_EQ(0, stat(daemon.socket().c_str(), &status));
    EXPECT_EQ(0600u, status.st_mode & 07777);
    GTEST_SKIP() << "only root can try it as another user";
  }
  static void letEverybodyIn(const TestDaemon& daemon) { ASSERT_EQ(0, chmod(daemon.directory().path().c_str(), 0755)); }
};

TEST_F(PeersTest, OtherUsersCannotConnect) {
  const TestDaemon daemon;
  letEverybodyIn(daemon);
  EXPECT_EQ(couldNotConnect, outcomeFor(somebody, daemon.socket()));
  EXPECT_EQ(served, outcomeFor(0, daemon.socket()));
}

TEST_F(PeersTest, OtherUsersAreRefusedWhereverTheSocketLetsThem) {
  const TestDaemon daemon;
  letEverybodyIn(daemon);
  ASSERT_EQ(0, chmod(daemon.socket().c_str(), 0666));
  EXPECT_EQ(notAllowed, outcomeFor(somebody, daemon.socket()));
  EXPECT_EQ(served, outcomeFor(0, daemon.socket()));
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: warning: refused the user 54321, process "));
}

TEST_F(PeersTest, ListedUsersAreServedAndOthersAreNot) {
  const TestDaemon daemon({"allowed_uids = 54321, 54323"});
  letEverybodyIn(daemon);
  EXPECT_EQ(served, outcomeFor(somebody, daemon.socket()));
  EXPECT_EQ(couldNotConnect, outcomeFor(somebody + 1, daemon.socket()));
  EXPECT_EQ(served, outcomeFor(somebody + 2, daemon.socket()));
  EXPECT_EQ(served, outcomeFor(0, daemon.socket()));
  ASSERT_EQ(0, chmod(daemon.socket().c_str(), 0666));
  EXPECT_EQ(notAllowed, outcomeFor(somebody + 1, daemon.socket()));
}

TEST_F(PeersTest, ListingRootChangesNothing) {
  const TestDaemon daemon({"allowed_uids = 0"});
  struct stat status;
  ASSERT_EQ(0, stat(daemon.socket().c_str(), &status));
  EXPECT_EQ(0600u, status.st_mode & 07777);
}

TEST(AdmittedUsers, AreRootTheOwnUserAndThoseListed) {
  const vmqd::AdmittedUsers users({somebody});
  EXPECT_TRUE(users.admits(0));
  EXPECT_TRUE(users.admits(geteuid()));
  EXPECT_TRUE(users.admits(somebody));
  EXPECT_FALSE(users.admits(somebody + 1));
  EXPECT_FALSE(users.admits(static_cast<uid_t>(-1)));
}

TEST(Peer, IsWhoConnected) {
  int pair[2];
  ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM, 0, pair));
  const auto peer = vmqd::peerOf(pair[0]);
  ASSERT_TRUE(peer);
  EXPECT_EQ(geteuid(), peer->uid);
  EXPECT_EQ(getpid(), peer->pid);
  close(pair[0]);
  close(pair[1]);
}

TEST(Peer, IsUnknownWhereNobodyConnected) {
  EXPECT_FALSE(vmqd::peerOf(-1));
  const int lonely = socket(AF_UNIX, SOCK_STREAM, 0);
  EXPECT_FALSE(vmqd::peerOf(lonely));
  close(lonely);
  const int internet = socket(AF_INET, SOCK_STREAM, 0);
  EXPECT_FALSE(vmqd::peerOf(internet));
  close(internet);
}

}  // namespace
