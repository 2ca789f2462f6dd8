#pragma once
// The Unix socket that clients connect to.

#include <sys/stat.h>
#include <sys/types.h>

#include <string>
#include <vector>

#include "apps/vmqd/descriptor.h"

namespace vmqd {

/// A listening socket of mode 0600, held by at most one process at a time: a lock on the file PATH.lock beside it,
/// which stays when the process ends, tells a running owner from a socket that a dead one left behind.
class ListeningSocket {
 public:
  /// Takes the path, over a stale socket too, and listens. Throws std::runtime_error, having changed nothing, when
  /// another process has the socket; when something else stands at the path; or when the directory is missing or would
  /// let other users put their own socket there. `guests` are the users, beside the owner and root, who may connect.
  ListeningSocket(std::string path, const std::vector<uid_t>& guests);
  /// Removes the socket, unless the path holds something else by now.
  ~ListeningSocket();
  ListeningSocket(const ListeningSocket&) = delete;
  ListeningSocket& operator=(const ListeningSocket&) = delete;

  [[nodiscard]] int descriptor() const { return descriptor_.get(); }
  [[nodiscard]] const std::string& path() const { return path_; }

  /// Removes the socket, unless the path holds something else by now. For an exit that destroys nothing.
  void remove() const;

  /// Clients who try to connect from now on are told at once that nobody listens. The descriptor stays open.
  void refuseFurther();

 private:
  void lock();
  void removeStale() const;
  void bindAndListen(const std::vector<uid_t>& guests);

  const std::string path_;
  Descriptor lock_;
  Descriptor descriptor_;
  struct stat bound_ {};
};

}  // namespace vmqd
