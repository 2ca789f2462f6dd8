#pragma once
// Why a request is not answered as asked.

#include <cstdint>
#include <optional>
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
inline constexpr ErrorCode notFound{404, "not_found"};
inline constexpr ErrorCode methodNotAllowed{405, "method_not_allowed"};
inline constexpr ErrorCode bodyTooLarge{413, "body_too_large"};
inline constexpr ErrorCode fault{422, "fault"};
inline constexpr ErrorCode internal{500, "internal"};
inline constexpr ErrorCode busy{503, "busy"};
}  // namespace errors

/// what() is one sentence for the client.
class Refusal : public std::runtime_error {
 public:
  /// `status`: a number that goes with the code, if it has one.
  Refusal(ErrorCode code, const std::string& sentence, std::optional<uint32_t> status = std::nullopt)
      : std::runtime_error(sentence), code_(code), status_(status) {}
  [[nodiscard]] const ErrorCode& code() const { return code_; }
  [[nodiscard]] std::optional<uint32_t> status() const { return status_; }

 private:
  ErrorCode code_;
  std::optional<uint32_t> status_;
};

/// A text of the client's inside a sentence: in quotes, and cut when it is long.
std::string inQuotes(std::string_view text);

/// Makes the reply {"error":{"code":...,"message":...}}, with a "status" when there is one, whatever it was before. One
/// that is busy tells when to come again.
void refuse(Reply& reply, const ErrorCode& code, std::string_view sentence,
            std::optional<uint32_t> status = std::nullopt);

}  // namespace vmqd
