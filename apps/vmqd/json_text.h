#pragma once
// Text as JSON, written straight into the reply.

#include <cstddef>
#include <string>
#include <string_view>

namespace vmqd {

/// The bytes of the UTF-8 character that the text begins with; 0 when it begins with none (or is empty).
size_t utf8CharacterBytes(std::string_view text);
bool isUtf8(std::string_view text);

/// Appends the text in quotes and escaped; a byte that is not UTF-8 becomes U+FFFD.
void appendJsonString(std::string& out, std::string_view text);
void appendJsonNumber(std::string& out, long long number);

}  // namespace vmqd
