#include "tests/support/scratch_file_system.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <system_error>
#include <utility>

namespace {

bool write(const char* path, const std::string& text) {
  const int file = open(path, O_WRONLY | O_CLOEXEC);
  const bool written = file >= 0 && ::write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size());
  if (file >= 0) close(file);
  return written;
}

/// Who is not root can be root of a user namespace.
bool becomeRootOfOwnNamespace() {
  const std::string user = std::to_string(geteuid());
  const std::string group = std::to_string(getegid());
  return unshare(CLONE_NEWUSER) == 0 && write("/proc/self/setgroups", "deny") &&
         write("/proc/self/uid_map", "0 " + user + " 1") && write("/proc/self/gid_map", "0 " + group + " 1");
}

bool separate = false;

bool separateMounts() {
  if (separate) return true;
  if (geteuid() != 0 && !becomeRootOfOwnNamespace()) return false;
  separate = unshare(CLONE_NEWNS) == 0 && mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
  return separate;
}

}  // namespace

bool canMount() {
  if (separate) return true;
  const pid_t child = fork();
  if (child == 0) _exit(separateMounts() && mount("none", "/tmp", "tmpfs", 0, "size=64k") == 0 ? 0 : 1);
  int status = 1;
  return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

void useOwnMountTable() {
  if (!separateMounts()) throw std::system_error(errno, std::generic_category(), "no mount table of its own");
}

// Throws, so that no test fills what lies under a file system that is not there.
ScratchFileSystem::ScratchFileSystem(std::string directory, unsigned kibibytes)
    : directory_(std::move(directory)), bytes_(kibibytes * size_t{1024}) {
  useOwnMountTable();
  std::filesystem::create_directories(directory_);
  const std::string options = "size=" + std::to_string(kibibytes) + "k";
  if (mount("none", directory_.c_str(), "tmpfs", MS_NOSUID | MS_NODEV, options.c_str()) != 0)
    throw std::system_error(errno, std::generic_category(), "no file system in " + directory_);
}

ScratchFileSystem::~ScratchFileSystem() {
  EXPECT_EQ(umount2(directory_.c_str(), MNT_DETACH), 0) << directory_;
}

void ScratchFileSystem::fill() const {
  const int file = open((directory_ + "/filler").c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
  ASSERT_GE(file, 0);
  const char block[512] = {};
  size_t written = 0;
  ssize_t count = 0;
  while (written < 2 * bytes_ && (count = ::write(file, block, sizeof block)) > 0)
    written += static_cast<size_t>(count);
  const int error = errno;
  close(file);
  ASSERT_LT(count, 0) << "twice its size fits into " << directory_;
  EXPECT_EQ(error, ENOSPC);
}

void ScratchFileSystem::makeReadOnly() const {
  ASSERT_EQ(mount("none", directory_.c_str(), nullptr, MS_REMOUNT | MS_RDONLY | MS_NOSUID | MS_NODEV, nullptr), 0);
}
