// Why a request is not answered as asked.

#include "apps/vmqd/refusal.h"

#include "apps/vmqd/json_text.h"

namespace vmqd {

std::string inQuotes(std::string_view text) {
  constexpr size_t longest = 100;
  std::string result = "\"";
  if (text.size() <= longest) return result.append(text) + "\"";
  return result.append(text.substr(0, longest)) + "...\"";
}

void refuse(Reply& reply, const ErrorCode& code, std::string_view sentence) {
  reply.status = code.status;
  reply.stream.reset();
  reply.text = R"({"error":{"code":)";
  appendJsonString(reply.text, code.name);
  reply.text += R"(,"message":)";
  appendJsonString(reply.text, sentence);
  reply.text += "}}";
}

}  // namespace vmqd
