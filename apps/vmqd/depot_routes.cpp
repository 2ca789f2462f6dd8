// The route that tells what has arrived in the depot.

#include "apps/vmqd/depot_routes.h"

#include "apps/vmqd/file_digest.h"
#include "apps/vmqd/json_text.h"
#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

bool hasParentComponent(std::string_view path) {
  return ("/" + std::string(path) + "/").find("/../") != std::string::npos;
}

/// The component's depot is the home when none is set.
const std::string& depotOf(const ServiceSettings& settings) {
  return settings.depot.empty() ? settings.home : settings.depot;
}

}  // namespace

void answerDepotFile(Service& service, const Request& request, Reply& reply) {
  const std::string_view path = request.parameters[0];
  if (path.empty()) throw Refusal(errors::badRequest, "The path of the file is missing.");
  if (hasParentComponent(path)) throw Refusal(errors::badRequest, inQuotes(path) + " leads out of its directory.");
  const auto digest = digestOf(depotOf(service.settings) + "/" + std::string(path));
  if (!digest) throw Refusal(errors::notFound, "There is no file " + inQuotes(path) + " in the depot.");
  reply.text = R"({"path":)";
  appendJsonString(reply.text, path);
  reply.text += R"(,"size":)";
  appendJsonNumber(reply.text, static_cast<long long>(digest->size));
  reply.text += R"(,"sha256":)";
  appendJsonString(reply.text, digest->sha256);
  reply.text += '}';
}

}  // namespace vmqd
