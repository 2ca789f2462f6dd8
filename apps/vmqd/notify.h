#pragma once
// The readiness protocol of service managers: datagrams to the socket that NOTIFY_SOCKET names.

#include <string>
#include <string_view>

namespace vmqd {

class ServiceManager {
 public:
  /// Takes NOTIFY_SOCKET out of the environment, so that no child speaks in this process's name. Without it nothing is
  /// ever sent. REQUIRES: no other threads yet.
  ServiceManager();

  /// Sends "READY=1" or the like. Returns 0, or an errno value: the service manager may have gone.
  [[nodiscard]] int notify(std::string_view state) const;

 private:
  std::string socket_;  ///< a path, or "@NAME" in the abstract name space; empty without a service manager
};

}  // namespace vmqd
