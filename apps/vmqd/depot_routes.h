#pragma once
// The route that tells what has arrived in the depot.

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

/// Reads the whole file on the calling thread; that of a large one takes long.
void answerDepotFile(Service& service, const Request& request, Reply& reply);

}  // namespace vmqd
