#pragma once
// Who is at the other end of a Unix socket, and who may be.

#include <sys/socket.h>
#include <sys/types.h>

#include <optional>
#include <vector>

namespace vmqd {

/// The process that connected, as the kernel noted it then; nothing when the descriptor is no connected Unix socket.
std::optional<ucred> peerOf(int descriptor);

/// Root, the user that this process runs as, and those listed.
class AdmittedUsers {
 public:
  explicit AdmittedUsers(std::vector<uid_t> listed);

  [[nodiscard]] bool admits(uid_t user) const;

 private:
  std::vector<uid_t> users_;
};

}  // namespace vmqd
