// Every route of the interface, as data.

#include "apps/vmqd/routes.h"

#include <array>
#include <exception>

#include "apps/vmqd/depot_routes.h"
#include "apps/vmqd/refusal.h"
#include "apps/vmqd/rpc_routes.h"
#include "apps/vmqd/service_routes.h"
#include "apps/vmqd/table_routes.h"

namespace vmqd {
namespace {

constexpr Route table[] = {
    {"GET", "/v1", answerService, Body::kText, Arguments::kNone},
    {"GET", "/v1/health", answerHealth, Body::kText, Arguments::kNone},
    {"GET", "/v1/tables", answerTables, Body::kText, Arguments::kNone},
    {"POST", "/v1/tables/{table}/query", answerQuery, Body::kText, Arguments::kNone},
    {"GET", "/v1/tables/{table}/events", answerEvents, Body::kText, Arguments::kSome},
    {"POST", "/v1/rpc/{interface}/{operation}", answerCall, Body::kPacket, Arguments::kSome},
    {"GET", "/v1/depot/{path}", answerDepotFile, Body::kText, Arguments::kNone},
};

constexpr std::string_view restParameter = "{path}";

/// Takes the text up to the first "/", which stays.
std::string_view takeSegment(std::string_view& text) {
  const std::string_view segment = text.substr(0, text.find('/'));
  text.remove_prefix(segment.size());
  return segment;
}

/// True when the path matches the pattern; then its parameters are set.
bool match(std::string_view pattern, std::string_view path, std::array<std::string_view, 2>& parameters) {
  size_t parameter = 0;
  while (!pattern.empty() && !path.empty()) {
    if (pattern.front() != '/' || path.front() != '/') return false;
    pattern.remove_prefix(1);
    path.remove_prefix(1);
    const std::string_view expected = takeSegment(pattern);
    if (expected == restParameter) {
      parameters[parameter] = path;
      return true;
    }
    const std::string_view segment = takeSegment(path);
    if (expected.substr(0, 1) == "{") {
      if (segment.empty()) return false;
      parameters[parameter++] = segment;
    } else if (segment != expected) {
      return false;
    }
  }
  return pattern.empty() && path.empty();
}

void answerBy(const Route& route, Service& service, const Request& request, Reply& reply) {
  if (route.arguments == Arguments::kNone && !request.arguments.empty()) {
    throw Refusal(errors::badRequest, inQuotes(request.path) + " takes no arguments, but it was given " +
                                          inQuotes(request.arguments.front().name) + ".");
  }
  route.answer(service, request, reply);
}

void dispatch(Service& service, Request& request, Reply& reply) {
  std::string allowed;
  for (const Route& route : table) {
    if (!match(route.path, request.path, request.parameters)) continue;
    if (route.method == request.method) return answerBy(route, service, request, reply);
    if (!allowed.empty()) allowed += ", ";
    allowed += route.method;
  }
  if (allowed.empty()) throw Refusal(errors::unknownRoute, "There is nothing at " + inQuotes(request.path) + ".");
  refuse(reply, errors::methodNotAllowed, inQuotes(request.path) + " only knows the method " + allowed + ".");
  reply.headers.emplace_back("Allow", allowed);
}

}  // namespace

std::span<const Route> routes() {
  return table;
}

bool carriesPacket(std::string_view method, std::string_view path) {
  std::array<std::string_view, 2> ignored;
  for (const Route& route : table) {
    if (route.method == method && match(route.path, path, ignored)) return route.body == Body::kPacket;
  }
  return false;
}

void answer(Service& service, Request& request, Reply& reply) {
  try {
    dispatch(service, request, reply);
  } catch (const Refusal& refusal) {
    refuse(reply, refusal.code(), refusal.what(), refusal.status());
  } catch (const std::exception& error) {
    refuse(reply, errors::internal, std::string("The daemon failed: ") + error.what() + ".");
  }
}

}  // namespace vmqd
