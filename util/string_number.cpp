// Texts that are decimal integers.

#include <cerrno>
#include <climits>
#include <cstdint>
#include <cstdlib>

#include "util/string.h"
#include "util/trace.h"

namespace VMQ {

namespace {

RAS1_Unit traceUnit{"util/string_number"};

enum class Verdict { NUMBER, NOT_A_NUMBER, TOO_LARGE };

Verdict parse(const String& s, int64_t& value) {
  static_assert(sizeof(long) == sizeof(int64_t));
  const std::string text = s.toNarrow();
  char* end = nullptr;
  errno = 0;
  value = std::strtol(text.c_str(), &end, 10);
  if (*end != 0) return Verdict::NOT_A_NUMBER;
  if (errno == ERANGE && (value == INT64_MAX || value == INT64_MIN)) return Verdict::TOO_LARGE;
  // Just the two limits of 32 bits are refused; what lies beyond them is not.
  if (value == INT32_MAX || value == INT32_MIN) return Verdict::TOO_LARGE;
  return Verdict::NUMBER;
}

}  // namespace

bool String::isNumber(const String& s) {
  const Trace trace(traceUnit);
  int64_t value = 0;
  return parse(s, value) == Verdict::NUMBER;
}

bool String::convertToInt(const String& s, int* out) {
  const Trace trace(traceUnit);
  *out = 0;
  int64_t value = 0;
  switch (parse(s, value)) {
    case Verdict::NOT_A_NUMBER:
      TRACE_ERROR(trace, "Can't convert, buffer is not number: %s", s.c_str().get());
      return false;
    case Verdict::TOO_LARGE:
      TRACE_ERROR(trace, "Can't convert, number is too large: %s", s.c_str().get());
      return false;
    case Verdict::NUMBER:
      break;
  }
  *out = static_cast<int>(static_cast<uint32_t>(value));
  return true;
}

}  // namespace VMQ
