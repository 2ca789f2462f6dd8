// The Unix socket that clients connect to.

#include "apps/vmqd/listening_socket.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <stdexcept>
#include <utility>

#include "apps/vmqd/log.h"
#include "apps/vmqd/socket_access.h"

namespace vmqd {
namespace {

[[noreturn]] void fail(const std::string& text) {
  throw std::runtime_error(text);
}

[[noreturn]] void fail(const std::string& text, int error) {
  throw std::runtime_error(withReason(text, error));
}

bool isTrusted(uid_t owner) {
  return owner == 0 || owner == geteuid();
}

/// Whoever may rename files in the directory can put a socket of their own there.
void checkDirectory(const std::string& directory) {
  struct stat status;
  if (stat(directory.c_str(), &status) != 0) fail("the directory of the socket, " + directory, errno);
  if (!S_ISDIR(status.st_mode)) fail("the directory of the socket, " + directory + ", is not a directory");
  if (!isTrusted(status.st_uid)) {
    fail("the directory of the socket, " + directory + ", belongs to the user " + std::to_string(status.st_uid));
  }
  if ((status.st_mode & S_IWOTH) != 0 && (status.st_mode & S_ISVTX) == 0) {
    fail("every user may write to the directory of the socket, " + directory + ", and it has no sticky bit");
  }
}

sockaddr_un addressOf(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof address.sun_path) fail("the path of the socket, " + path, ENAMETOOLONG);
  std::memcpy(address.sun_path, path.data(), path.size());
  return address;
}

Descriptor newSocket() {
  Descriptor descriptor(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  if (!descriptor) fail("no socket", errno);
  return descriptor;
}

bool somebodyListens(const std::string& path) {
  const Descriptor probe = newSocket();
  const sockaddr_un address = addressOf(path);
  return connect(probe.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
}

}  // namespace

ListeningSocket::ListeningSocket(std::string path, const std::vector<uid_t>& guests) : path_(std::move(path)) {
  checkDirectory(std::filesystem::path(path_).parent_path().string());
  lock();
  removeStale();
  bindAndListen(guests);
}

ListeningSocket::~ListeningSocket() {
  remove();
}

/// The lock file is never removed: a process that waits to lock a removed file would hold a lock that nobody else sees.
void ListeningSocket::lock() {
  const std::string file = path_ + ".lock";
  lock_ = Descriptor(open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, S_IRUSR | S_IWUSR));
  struct stat status;
  if (!lock_ || fstat(lock_.get(), &status) != 0) fail("the lock " + file, errno);
  if (!S_ISREG(status.st_mode) || !isTrusted(status.st_uid)) fail("the lock " + file + " is not a file of our own");
  if (flock(lock_.get(), LOCK_EX | LOCK_NB) == 0) return;
  if (errno == EWOULDBLOCK) fail("another vmqd is running on " + path_);
  fail("the lock " + file, errno);
}

void ListeningSocket::removeStale() const {
  struct stat status;
  if (lstat(path_.c_str(), &status) != 0) {
    if (errno == ENOENT) return;
    fail("the socket " + path_, errno);
  }
  if (!S_ISSOCK(status.st_mode)) fail(path_ + " exists and is not a socket");
  if (!isTrusted(status.st_uid)) {
    fail("the socket " + path_ + " belongs to the user " + std::to_string(status.st_uid));
  }
  if (somebodyListens(path_)) fail("another process listens on " + path_);
  if (unlink(path_.c_str()) != 0) fail("the stale socket " + path_, errno);
}

void ListeningSocket::bindAndListen(const std::vector<uid_t>& guests) {
  descriptor_ = newSocket();
  // The file takes over the mode of the socket, so it is never open to others, whatever the umask.
  if (fchmod(descriptor_.get(), S_IRUSR | S_IWUSR) != 0) fail("the mode of the socket", errno);
  const sockaddr_un address = addressOf(path_);
  if (bind(descriptor_.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
      lstat(path_.c_str(), &bound_) != 0) {
    fail("the socket " + path_, errno);
  }
  const auto undo = [&](const std::string& text, int error) {
    remove();
    fail(text, error);
  };
  if ((bound_.st_mode & (S_IRWXG | S_IRWXO)) != 0) undo("the mode of the socket " + path_, EPERM);
  if (!guests.empty()) {
    if (const int error = admitUsers(path_, guests)) undo("admitting allowed_uids to the socket " + path_, error);
  }
  if (listen(descriptor_.get(), SOMAXCONN) != 0) undo("the socket " + path_, errno);
}

void ListeningSocket::refuseFurther() {
  (void)shutdown(descriptor_.get(), SHUT_RDWR);  // at worst clients wait until the process ends
}

void ListeningSocket::remove() const {
  struct stat status;
  if (lstat(path_.c_str(), &status) != 0 || status.st_dev != bound_.st_dev || status.st_ino != bound_.st_ino) return;
  if (unlink(path_.c_str()) != 0) logWarning(withReason("cannot remove the socket " + path_, errno));
}

}  // namespace vmqd
