// Takes apart the reserved column of a product record.
#include "util/string_tokenizer.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/reserved"};

constexpr int products = 3;
constexpr int tokensPerProduct = 3;  // its letter, its version, its architecture

bool startsWith(const String& text, const char* letter) {
  return text.find(String(letter), 0U) == 0;
}

String withoutDots(const String& version) {
  return String::replace(version, String("."), String(""));
}

}  // namespace

bool Util::parseReserved(const String& reserved, String& agentLevel, String& agentArch, String& axVersion,
                         String& axArch, String& commonVersion) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "reserved=[%s]", reserved.c_str().get());
  StringTokenizer entries(reserved, String(";"));
  if (const int count = entries.countTokens(); count != products) {
    TRACE_ERROR(trace, "wrong number of products in RESERVED column:%d", count);
    return false;
  }
  while (entries.hasMoreTokens()) {
    const String entry = entries.nextToken();
    const char* letter = nullptr;
    for (const char* const known : {"A", "C", "G"}) {
      if (letter == nullptr && startsWith(entry, known)) letter = known;
    }
    if (letter == nullptr) {
      TRACE_ERROR(trace, "unknown product in RESERVED column");
      return false;
    }
    StringTokenizer tokens(entry, String("=:"));
    if (const int count = tokens.countTokens(); count != tokensPerProduct) {
      TRACE_ERROR(trace, "wrong number of tokens in %s product:%d", letter, count);
      return false;
    }
    (void)tokens.nextToken();  // the letter again
    const String version = tokens.nextToken();
    const String arch = tokens.nextToken();
    switch (*letter) {
      case 'A':
        agentLevel = version;
        agentArch = arch;
        TRACE_DETAIL(trace, "agentLevel=%s,agentArch=%s", agentLevel.c_str().get(), agentArch.c_str().get());
        break;
      case 'C':
        axVersion = withoutDots(version);
        axArch = arch;
        TRACE_DETAIL(trace, "axVersion=%s,axArch=%s", axVersion.c_str().get(), axArch.c_str().get());
        break;
      case 'G':
        commonVersion = withoutDots(version);
        TRACE_DETAIL(trace, "commonVersion=%s", commonVersion.c_str().get());
        break;
    }
  }
  return true;
}

}  // namespace VMQ
