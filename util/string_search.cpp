// Comparing, searching and slicing texts.

#include <cstring>

#include "util/string.h"
#include "util/trace.h"

namespace VMQ {

namespace {

RAS1_Unit traceUnit{"util/string_search"};

bool areEqual(const unsigned short* a, const unsigned short* b, size_t count) {
  return std::memcmp(a, b, count * sizeof *a) == 0;
}

}  // namespace

int String::compare(const unsigned short* a, const unsigned short* b) {
  for (;; ++a, ++b) {
    if (*a == 0 || *b == 0) return *b != 0 ? -1 : *a != 0 ? 1 : 0;
    if (*a != *b) return *a - *b;
  }
}

bool operator==(const String& a, const String& b) {
  // Equal up to the terminator of the shorter one is equal; anything else may still be, when a zero comes early.
  const size_t count = size_t{std::min(a.length(), b.length())} + 1;
  return areEqual(a.getData(), b.getData(), count) || String::compare(a, b) == 0;
}

unsigned int String::find(unsigned short c, unsigned int start) const {
  if (start >= length()) throwIndexOutOfBounds(__LINE__);
  const unsigned short* end = getData() + length();
  const unsigned short* found = std::find(getData() + start, end, c);
  return found == end ? NPOS : static_cast<unsigned int>(found - getData());
}

unsigned int String::find(unsigned short c, unsigned short esc, unsigned int start) const {
  if (start >= length()) throwIndexOutOfBounds(__LINE__);
  const unsigned short* unit = getData();
  for (unsigned int i = start; i < length(); ++i) {
    if (unit[i] != c) continue;
    if (i == start) return i;
    unsigned int first = i;  // of the run of escapes before i
    while (first > 0 && unit[first - 1] == esc) --first;
    if ((i - first) % 2 == 0) return i;
  }
  return NPOS;
}

unsigned int String::find(const String& s, unsigned int start) const {
  const Trace trace(traceUnit);
  if (s.length() == 0 || s.length() > length() || start > length() - s.length()) return NPOS;
  const unsigned short* last = getData() + (length() - s.length());
  const unsigned short first_unit = s.getData()[0];
  for (const unsigned short* at = getData() + start;; ++at) {
    at = std::find(at, last + 1, first_unit);
    if (at > last) return NPOS;
    if (areEqual(at, s.getData(), s.length())) return static_cast<unsigned int>(at - getData());
  }
}

unsigned int String::rfind(unsigned short c) const {
  for (unsigned int i = length(); i > 0; --i) {
    if (getData()[i] == c) return i;
  }
  return NPOS;
}

String String::substr(unsigned int pos, unsigned int n) const {
  const Trace trace(traceUnit);
  if (n < 1 || pos > length() || n > length() - pos) throwIndexOutOfBounds(__LINE__);
  String piece;
  piece.appendUnits(getData() + pos, n);
  return piece;
}

String String::substr(unsigned int pos) const {
  const Trace trace(traceUnit);
  if (pos >= length()) throwIndexOutOfBounds(__LINE__);
  return substr(pos, length() - pos);
}

String String::replace(const String& str, const String& from, const String& to) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Str [%s], replace [%s] with [%s]", str.c_str().get(), from.c_str().get(), to.c_str().get());
  String result;
  unsigned int start = 0;
  for (unsigned int pos; (pos = str.find(from, start)) != NPOS; start = pos + from.length()) {
    result.appendUnits(str.getData() + start, pos - start);
    result.append(to);
  }
  result.appendUnits(str.getData() + start, str.length() - start);
  TRACE_DETAIL(trace, "Returning [%s]", result.c_str().get());
  return result;
}

}  // namespace VMQ
