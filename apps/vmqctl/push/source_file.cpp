// Reads the files that are sent.

#include "apps/vmqctl/push/source_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <vector>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

[[noreturn]] void fail(const char* what, const std::string& path, int error) {
  throw Failure(ExitCode::Failed, std::string("Cannot ") + what + " " + path + ": " + std::strerror(error) + ".");
}

[[noreturn]] void failChanged(const std::string& path, const char* how) {
  throw Failure(ExitCode::Failed, path + " " + how + " while it was read.", "Push it when nothing writes to it.");
}

int openForReading(const std::string& path) {
  // Should it have become a pipe since it was looked at, opening it must not wait.
  const int descriptor = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
  if (descriptor < 0) fail("open", path, errno);
  return descriptor;
}

/// Takes the first bytes off the pieces.
void advance(std::vector<iovec>& pieces, std::size_t& first, std::size_t bytes) {
  while (first < pieces.size() && bytes >= pieces[first].iov_len) bytes -= pieces[first++].iov_len;
  if (bytes == 0) return;
  pieces[first].iov_base = static_cast<char*>(pieces[first].iov_base) + bytes;
  pieces[first].iov_len -= bytes;
}

}  // namespace

SourceFile::SourceFile(const std::string& path) : path_(path), descriptor_(openForReading(path)) {
  try {
    opened_ = look();
    if (!S_ISREG(opened_.st_mode)) throw Failure(ExitCode::Failed, path + " is no regular file any more.");
  } catch (...) {
    (void)close(descriptor_);  // only read from
    throw;
  }
  // Only helps to be fast.
  (void)posix_fadvise(descriptor_, 0, 0, POSIX_FADV_SEQUENTIAL);
}

SourceFile::~SourceFile() {
  (void)close(descriptor_);  // only read from
}

void SourceFile::read(std::span<const iovec> pieces) {
  std::vector<iovec> left(pieces.begin(), pieces.end());
  for (std::size_t first = 0; first < left.size();) {
    const std::size_t count = std::min<std::size_t>(left.size() - first, IOV_MAX);
    const ssize_t bytes = readv(descriptor_, &left[first], static_cast<int>(count));
    if (bytes < 0 && errno == EINTR) continue;
    if (bytes < 0) fail("read", path_, errno);
    if (bytes == 0) failChanged(path_, "has shrunk");
    advance(left, first, static_cast<std::size_t>(bytes));
  }
}

void SourceFile::checkUnchanged() const {
  const struct stat now = look();
  char more = 0;
  const ssize_t count = ::read(descriptor_, &more, 1);
  if (count < 0) fail("read", path_, errno);
  const bool written = now.st_mtim.tv_sec != opened_.st_mtim.tv_sec || now.st_mtim.tv_nsec != opened_.st_mtim.tv_nsec;
  if (count > 0 || now.st_size != opened_.st_size || written) failChanged(path_, "has changed");
}

struct stat SourceFile::look() const {
  struct stat now = {};
  if (fstat(descriptor_, &now) != 0) fail("look at", path_, errno);
  return now;
}

}  // namespace vmqctl
