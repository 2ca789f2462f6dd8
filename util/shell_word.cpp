#include "util/shell_word.h"

#include <cstring>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/shell_word"};

constexpr char metacharacters[] = "|&;<>()$`\\\"'*?[]{}!^#~";

bool isPlain(unsigned short unit) {
  if (unit < 0x20 || unit == 0x7F || String::isWhiteSpace(unit)) return false;
  return unit > 0x7F || std::strchr(metacharacters, unit) == nullptr;
}

}  // namespace

bool isPlainShellWord(const String& text) {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < text.length(); ++i) {
    if (!isPlain(text[i])) return false;
  }
  return true;
}

}  // namespace VMQ
