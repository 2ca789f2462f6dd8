// The first line of what a command printed.
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/strip_newlines"};

void cutAt(String& text, unsigned short character) {
  const unsigned int position = text.find(character, 0U);
  if (position != String::NPOS) text.erase(position);
}

}  // namespace

void Util::stripNewlineCharsFromOutput(String& text) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "before length = %d", static_cast<int>(text.length()));
  cutAt(text, '\r');
  cutAt(text, '\n');
  TRACE_DETAIL(trace, "after length = %d", static_cast<int>(text.length()));
}

}  // namespace VMQ
