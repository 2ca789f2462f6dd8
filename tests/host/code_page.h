#pragma once
// Conversions as tests want to write them.

#include <cstring>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "nls2.h"

struct ReleaseLocale {
  void operator()(NLS2_Locale* locale) const { NLS2_ReleaseLocale(locale); }
};
using Locale = std::unique_ptr<NLS2_Locale, ReleaseLocale>;

inline Locale byCodePage(int32_t id) {
  return Locale(NLS2_GetLocale(NLS2_BY_CODEPAGE, id));
}

struct Units {
  std::u16string text;
  int32_t status;
  bool operator==(const Units&) const = default;
};

struct Bytes {
  std::string text;  ///< without the terminator that every output has
  int32_t status;
  bool operator==(const Bytes&) const = default;
};

inline std::ostream& operator<<(std::ostream& out, const Units& units) {
  for (const char16_t unit : units.text) out << std::hex << static_cast<unsigned>(unit) << ' ';
  return out << "status " << units.status;
}
inline std::ostream& operator<<(std::ostream& out, const Bytes& bytes) {
  for (const char byte : bytes.text) out << std::hex << static_cast<unsigned>(static_cast<unsigned char>(byte)) << ' ';
  return out << "status " << bytes.status;
}

/// Converts with exactly `capacity` units of room, in memory that ends there.
inline Units toUnits(NLS2_Locale* locale, const std::string& bytes, size_t capacity) {
  const std::vector<char> in(bytes.begin(), bytes.end());
  std::vector<unsigned short> out(capacity);
  int32_t status = -1;
  const uint32_t stored = NLS2_toUTF16(locale, in.data(), static_cast<uint32_t>(in.size()), out.data(),
                                       static_cast<uint32_t>(capacity), &status);
  return {std::u16string(out.begin(), out.begin() + stored), status};
}
inline Units toUnits(NLS2_Locale* locale, const std::string& bytes) {
  return toUnits(locale, bytes, bytes.size());
}

/// Converts with exactly `capacity` bytes of room. "<no terminator>" when the output does not end in one.
inline Bytes fromUnits(NLS2_Locale* locale, const std::u16string& units, size_t capacity) {
  const std::vector<unsigned short> in(units.begin(), units.end());
  std::vector<char> out(capacity, '#');
  int32_t status = -1;
  const uint32_t stored = NLS2_fromUTF16(locale, in.data(), static_cast<uint32_t>(in.size()), out.data(),
                                         static_cast<uint32_t>(capacity), &status);
  if (stored == 0 || out[stored - 1] != '\0') return {"<no terminator>", status};
  return {std::string(out.data(), stored - 1), status};
}
inline Bytes fromUnits(NLS2_Locale* locale, const std::u16string& units) {
  return fromUnits(locale, units, units.size() * NLS2_MaximumBytesPerUnit(locale) + 1);
}
