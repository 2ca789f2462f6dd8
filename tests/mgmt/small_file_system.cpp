#include "tests/mgmt/small_file_system.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>

namespace {

bool separateMounts() {
  return unshare(CLONE_NEWNS) == 0 && mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
}

}  // namespace

bool canMount() {
  const pid_t child = fork();
  if (child == 0) _exit(separateMounts() && mount("tmpfs", "/mnt", "tmpfs", 0, "size=64k") == 0 ? 0 : 1);
  int status = 1;
  return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

void useOwnMountTable() {
  ASSERT_TRUE(separateMounts());
}

SmallFileSystem::SmallFileSystem(std::string directory) : directory_(std::move(directory)) {
  EXPECT_EQ(mount("tmpfs", directory_.c_str(), "tmpfs", 0, "size=64k"), 0) << directory_;
}

SmallFileSystem::~SmallFileSystem() {
  EXPECT_EQ(umount2(directory_.c_str(), MNT_DETACH), 0) << directory_;
}

void SmallFileSystem::fill() const {
  const int file = open((directory_ + "/filler").c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
  ASSERT_GE(file, 0);
  const char block[512] = {};
  while (write(file, block, sizeof block) > 0) {
  }
  EXPECT_EQ(errno, ENOSPC);
  close(file);
}

void SmallFileSystem::makeReadOnly() const {
  ASSERT_EQ(mount("none", directory_.c_str(), nullptr, MS_REMOUNT | MS_RDONLY, nullptr), 0);
}
