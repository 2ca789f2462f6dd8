#include "util/replace_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <memory>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/replace_file"};

// All of these return 0 or an errno value.

int errorOf(int rc) {
  return rc == 0 ? 0 : errno;
}

int writeAll(int descriptor, const std::string& contents) {
  size_t written = 0;
  while (written < contents.size()) {
    const ssize_t count = write(descriptor, contents.data() + written, contents.size() - written);
    if (count < 0 && errno != EINTR) return errno;
    if (count > 0) written += static_cast<size_t>(count);
  }
  return 0;
}

int fill(int descriptor, const std::string& contents, const struct stat& like) {
  int error = errorOf(fchown(descriptor, like.st_uid, like.st_gid));
  if (error == 0) error = errorOf(fchmod(descriptor, like.st_mode & 07777));
  if (error == 0) error = writeAll(descriptor, contents);
  if (error == 0) error = errorOf(fsync(descriptor));
  return error;
}

bool writeBeside(const std::string& path, const std::string& contents, const struct stat& like, int& error) {
  const Trace trace(traceUnit);
  // The place of the file itself: replacing a link would leave the file behind it as it was.
  const std::unique_ptr<char, decltype(&std::free)> real(realpath(path.c_str(), nullptr), std::free);
  if (!real) {
    error = errno;
    return false;
  }
  std::string beside = std::string(real.get()) + ".XXXXXX";
  const int descriptor = mkostemp(beside.data(), O_CLOEXEC);
  if (descriptor < 0) {
    error = errno;
    return false;
  }
  error = fill(descriptor, contents, like);
  const int closed = errorOf(close(descriptor));
  if (error == 0) error = closed;
  if (error == 0) error = errorOf(std::rename(beside.c_str(), real.get()));
  if (error != 0) (void)unlink(beside.c_str());  // the first error counts
  return true;
}

/// Opens it for writing, creating it when it is missing.
int openTarget(const std::string& path, bool& isNew) {
  constexpr int flags = O_WRONLY | O_CREAT | O_CLOEXEC;
  constexpr mode_t mode = 0666;
  const int created = open(path.c_str(), flags | O_EXCL, mode);
  isNew = created >= 0;
  // cppcheck-suppress resourceLeak ; it is returned
  return isNew || errno != EEXIST ? created : open(path.c_str(), flags, mode);
}

}  // namespace

bool replaceFile(const std::string& path, const std::string& contents, int& error) {
  const Trace trace(traceUnit);
  bool isNew = false;
  const int target = openTarget(path, isNew);
  if (target < 0) {
    error = errno;
    return false;
  }
  struct stat status;
  error = errorOf(fstat(target, &status));
  bool opened = true;
  const bool isPlain = error == 0 && S_ISREG(status.st_mode);
  if (isPlain) {
    opened = writeBeside(path, contents, status, error);
  } else if (error == 0) {
    error = writeAll(target, contents);
  }
  const int closed = errorOf(close(target));
  if (error == 0 && !isPlain) error = closed;  // nothing was written to a plain file
  if (error != 0 && isNew) (void)unlink(path.c_str());  // the first error counts
  return opened;
}

}  // namespace VMQ
