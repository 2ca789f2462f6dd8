// Building and changing texts.

#include "util/string.h"

#include <cstdio>
#include <cwctype>
#include <ostream>

#include "util/trace.h"

namespace VMQ {

namespace {

RAS1_Unit traceUnit{"util/string"};

unsigned int countUnits(const unsigned short* s) {
  size_t count = 0;
  while (s[count] != 0) ++count;
  if (count >= String::NPOS) throw std::bad_array_new_length();
  return static_cast<unsigned int>(count);
}

/// A block is kept for the next text unless most of it would lie idle.
bool isWorthKeeping(unsigned int oldLength, unsigned int newLength) {
  return oldLength / 4 <= std::max(newLength, 32u);
}

}  // namespace

[[gnu::cold]] void String::throwIndexOutOfBounds(int line, const char* function) {
  const Trace trace(traceUnit, function, line);
  TRACE_ERROR(trace, "IndexOutOfBounds occurred, throwing exception");
  throw IndexOutOfBoundsException(line, "vmqstr");
}

String& String::operator=(String&& s) noexcept {
  String taken(std::move(s));
  units_.swap(taken.units_);
  return *this;
}

String& String::assign(const String& s) {
  return this == &s ? *this : assign(s.getData(), s.length());
}

String& String::assign(const String& s, unsigned int n) {
  return assign(s.getData(), std::min(n, s.length()));
}

String& String::assign(const unsigned short* s) {
  return assign(s, s ? countUnits(s) : 0);
}

String& String::assign(const unsigned short* s, unsigned int n) {
  if (!s || n == 0) {
    clear();
    return *this;
  }
  if (units_.isOwn(s) || !isWorthKeeping(length(), n)) {
    String fresh;
    fresh.appendUnits(s, n);
    return *this = std::move(fresh);
  }
  if (n > length()) units_.grow(n - length());
  std::copy_n(s, n, &units_[0]);
  units_[n] = 0;
  if (n < length()) units_.remove(n + 1, length() - n);
  return *this;
}

String& String::appendInLargerBlock(const unsigned short* p, unsigned int count) {
  if (count == 0) return *this;
  const bool own = units_.isOwn(p);
  const size_t offset = own ? p - getData() : 0;
  units_.relocateFor(count);
  return appendUnits(own ? getData() + offset : p, count);
}

String& String::append(const String& s, unsigned int n) {
  if (n > s.length()) throwIndexOutOfBounds(__LINE__);
  return appendUnits(s.getData(), n);
}

String& String::erase(unsigned int pos, unsigned int n) {
  const Trace trace(traceUnit);
  if (n < 1 || pos > length() || n > length() - pos) throwIndexOutOfBounds(__LINE__);
  units_.remove(pos, n);
  return *this;
}

String& String::trim() {
  const Trace trace(traceUnit);
  unsigned int lead = 0;
  while (isWhiteSpace(getData()[lead])) ++lead;
  if (lead >= length()) {
    clear();
    return *this;
  }
  unsigned int end = length();
  while (isWhiteSpace(getData()[end - 1])) --end;
  if (end < length()) units_.remove(end, length() - end);
  if (lead > 0) units_.remove(0, lead);
  return *this;
}

String& String::toUpper() {
  const Trace trace(traceUnit);
  for (unsigned int i = 0; i < length(); ++i) units_[i] = static_cast<unsigned short>(std::towupper(units_[i]));
  return *this;
}

String& String::toLower() {
  const Trace trace(traceUnit);
  for (unsigned int i = 0; i < length(); ++i) units_[i] = static_cast<unsigned short>(std::towlower(units_[i]));
  return *this;
}

String& String::insertEscapes(unsigned short esc, const String& chars) {
  const Trace trace(traceUnit);
  String escaped;
  for (unsigned int i = 0; i < length(); ++i) {
    const unsigned short* end = chars.getData() + chars.length();
    if (std::find(chars.getData(), end, getData()[i]) != end) escaped.append(esc);
    escaped.append(getData()[i]);
  }
  return *this = std::move(escaped);
}

String& String::removeEscapes(unsigned short esc) {
  const Trace trace(traceUnit);
  String kept;
  const unsigned short* unit = getData();
  for (unsigned int i = 0; i < length(); ++i) {
    const bool first_of_two = unit[i + 1] == esc && (i == 0 || unit[i - 1] != esc);
    if (unit[i] == esc && !first_of_two) {
      // The unit that takes the place of a removed one is never looked at.
      if (++i == length()) break;
    }
    kept.append(unit[i]);
  }
  return *this = std::move(kept);
}

bool String::isWhiteSpace(unsigned short c) {
  return std::iswspace(c) != 0;
}

unsigned short* String::copyUnicodeString(const unsigned short* s) {
  const Trace trace(traceUnit);
  if (!s) return nullptr;
  const size_t size = size_t{countUnits(s)} + 1;
  auto* copy = new unsigned short[size];
  std::copy_n(s, size, copy);
  return copy;
}

void String::releaseUnicodeString(unsigned short* s) {  // NOLINT(readability-non-const-parameter): it ends here
  delete[] s;
}

std::ostream& operator<<(std::ostream& out, const String& s) {
  for (unsigned int i = 0; i < s.length(); ++i) {
    const unsigned short c = s[i];
    if (c > 0 && c < 128) {
      out.put(static_cast<char>(c));
    } else {
      char escaped[8];
      (void)std::snprintf(escaped, sizeof escaped, "\\x%04X", c);  // always six characters
      out.write(escaped, 6);
    }
  }
  return out;
}

}  // namespace VMQ
