#pragma once
// The route that carries remote calls.

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

/// Makes the call on the calling thread; it may take long.
void answerCall(Service& service, const Request& request, Reply& reply);

}  // namespace vmqd
