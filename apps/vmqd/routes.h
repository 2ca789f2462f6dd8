#pragma once
// Every route of the interface, as data. docs/api.yaml describes them.

#include <span>
#include <string_view>

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

struct Route {
  std::string_view method;
  std::string_view path;  ///< with at most one "{parameter}", which stands for one segment
  void (*answer)(Service& service, const Request& request, Reply& reply);
};

/// Routes with the same path stand next to each other.
std::span<const Route> routes();

/// Answers a request by its route. Whatever goes wrong becomes an error reply. Throws nothing but std::bad_alloc.
void answer(Service& service, Request& request, Reply& reply);

}  // namespace vmqd
