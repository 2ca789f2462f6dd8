#pragma once
// The interfaces that the process has registered.

#include "rpc.h"

namespace vmqhost {

struct RegisteredInterface {
  const rpc__if_spec* interface = nullptr;  ///< null: not found
  const void* manager = nullptr;
  bool known_in_other_version = false;  ///< when it is not found
};

/// Thread-safe; registered interfaces live as long as the process.
RegisteredInterface findInterface(const rpc__uuid& id, uint32_t version);

}  // namespace vmqhost
