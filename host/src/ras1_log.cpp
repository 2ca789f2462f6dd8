// The trace log's descriptor.

#include "ras1_log.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <ctime>

namespace vmqhost {

namespace {

constexpr mode_t kLogMode = 0640;  // commands and their output may be nobody else's business
constexpr int kFullPipeMilliseconds = 1000;

/// Where lines go now: standard error or logDescriptor.
constinit std::atomic<int> currentDescriptor{STDERR_FILENO};

/// A number of our own, kept from the first log on: another log is put under the same number, so that a line that is
/// being written meanwhile never meets a closed, or somebody else's, descriptor. -1 before the first log.
int logDescriptor = -1;

/// Keeps a reader that went away from ending the host with a signal.
class SigpipeBlocked {
 public:
  SigpipeBlocked() {
    sigset_t pending;
    sigemptyset(&sigpipe_);
    sigaddset(&sigpipe_, SIGPIPE);
    (void)sigpending(&pending);  // cannot fail with these arguments, nor can the call below
    was_pending_ = sigismember(&pending, SIGPIPE) == 1;
    (void)pthread_sigmask(SIG_BLOCK, &sigpipe_, &before_);
  }
  ~SigpipeBlocked() {
    if (raised_ && !was_pending_) {
      const timespec none{};
      while (sigtimedwait(&sigpipe_, nullptr, &none) < 0 && errno == EINTR) {
      }
    }
    (void)pthread_sigmask(SIG_SETMASK, &before_, nullptr);
  }
  SigpipeBlocked(const SigpipeBlocked&) = delete;
  SigpipeBlocked& operator=(const SigpipeBlocked&) = delete;

  void raised() { raised_ = true; }

 private:
  sigset_t sigpipe_;
  sigset_t before_;
  bool was_pending_;
  bool raised_ = false;
};

bool writable(int descriptor) {
  pollfd wait{descriptor, POLLOUT, 0};
  return poll(&wait, 1, kFullPipeMilliseconds) == 1 && (wait.revents & POLLOUT) != 0;
}

}  // namespace

OpenedLog::~OpenedLog() {
  if (descriptor_ >= 0) (void)close(descriptor_);  // nothing was written through it
}

bool OpenedLog::open(const std::string& path, std::string& error) {
  if (path.empty()) return true;
  // O_NONBLOCK: a pipe that nobody reads is refused instead of holding the process up.
  descriptor_ = ::open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC | O_NOCTTY | O_NONBLOCK, kLogMode);
  if (descriptor_ >= 0 && descriptor_ <= STDERR_FILENO) {
    // A standard stream was closed; the log must not stand in for it.
    const int above = fcntl(descriptor_, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
    const int saved = errno;
    (void)close(descriptor_);
    descriptor_ = above;
    errno = saved;
  }
  if (descriptor_ >= 0) return true;
  error = "\"" + path + "\" cannot be opened: " + std::strerror(errno);
  return false;
}

void OpenedLog::use() {
  if (descriptor_ >= 0 && logDescriptor < 0) {
    logDescriptor = descriptor_;
    descriptor_ = -1;
    currentDescriptor = logDescriptor;
  } else if (descriptor_ >= 0) {
    (void)dup3(descriptor_, logDescriptor, O_CLOEXEC);  // both are open and different
    currentDescriptor = logDescriptor;
  } else {
    currentDescriptor = STDERR_FILENO;
    // Lets the old log go. Without a standard error there is nothing to put in its place.
    if (logDescriptor >= 0) (void)dup3(STDERR_FILENO, logDescriptor, O_CLOEXEC);
  }
}

void writeToLog(const char* line, size_t length) {
  const int descriptor = currentDescriptor.load(std::memory_order_acquire);
  SigpipeBlocked blocked;
  while (length > 0) {
    const ssize_t written = write(descriptor, line, length);
    if (written >= 0) {
      line += written;
      length -= static_cast<size_t>(written);
    } else if (errno == EPIPE) {
      return blocked.raised();
    } else if (errno != EINTR && !(errno == EAGAIN && writable(descriptor))) {
      return;  // a line that cannot be written cannot be reported either
    }
  }
}

}  // namespace vmqhost
