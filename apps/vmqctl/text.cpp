// Escapes text for a terminal and measures it.

#include "apps/vmqctl/text.h"

#include <algorithm>
#include <clocale>
#include <cstdio>
#include <cwchar>
#include <iterator>

namespace vmqctl {
namespace {

struct Character {
  char32_t code = 0;
  std::size_t bytes = 1;
  bool valid = false;
};

/// The first character of a text that is not empty. Overlong forms, surrogates and values above U+10FFFF are not valid.
Character decode(std::string_view text) {
  const auto byte = [&](std::size_t i) { return i < text.size() ? static_cast<unsigned char>(text[i]) : 0U; };
  const unsigned first = byte(0);
  if (first < 0x80) return {first, 1, true};
  const std::size_t length = first >= 0xF0 ? 4 : first >= 0xE0 ? 3 : 2;
  if (first < 0xC2 || first > 0xF4) return {};
  char32_t code = first & (0xFFU >> (length + 1));
  for (std::size_t i = 1; i < length; ++i) {
    if ((byte(i) & 0xC0U) != 0x80) return {};
    code = (code << 6) | (byte(i) & 0x3FU);
  }
  constexpr char32_t smallest[] = {0, 0, 0x80, 0x800, 0x10000};
  if (code < smallest[length] || code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) return {};
  return {code, length, true};
}

/// Characters that wcwidth counts as printable and that still make a line read as what it is not.
bool misleads(char32_t code) {
  struct Range {
    char32_t first, last;
  };
  static constexpr Range ranges[] = {
      {0x00AD, 0x00AD},    // soft hyphen
      {0x061C, 0x061C},    // direction of writing
      {0x200B, 0x200F},    // no width; direction of writing
      {0x2028, 0x202E},    // line and paragraph ends; direction of writing
      {0x2060, 0x206F},    // no width; direction of writing
      {0xFEFF, 0xFEFF},    // no width
      {0xFFF9, 0xFFFB},    // annotations
      {0xE0000, 0xE007F},  // tags
  };
  return std::any_of(std::begin(ranges), std::end(ranges),
                     [code](const Range& range) { return code >= range.first && code <= range.last; });
}

int columns(char32_t code) {
  return wcwidth(static_cast<wchar_t>(code));
}

std::string byteEscape(unsigned value) {
  char text[8];
  (void)std::snprintf(text, sizeof text, "\\x%02x", value & 0xFF);  // fits
  return text;
}

std::string characterEscape(char32_t code) {
  char text[16];
  (void)std::snprintf(text, sizeof text, "\\u{%x}", static_cast<unsigned>(code));  // fits: six digits at most
  return text;
}

std::string escapedCharacter(char32_t code) {
  switch (code) {
    case '\n':
      return "\\n";
    case '\t':
      return "\\t";
    case '\r':
      return "\\r";
    case '\\':
      return "\\\\";
    default:
      break;
  }
  return code < 0x80 ? byteEscape(code) : characterEscape(code);
}

}  // namespace

std::string escaped(std::string_view text, Charset charset) {
  std::string result;
  result.reserve(text.size());
  while (!text.empty()) {
    const Character c = decode(text);
    const std::string_view bytes = text.substr(0, c.bytes);
    text.remove_prefix(c.bytes);
    if (!c.valid) {
      result += byteEscape(static_cast<unsigned char>(bytes.front()));
    } else if (c.code < 0x80 ? c.code >= ' ' && c.code < 0x7F && c.code != '\\'
                             : charset == Charset::Utf8 && columns(c.code) >= 0 && !misleads(c.code)) {
      result += bytes;
    } else {
      result += escapedCharacter(c.code);
    }
  }
  return result;
}

std::string counted(std::uint64_t count, const char* what) {
  return std::to_string(count) + " " + what + (count == 1 ? "" : "s");
}

Extent within(std::string_view text, std::size_t limit) {
  Extent extent;
  while (extent.bytes < text.size()) {
    const Character c = decode(text.substr(extent.bytes));
    const std::size_t width = c.code < 0x80 ? 1 : static_cast<std::size_t>(std::max(0, columns(c.code)));
    if (width > limit - extent.columns) break;
    extent.columns += width;
    extent.bytes += c.bytes;
  }
  return extent;
}

std::size_t displayWidth(std::string_view text) {
  return within(text, std::string_view::npos).columns;
}

void useUtf8Characters() {
  // Without it wcwidth knows ASCII only and everything else is shown escaped: less pretty, as safe.
  (void)std::setlocale(LC_CTYPE, "C.UTF-8");
}

}  // namespace vmqctl
