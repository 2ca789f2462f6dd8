// The route that carries remote calls.

#include "apps/vmqd/rpc_routes.h"

#include <charconv>
#include <cstdio>
#include <optional>

#include "apps/vmqd/refusal.h"
#include "rpc_client.h"

namespace vmqd {
namespace {

std::optional<uint32_t> numberIn(std::string_view text) {
  uint32_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc() || end != text.data() + text.size()) return std::nullopt;
  return number;
}

uint32_t versionOf(const Request& request) {
  uint32_t version = 1;
  for (const Argument& argument : request.arguments) {
    if (argument.name != "version")
      throw Refusal(errors::badRequest, "There is no argument " + inQuotes(argument.name) + ".");
    const auto number = numberIn(argument.value);
    if (!number) throw Refusal(errors::badRequest, inQuotes(argument.value) + " is not the number of a version.");
    version = *number;
  }
  return version;
}

rpc__drep senderOf(const Request& request) {
  if (const auto sender = vmqhost::parseLabel(request.representation)) return *sender;
  const std::string header = std::string("The header ") + representationHeader;
  if (request.representation.empty()) throw Refusal(errors::badRequest, header + " is missing.");
  throw Refusal(errors::badRequest, header + " is " + inQuotes(request.representation) +
                                        ", but only 00000000, 10000000, 01000000 and 11000000 are known.");
}

const char* meaningOf(uint32_t fault) {
  switch (fault) {
    case rpc__fault_invalid_bound:
      return "a count or an index in the packet does not fit, or the packet is shorter than its counts say";
    case rpc__fault_no_memory:
      return "there is no memory for the call";
    default:
      return "the called routine has failed";
  }
}

Refusal refusalOf(uint32_t fault) {
  char number[16];
  (void)std::snprintf(number, sizeof number, "0x%08x", fault);
  return Refusal(errors::fault, std::string("The call ended with the fault ") + number + ": " + meaningOf(fault) + ".",
                 fault);
}

Refusal unknownInterface(std::string_view text) {
  return Refusal(errors::notFound, "There is no interface " + inQuotes(text) + ".");
}

Refusal unknownOperation(std::string_view text) {
  return Refusal(errors::notFound, "The interface has no operation " + inQuotes(text) + ".");
}

}  // namespace

void answerCall(Service&, const Request& request, Reply& reply) {
  const auto& [interface, operation] = request.parameters;
  const uint32_t version = versionOf(request);
  const rpc__drep sender = senderOf(request);
  const auto id = vmqhost::parseUuid(interface);
  if (!id) throw unknownInterface(interface);
  const auto number = numberIn(operation);
  if (!number) throw unknownOperation(operation);
  vmqhost::RpcResult result = vmqhost::call({*id, version, *number, sender, request.body});
  switch (result.outcome) {
    case vmqhost::RpcResult::kReplied:
      break;
    case vmqhost::RpcResult::kFault:
      throw refusalOf(result.fault);
    case vmqhost::RpcResult::kUnknownInterface:
      throw unknownInterface(interface);
    case vmqhost::RpcResult::kUnknownVersion:
      throw Refusal(errors::notFound, "The interface has no version " + std::to_string(version) + ".");
    case vmqhost::RpcResult::kUnknownOperation:
      throw unknownOperation(operation);
  }
  reply.text = std::move(result.reply);
  reply.content_type = "application/octet-stream";
  reply.headers.emplace_back(representationHeader, vmqhost::labelOf(result.representation));
}

}  // namespace vmqd
