// Where directories stand.

#include "apps/vmqd/file_systems.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <optional>

namespace vmqd {
namespace {

/// The file system of the path, or of what exists above it.
std::optional<dev_t> fileSystemOf(std::filesystem::path path) {
  struct stat status;
  while (stat(path.c_str(), &status) != 0) {
    if (errno != ENOENT || !path.has_relative_path()) return std::nullopt;
    path = path.parent_path();
  }
  return status.st_dev;
}

}  // namespace

bool onDifferentFileSystems(const std::string& one, const std::string& other) {
  const auto first = fileSystemOf(one);
  const auto second = fileSystemOf(other);
  return first && second && *first != *second;
}

}  // namespace vmqd
