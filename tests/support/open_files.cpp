#include "tests/support/open_files.h"

#include <fcntl.h>

#include <filesystem>
#include <system_error>

namespace fs = std::filesystem;

std::vector<int> descriptorsOf(const std::string& path) {
  const fs::path canonical = fs::weakly_canonical(path);
  std::vector<int> descriptors;
  for (const auto& entry : fs::directory_iterator("/proc/self/fd")) {
    std::error_code gone;  // the listing's own descriptor, or one that another thread has closed
    if (fs::read_symlink(entry, gone) == canonical) descriptors.push_back(std::stoi(entry.path().filename()));
  }
  return descriptors;
}

bool isClosedOnExec(int descriptor) {
  const int flags = fcntl(descriptor, F_GETFD);
  return flags >= 0 && (flags & FD_CLOEXEC) != 0;
}
