// The routes that tell about the daemon itself.

#include "apps/vmqd/service_routes.h"

#include "apps/vmqd/json_text.h"

namespace vmqd {

void answerService(Service& service, const Request&, Reply& reply) {
  reply.text = R"({"version":")" VMQ_VERSION R"(","node":)";
  appendJsonString(reply.text, service.settings.node);
  reply.text += R"(,"home":)";
  appendJsonString(reply.text, service.settings.home);
  reply.text += R"(,"depot":)";
  appendJsonString(reply.text, service.settings.depot);
  reply.text += R"(,"maximum_packet_bytes":)";
  appendJsonNumber(reply.text, service.settings.maximum_packet_bytes);
  reply.text += '}';
}

void answerHealth(Service& service, const Request&, Reply& reply) {
  const auto uptime = std::chrono::steady_clock::now() - service.started;
  reply.text = R"({"status":"ok","uptime_seconds":)";
  appendJsonNumber(reply.text, std::chrono::duration_cast<std::chrono::seconds>(uptime).count());
  reply.text += R"(,"watchers":)";
  appendJsonNumber(reply.text, service.watchers.taken());
  reply.text += '}';
}

}  // namespace vmqd
