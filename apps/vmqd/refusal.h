#pragma once
// Why a request is not answered as asked.

#include <stdexcept>
#include <string>
#include <string_view>

#include "apps/vmqd/reply.h"

namespace vmqd {

/// An error code of the interface and the HTTP status that goes with it.
struct ErrorCode {
  unsigned status;
  std::string_view name;
};

namespace errors {
inline constexpr ErrorCode badJson{400, "bad_json"};
inline constexpr ErrorCode badRequest{400, "bad_request"};
inline constexpr ErrorCode unknownColumn{400, "unknown_column"};
inline constexpr ErrorCode unknownOperator{400, "unknown_operator"};
inline constexpr ErrorCode notAllowed{403, "not_allowed"};
inline constexpr ErrorCode unknownTable{404, "unknown_table"};
inline constexpr ErrorCode unknownRoute{404, "unknown_route"};
inline constexpr ErrorCode methodNotAllowed{405, "method_not_allowed"};
inline constexpr ErrorCode bodyTooLarge{413, "body_too_large"};
inline constexpr ErrorCode internal{500, "internal"};
inline constexpr ErrorCode busy{503, "busy"};
}  // namespace errors

/// what() is one sentence for the client.
class Refusal : public std::runtime_error {
 public:
  Refusal(ErrorCode code, const std::string& sentence) : std::runtime_error(sentence), code_(code) {}
  [[nodiscard]] const ErrorCode& code() const { return code_; }

 private:
  ErrorCode code_;
};

/// A text of the client's inside a sentence: in quotes, and cut when it is long.
std::string inQuotes(std::string_view text);

/// Makes the reply {"error":{"code":...,"message":...}}, whatever it was before.
void refuse(Reply& reply, const ErrorCode& code, std::string_view sentence);

}  // namespace vmqd
