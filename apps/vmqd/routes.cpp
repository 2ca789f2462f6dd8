// Every route of the interface, as data.

#include "apps/vmqd/routes.h"

#include <exception>
#include <optional>

#include "apps/vmqd/refusal.h"
#include "apps/vmqd/service_routes.h"
#include "apps/vmqd/table_routes.h"

namespace vmqd {
namespace {

constexpr Route table[] = {
    {"GET", "/v1", answerService},
    {"GET", "/v1/health", answerHealth},
    {"GET", "/v1/tables", answerTables},
    {"POST", "/v1/tables/{table}/query", answerQuery},
    {"GET", "/v1/tables/{table}/events", answerEvents},
};

/// What stands where the pattern has its parameter ("" when it has none); nothing when the path does not match.
std::optional<std::string_view> match(std::string_view pattern, std::string_view path) {
  const size_t open = pattern.find('{');
  if (open == std::string_view::npos) {
    return pattern == path ? std::optional<std::string_view>("") : std::nullopt;
  }
  const std::string_view before = pattern.substr(0, open);
  const std::string_view after = pattern.substr(pattern.find('}') + 1);
  if (path.size() <= before.size() + after.size()) return std::nullopt;
  if (path.substr(0, before.size()) != before || path.substr(path.size() - after.size()) != after) return std::nullopt;
  const std::string_view parameter = path.substr(before.size(), path.size() - before.size() - after.size());
  if (parameter.find('/') != std::string_view::npos) return std::nullopt;
  return parameter;
}

void dispatch(Service& service, Request& request, Reply& reply) {
  for (const Route& route : table) {
    const auto parameter = match(route.path, request.path);
    if (!parameter) continue;
    if (route.method == request.method) {
      request.parameter = *parameter;
      return route.answer(service, request, reply);
    }
    if (!reply.allow.empty()) reply.allow += ", ";
    reply.allow += route.method;
  }
  if (reply.allow.empty()) throw Refusal(errors::unknownRoute, "There is nothing at " + inQuotes(request.path) + ".");
  throw Refusal(errors::methodNotAllowed, inQuotes(request.path) + " only knows the method " + reply.allow + ".");
}

}  // namespace

std::span<const Route> routes() {
  return table;
}

void answer(Service& service, Request& request, Reply& reply) {
  try {
    dispatch(service, request, reply);
  } catch (const Refusal& refusal) {
    refuse(reply, refusal.code(), refusal.what());
  } catch (const std::exception& error) {
    refuse(reply, errors::internal, std::string("The daemon failed: ") + error.what() + ".");
  }
}

}  // namespace vmqd
