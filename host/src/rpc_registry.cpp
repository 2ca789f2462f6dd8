// Registration of interfaces by identifier and version.

#include "rpc_registry.h"

#include <cerrno>
#include <mutex>
#include <new>
#include <vector>

#include "seam.h"

namespace {

struct Entry {
  const rpc__if_spec* interface;
  const void* manager;
};

constinit std::mutex mutex;

/// REQUIRES: mutex held.
std::vector<Entry>& entries() {
  static auto& registered = *new std::vector<Entry>;
  return registered;
}

/// REQUIRES: mutex held.
vmqhost::RegisteredInterface find(const rpc__uuid& id, uint32_t version) {
  vmqhost::RegisteredInterface found;
  for (const Entry& each : entries()) {
    if (!(each.interface->id == id)) continue;
    if (each.interface->version == version) return {each.interface, each.manager, false};
    found.known_in_other_version = true;
  }
  return found;
}

bool acceptable(const rpc__uuid* type, const rpc__if_spec* interface, const void* manager) {
  if (type == nullptr || !(*type == rpc__nil_type) || interface == nullptr || manager == nullptr) return false;
  return interface->server_epv_locator != nullptr && interface->server_epv_locator().operations > 0;
}

uint32_t add(const rpc__if_spec* interface, const void* manager) try {
  const std::lock_guard held(mutex);
  if (find(interface->id, interface->version).interface != nullptr) return EEXIST;
  entries().push_back({interface, manager});
  return 0;
} catch (const std::bad_alloc&) {
  return ENOMEM;
}

}  // namespace

void rpc__register_mgr(const rpc__uuid* type, const rpc__if_spec* interface, const void* manager, uint32_t* status) {
  if (int failure; vmqhost::seam::fails("rpc__register_mgr", &failure)) {
    *status = static_cast<uint32_t>(failure);
  } else {
    *status = acceptable(type, interface, manager) ? add(interface, manager) : EINVAL;
  }
}

vmqhost::RegisteredInterface vmqhost::findInterface(const rpc__uuid& id, uint32_t version) {
  const std::lock_guard held(mutex);
  return find(id, version);
}
