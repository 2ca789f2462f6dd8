// Identifiers and data-representation labels as text.

#include "rpc_client.h"

namespace vmqhost {
namespace {

/// The value of a hexadecimal digit, -1 for anything else.
int digitValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

}  // namespace

std::optional<rpc__uuid> parseUuid(std::string_view text) {
  constexpr std::string_view form = "xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx";
  if (text.size() != form.size()) return std::nullopt;
  rpc__uuid id{};
  unsigned digits = 0;
  for (size_t index = 0; index < form.size(); ++index) {
    if (form[index] == '-') {
      if (text[index] != '-') return std::nullopt;
      continue;
    }
    const int value = digitValue(text[index]);
    if (value < 0) return std::nullopt;
    uint8_t& byte = id.bytes[digits++ / 2];
    byte = static_cast<uint8_t>(byte << 4 | value);
  }
  return id;
}

std::optional<rpc__drep> parseLabel(std::string_view text) {
  constexpr std::string_view rest = "000000";
  if (text.size() != 8 || text.substr(2) != rest) return std::nullopt;
  const int integers = digitValue(text[0]);
  const int characters = digitValue(text[1]);
  if (integers < 0 || integers > rpc__little_endian || characters < 0 || characters > rpc__ebcdic) return std::nullopt;
  return rpc__drep{static_cast<rpc__integers>(integers), static_cast<rpc__characters>(characters)};
}

std::string labelOf(const rpc__drep& representation) {
  std::string label = "00000000";
  label[0] = static_cast<char>('0' + representation.integers);
  label[1] = static_cast<char>('0' + representation.characters);
  return label;
}

}  // namespace vmqhost
