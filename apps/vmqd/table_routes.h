#pragma once
// The routes that list, query and watch tables.

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

void answerTables(Service& service, const Request& request, Reply& reply);
/// Runs the table's sampling on the calling thread; it may take long.
void answerQuery(Service& service, const Request& request, Reply& reply);
/// Opens the watch; the reply's stream delivers it.
void answerEvents(Service& service, const Request& request, Reply& reply);

}  // namespace vmqd
