// Text as JSON.

#include "apps/vmqd/json_text.h"

#include <array>
#include <charconv>

namespace vmqd {
namespace {

/// True for the bytes that stand for themselves in a JSON text.
constexpr auto plainBytes = [] {
  std::array<bool, 256> plain{};
  for (unsigned byte = 0x20; byte < 0x80; ++byte) plain[byte] = byte != '"' && byte != '\\';
  return plain;
}();

constexpr std::string_view replacementCharacter = "\xEF\xBF\xBD";

void appendEscaped(std::string& out, char c) {
  constexpr char digits[] = "0123456789abcdef";
  switch (c) {
    case '"':
      out += "\\\"";
      break;
    case '\\':
      out += "\\\\";
      break;
    case '\n':
      out += "\\n";
      break;
    case '\r':
      out += "\\r";
      break;
    case '\t':
      out += "\\t";
      break;
    default:
      out += "\\u00";
      out += digits[static_cast<unsigned char>(c) >> 4];
      out += digits[c & 0xF];
  }
}

bool isContinuation(char c) {
  return (static_cast<unsigned char>(c) & 0xC0) == 0x80;
}

}  // namespace

size_t utf8CharacterBytes(std::string_view text) {
  if (text.empty()) return 0;
  const auto first = static_cast<unsigned char>(text[0]);
  if (first < 0x80) return 1;
  const size_t length = first >= 0xC2 && first <= 0xDF   ? 2
                        : (first & 0xF0) == 0xE0         ? 3
                        : first >= 0xF0 && first <= 0xF4 ? 4
                                                         : 0;
  if (length == 0 || text.size() < length) return 0;
  for (size_t index = 1; index < length; ++index) {
    if (!isContinuation(text[index])) return 0;
  }
  const auto second = static_cast<unsigned char>(text[1]);
  // Longer than needed, a surrogate, or above U+10FFFF.
  if ((first == 0xE0 && second < 0xA0) || (first == 0xED && second > 0x9F)) return 0;
  if ((first == 0xF0 && second < 0x90) || (first == 0xF4 && second > 0x8F)) return 0;
  return length;
}

bool isUtf8(std::string_view text) {
  while (!text.empty()) {
    const size_t bytes = utf8CharacterBytes(text);
    if (bytes == 0) return false;
    text.remove_prefix(bytes);
  }
  return true;
}

void appendJsonString(std::string& out, std::string_view text) {
  out += '"';
  while (!text.empty()) {
    size_t run = 0;
    while (run < text.size() && plainBytes[static_cast<unsigned char>(text[run])]) ++run;
    out.append(text.data(), run);
    text.remove_prefix(run);
    if (text.empty()) break;
    const size_t bytes = utf8CharacterBytes(text);
    if (bytes == 0) {
      out += replacementCharacter;
    } else if (bytes == 1) {
      appendEscaped(out, text[0]);
    } else {
      out.append(text.data(), bytes);
    }
    text.remove_prefix(bytes == 0 ? 1 : bytes);
  }
  out += '"';
}

void appendJsonNumber(std::string& out, long long number) {
  char digits[24];
  out.append(digits, std::to_chars(digits, digits + sizeof digits, number).ptr);
}

}  // namespace vmqd
