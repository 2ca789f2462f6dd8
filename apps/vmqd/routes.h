#pragma once
// Every route of the interface, as data. docs/api.yaml describes them.

#include <span>
#include <string_view>

#include "apps/vmqd/reply.h"
#include "apps/vmqd/service.h"

namespace vmqd {

/// What the body of a request is; each kind has limits of its own.
enum class Body { kText, kPacket };

/// Whether the query string may hold any; a route that takes some refuses those it does not know.
enum class Arguments { kNone, kSome };

struct Route {
  std::string_view method;
  /// With up to two "{parameter}"s, each of which stands for one segment; "{path}" stands for all that follows, which
  /// may be nothing.
  std::string_view path;
  void (*answer)(Service& service, const Request& request, Reply& reply);
  Body body;
  Arguments arguments;
};

/// Routes with the same path stand next to each other.
std::span<const Route> routes();

/// True when the route of such a request has a packet for its body.
bool carriesPacket(std::string_view method, std::string_view path);

/// Answers a request by its route. Whatever goes wrong becomes an error reply. Throws nothing but std::bad_alloc.
void answer(Service& service, Request& request, Reply& reply);

}  // namespace vmqd
