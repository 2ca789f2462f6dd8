// Narrow text to UTF-16 and back, in the one locale of the process.

#include <cstring>
#include <stdexcept>

#include "util/string.h"
#include "util/trace.h"

namespace VMQ {

NLS2_Locale* glbLocale = nullptr;
bool String::_initialized = false;

namespace {

RAS1_Unit traceUnit{"util/string_conversion"};

/// What a narrow text needs, its NUL included; the same number of units always suffices for it.
unsigned int sizeOf(const char* s) {
  const size_t size = std::strlen(s) + 1;
  if (size > String::NPOS) throw std::bad_array_new_length();
  return static_cast<unsigned int>(size);
}

/// Converts a narrow text of `size` bytes to at most as many units, terminates them, and returns the length.
unsigned int convert(const char* s, unsigned int size, unsigned short* units) {
  int32_t status = 0;  // whatever it says, the units are used as they come back
  const uint32_t stored = NLS2_toUTF16(glbLocale, s, size, units, size, &status);
  const unsigned int length = std::min(stored > 0 && units[stored - 1] == 0 ? stored - 1 : stored, size - 1);
  units[length] = 0;
  return length;
}

}  // namespace

bool String::initialize() {
  const Trace trace(traceUnit);
  if (glbLocale) NLS2_ReleaseLocale(glbLocale);
  glbLocale = NLS2_GetLocale(NLS2_CURRENT_LOCALE, 0);
  const int32_t codepage = glbLocale ? NLS2_GetLocaleCodepageId(glbLocale) : 0;
  TRACE_DETAIL(trace, "codepage=%d", codepage);
  if (codepage == NLS2_CP943) {
    TRACE_DETAIL(trace, "codepage NLS2_CP943 detected, switching to NLS2_CP932");
    glbLocale = NLS2_GetLocale(NLS2_BY_CODEPAGE, NLS2_CP932);
  } else if (codepage == NLS2_CP_EUCJP) {
    TRACE_DETAIL(trace, "codepage 33722 detected, switching to 1208");
    glbLocale = NLS2_GetLocale(NLS2_BY_CODEPAGE, NLS2_CP_UTF8);
  }
  return glbLocale != nullptr;
}

void String::ensureLocale() {
  if (!_initialized) [[unlikely]]
    _initialized = initialize();
}

String& String::assign(const char* s) {
  const Trace trace(traceUnit);
  if (!s || *s == 0) {
    clear();
    return *this;
  }
  ensureLocale();
  const unsigned int size = sizeOf(s);
  String converted;
  converted.units_.grow(size - 1);
  const unsigned int length = convert(s, size, &converted.units_[0]);
  if (length < converted.length()) converted.units_.remove(length + 1, converted.length() - length);
  return *this = std::move(converted);
}

String& String::assign(const char* s, unsigned int n) {
  return s ? assign(std::string(s, strnlen(s, n)).c_str()) : assign(s);
}

unsigned short* String::createUnicodeString(const char* s) {
  const Trace trace(traceUnit);
  if (!s) return nullptr;
  ensureLocale();
  const unsigned int size = sizeOf(s);
  auto* units = new unsigned short[size];
  convert(s, size, units);
  return units;
}

unsigned short* String::createUnicodeString(const char* s, unsigned int n) {
  return s ? createUnicodeString(std::string(s, strnlen(s, n)).c_str()) : nullptr;
}

CharStar String::c_str() const {
  const Trace trace(traceUnit);
  ensureLocale();
  const unsigned int size = units_.getSize();
  char* narrow = new char[size];
  int32_t status = 0;  // a text that does not fit is cut, as the header says
  NLS2_fromUTF16(glbLocale, getData(), size, narrow, size, &status);
  narrow[size - 1] = 0;
  return CharStar(CharStar::Adopt(), narrow);
}

std::string String::toNarrow() const {
  const Trace trace(traceUnit);
  ensureLocale();
  // Most texts are ASCII: the room for anything else is only made when it is needed.
  std::string narrow(length(), 0);
  int32_t status = 0;
  uint32_t bytes = NLS2_fromUTF16(glbLocale, getData(), units_.getSize(), narrow.data(), units_.getSize(), &status);
  if (status != 0) {
    const uint64_t capacity = uint64_t{units_.getSize()} * NLS2_MaximumBytesPerUnit(glbLocale) + 1;
    if (capacity > UINT32_MAX) throw std::length_error("String::toNarrow");
    narrow.resize(capacity);
    bytes =
        NLS2_fromUTF16(glbLocale, getData(), units_.getSize(), narrow.data(), static_cast<uint32_t>(capacity), &status);
  }
  narrow.resize(bytes > 0 ? bytes - 1 : 0);
  return narrow;
}

}  // namespace VMQ
