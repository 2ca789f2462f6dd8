// The socket that clients connect to: who may, and what stands in its way.

#include "apps/vmqd/listening_socket.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>

#include "apps/vmqd/socket_access.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"

namespace vmqd {
namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;

constexpr uid_t somebody = 54321;

/// 0, or the errno value with which a connection fails.
int connectionError(const std::string& path) {
  const Descriptor client(socket(AF_UNIX, SOCK_STREAM, 0));
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strcpy(address.sun_path, path.c_str());
  return connect(client.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 ? 0 : errno;
}

/// The same for a process of that user. REQUIRES: root.
int connectionErrorOf(uid_t user, const std::string& path) {
  const pid_t child = fork();
  if (child == 0) {
    if (setgid(user) != 0 || setuid(user) != 0) _exit(255);
    _exit(connectionError(path));
  }
  int status = 0;
  EXPECT_EQ(child, waitpid(child, &status, 0));
  EXPECT_TRUE(WIFEXITED(status));
  return WEXITSTATUS(status);
}

mode_t modeOf(const std::string& path) {
  struct stat status;
  EXPECT_EQ(0, lstat(path.c_str(), &status)) << path;
  return status.st_mode & 07777;
}

bool exists(const std::string& path) {
  struct stat status;
  return lstat(path.c_str(), &status) == 0;
}

/// What is said when the socket cannot be had.
std::string complaintAbout(const std::string& path, const std::vector<uid_t>& guests = {}) {
  try {
    const ListeningSocket socket(path, guests);
  } catch (const std::runtime_error& error) {
    return error.what();
  }
  return "";
}

class ListeningSocketTest : public ::testing::Test {
 protected:
  const TemporaryDirectory directory;
  const std::string path = directory / "s";
};

TEST_F(ListeningSocketTest, CanBeConnectedToAndGoesWithItsObject) {
  {
    const ListeningSocket socket(path, {});
    EXPECT_EQ(path, socket.path());
    EXPECT_EQ(0, connectionError(path));
  }
  EXPECT_FALSE(exists(path));
}

TEST_F(ListeningSocketTest, HasMode0600WhateverTheUmask) {
  for (const mode_t mask : {0, 022, 0177}) {
    const mode_t before = umask(mask);
    const ListeningSocket socket(path, {});
    umask(before);
    EXPECT_EQ(0600u, modeOf(path));
  }
}

TEST_F(ListeningSocketTest, IsNotLeftToChildren) {
  const ListeningSocket socket(path, {});
  EXPECT_EQ(FD_CLOEXEC, fcntl(socket.descriptor(), F_GETFD));
}

TEST_F(ListeningSocketTest, LeavesNoDescriptorBehind) {
  const ProcessResources before = ProcessResources::now();
  {
    const ListeningSocket socket(path, {});
    EXPECT_NE("", complaintAbout(path));
  }
  EXPECT_EQ(before, ProcessResources::now());
}

TEST_F(ListeningSocketTest, IsHeldByOneAtATime) {
  const ListeningSocket first(path, {});
  EXPECT_EQ("another vmqd is running on " + path, complaintAbout(path));
  EXPECT_EQ(0, connectionError(path));
}

TEST_F(ListeningSocketTest, CanBeHadAgain) {
  for (int round = 0; round < 3; ++round) {
    const ListeningSocket socket(path, {});
    EXPECT_EQ(0, connectionError(path));
  }
}

TEST_F(ListeningSocketTest, ThatADeadProcessLeftBehindIsTakenOver) {
  const pid_t child = fork();
  if (child == 0) {
    const ListeningSocket socket(path, {});
    _exit(exists(path) ? 0 : 1);
  }
  int status = -1;
  ASSERT_EQ(child, waitpid(child, &status, 0));
  ASSERT_EQ(0, status);
  ASSERT_TRUE(exists(path));
  ASSERT_EQ(ECONNREFUSED, connectionError(path));
  const ListeningSocket socket(path, {});
  EXPECT_EQ(0, connectionError(path));
  EXPECT_EQ(0600u, modeOf(path));
}

TEST_F(ListeningSocketTest, OfAnotherProgramIsLeftAlone) {
  const Descriptor other(socket(AF_UNIX, SOCK_STREAM, 0));
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strcpy(address.sun_path, path.c_str());
  ASSERT_EQ(0, bind(other.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address));
  ASSERT_EQ(0, listen(other.get(), 5));
  EXPECT_EQ("another process listens on " + path, complaintAbout(path));
  EXPECT_EQ(0, connectionError(path));
}

TEST_F(ListeningSocketTest, DoesNotReplaceAFile) {
  directory.writeFile("s", "precious");
  EXPECT_EQ(path + " exists and is not a socket", complaintAbout(path));
  EXPECT_EQ("precious", readWholeFile(path));
}

TEST_F(ListeningSocketTest, DoesNotFollowALink) {
  ASSERT_EQ(0, symlink((directory / "elsewhere").c_str(), path.c_str()));
  EXPECT_EQ(path + " exists and is not a socket", complaintAbout(path));
}

TEST_F(ListeningSocketTest, DoesNotFollowALinkForItsLock) {
  directory.writeFile("precious", "precious");
  ASSERT_EQ(0, symlink((directory / "precious").c_str(), (path + ".lock").c_str()));
  EXPECT_THAT(complaintAbout(path), StartsWith("the lock " + path + ".lock: "));
}

TEST_F(ListeningSocketTest, DoesNotLockWhatIsNoFile) {
  ASSERT_EQ(0, mkfifo((path + ".lock").c_str(), 0600));
  EXPECT_EQ("the lock " + path + ".lock is not a file of our own", complaintAbout(path));
}

TEST_F(ListeningSocketTest, RemovesOnlyWhatIsItsOwn) {
  auto socket = std::make_unique<ListeningSocket>(path, std::vector<uid_t>{});
  ASSERT_EQ(0, unlink(path.c_str()));
  directory.writeFile("s", "somebody else's");
  socket.reset();
  EXPECT_EQ("somebody else's", readWholeFile(path));
}

TEST_F(ListeningSocketTest, NeedsItsDirectory) {
  EXPECT_EQ("the directory of the socket, " + (directory / "none") + ": No such file or directory",
            complaintAbout(directory / "none/s"));
  directory.writeFile("file", "");
  EXPECT_EQ("the directory of the socket, " + (directory / "file") + ", is not a directory",
            complaintAbout(directory / "file/s"));
}

TEST_F(ListeningSocketTest, DoesNotStandWhereEveryUserCouldReplaceIt) {
  ASSERT_EQ(0, chmod(directory.path().c_str(), 0777));
  EXPECT_EQ("every user may write to the directory of the socket, " + directory.path().string() +
                ", and it has no sticky bit",
            complaintAbout(path));
  EXPECT_FALSE(exists(path + ".lock"));
  ASSERT_EQ(0, chmod(directory.path().c_str(), 01777));
  EXPECT_EQ("", complaintAbout(path));
}

TEST_F(ListeningSocketTest, WithALongPathIsRefused) {
  EXPECT_THAT(complaintAbout(directory / std::string(100, 'x')), HasSubstr("File name too long"));
}

TEST_F(ListeningSocketTest, CanTurnClientsAwayBeforeItGoes) {
  ListeningSocket socket(path, {});
  socket.refuseFurther();
  EXPECT_EQ(ECONNREFUSED, connectionError(path));
}

// What follows changes users, which only root can; any other user is kept out by the mode that is asserted above.
class ListeningSocketOfRoot : public ListeningSocketTest {
 protected:
  void SetUp() override {
    ASSERT_EQ(0, chmod(directory.path().c_str(), 0755));
    if (geteuid() == 0) return;
    const ListeningSocket socket(path, {});
    EXPECT_EQ(0600u, modeOf(path));
    GTEST_SKIP() << "only root can try it as another user";
  }
};

TEST_F(ListeningSocketOfRoot, KeepsOtherUsersOut) {
  const ListeningSocket socket(path, {});
  EXPECT_EQ(EACCES, connectionErrorOf(somebody, path));
  EXPECT_EQ(0, connectionErrorOf(0, path));
}

TEST_F(ListeningSocketOfRoot, LetsItsGuestsInAndNobodyElse) {
  const ListeningSocket socket(path, {somebody, somebody + 1, somebody});
  EXPECT_EQ(0, connectionErrorOf(somebody, path));
  EXPECT_EQ(0, connectionErrorOf(somebody + 1, path));
  EXPECT_EQ(EACCES, connectionErrorOf(somebody + 2, path));
  EXPECT_EQ(0u, modeOf(path) & (S_IRWXO | S_IXGRP | S_IXUSR));
}

TEST_F(ListeningSocketOfRoot, DoesNotStandInSomebodyElsesDirectory) {
  ASSERT_EQ(0, mkdir((directory / "d").c_str(), 0755));
  ASSERT_EQ(0, chown((directory / "d").c_str(), somebody, somebody));
  EXPECT_EQ("the directory of the socket, " + (directory / "d") + ", belongs to the user 54321",
            complaintAbout(directory / "d/s"));
}

TEST_F(ListeningSocketOfRoot, DoesNotTakeOverSomebodyElsesSocket) {
  const pid_t child = fork();
  if (child == 0) {
    const ListeningSocket socket(path, {});
    _exit(0);
  }
  int status = -1;
  ASSERT_EQ(child, waitpid(child, &status, 0));
  ASSERT_EQ(0, chown(path.c_str(), somebody, somebody));
  EXPECT_EQ("the socket " + path + " belongs to the user 54321", complaintAbout(path));
  EXPECT_TRUE(exists(path));
}

TEST_F(ListeningSocketOfRoot, DoesNotLockSomebodyElsesFile) {
  directory.writeFile("s.lock", "");
  ASSERT_EQ(0, chown((path + ".lock").c_str(), somebody, somebody));
  EXPECT_EQ("the lock " + path + ".lock is not a file of our own", complaintAbout(path));
}

TEST(AccessOfUsers, CannotBeGivenWhereNothingIs) {
  const TemporaryDirectory directory;
  EXPECT_EQ(ENOENT, admitUsers(directory / "none", {somebody}));
}

}  // namespace
}  // namespace vmqd
