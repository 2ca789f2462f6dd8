#include "tests/support/scratch_file_system.h"

#include <sched.h>
#include <sys/mount.h>

#include <filesystem>

ScratchFileSystem::ScratchFileSystem(std::string directory, unsigned kibibytes) : directory_(std::move(directory)) {
  std::filesystem::create_directories(directory_);
  const std::string options = "size=" + std::to_string(kibibytes) + "k";
  mounted_ = unshare(CLONE_NEWNS) == 0 && mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
             mount("none", directory_.c_str(), "tmpfs", MS_NOSUID | MS_NODEV, options.c_str()) == 0;
}

ScratchFileSystem::~ScratchFileSystem() {
  if (mounted_) (void)umount2(directory_.c_str(), MNT_DETACH);  // goes with the process if this fails
}

bool ScratchFileSystem::makeReadOnly() const {
  return mount("none", directory_.c_str(), nullptr, MS_REMOUNT | MS_RDONLY | MS_NOSUID | MS_NODEV, nullptr) == 0;
}
