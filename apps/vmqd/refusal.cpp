// Why a request is not answered as asked.

#include "apps/vmqd/refusal.h"

#include "apps/vmqd/json_text.h"

namespace vmqd {
namespace {

constexpr const char* retrySeconds = "1";

}  // namespace

std::string inQuotes(std::string_view text) {
  constexpr size_t longest = 100;
  std::string result = "\"";
  if (text.size() <= longest) return result.append(text) + "\"";
  return result.append(text.substr(0, longest)) + "...\"";
}

void refuse(Reply& reply, const ErrorCode& code, std::string_view sentence, std::optional<uint32_t> status) {
  reply.status = code.status;
  reply.content_type = jsonType;
  reply.headers.clear();
  reply.stream.reset();
  if (code.name == errors::busy.name) reply.headers.emplace_back("Retry-After", retrySeconds);
  reply.text = R"({"error":{"code":)";
  appendJsonString(reply.text, code.name);
  reply.text += R"(,"message":)";
  appendJsonString(reply.text, sentence);
  if (status) {
    reply.text += R"(,"status":)";
    appendJsonNumber(reply.text, *status);
  }
  reply.text += "}}";
}

}  // namespace vmqd
