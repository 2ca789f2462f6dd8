// Who is at the other end of a Unix socket, and who may be.

#include "apps/vmqd/peer_credentials.h"

#include <unistd.h>

#include <algorithm>
#include <utility>

namespace vmqd {

std::optional<ucred> peerOf(int descriptor) {
  ucred peer{};
  socklen_t length = sizeof peer;
  if (getsockopt(descriptor, SOL_SOCKET, SO_PEERCRED, &peer, &length) != 0) return std::nullopt;
  if (peer.uid == static_cast<uid_t>(-1)) return std::nullopt;
  return peer;
}

AdmittedUsers::AdmittedUsers(std::vector<uid_t> listed) : users_(std::move(listed)) {
  users_.push_back(0);
  users_.push_back(geteuid());
}

bool AdmittedUsers::admits(uid_t user) const {
  return std::find(users_.begin(), users_.end(), user) != users_.end();
}

}  // namespace vmqd
