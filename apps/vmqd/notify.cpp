// The readiness protocol of service managers.

#include "apps/vmqd/notify.h"

#include <sys/socket.h>
#include <sys/un.h>

#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <cstring>

#include "apps/vmqd/descriptor.h"

namespace vmqd {

ServiceManager::ServiceManager() {
  if (const char* const socket = getenv("NOTIFY_SOCKET")) socket_ = socket;
  (void)unsetenv("NOTIFY_SOCKET");  // fails for malformed names only
}

int ServiceManager::notify(std::string_view state) const {
  if (socket_.empty()) return 0;
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (socket_.size() >= sizeof address.sun_path) return ENAMETOOLONG;
  std::memcpy(address.sun_path, socket_.data(), socket_.size());
  if (address.sun_path[0] == '@') address.sun_path[0] = '\0';
  // An abstract name counts every byte, so the length is that of the name and no terminator.
  const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + socket_.size());
  const Descriptor descriptor(socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  if (!descriptor) return errno;
  const ssize_t sent = sendto(descriptor.get(), state.data(), state.size(), MSG_NOSIGNAL,
                              reinterpret_cast<const sockaddr*>(&address), length);
  return sent < 0 ? errno : 0;
}

}  // namespace vmqd
