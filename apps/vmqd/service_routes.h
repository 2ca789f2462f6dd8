#pragma once
// The routes that tell about the daemon itself.

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

void answerService(Service& service, const Request& request, Reply& reply);
void answerHealth(Service& service, const Request& request, Reply& reply);

}  // namespace vmqd
