#include "util/string_tokenizer.h"

#include <utility>

#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {
RAS1_Unit traceUnit{"util/string_tokenizer"};
}

StringTokenizer::StringTokenizer(String str, String delims) : str_(std::move(str)), delims_(std::move(delims)) {}

StringTokenizer::StringTokenizer(String str) : str_(std::move(str)) {}

int StringTokenizer::skipDelims(int i) {
  while (isInside(i) && isDelimiter(i)) ++i;
  return i;
}

int StringTokenizer::readToken(int i) {
  while (isInside(i) && !isDelimiter(i)) ++i;
  return i;
}

bool StringTokenizer::hasMoreTokens() {
  const Trace trace(traceUnit);
  return isInside(skipDelims(pos_));
}

int StringTokenizer::countTokens() {
  const Trace trace(traceUnit);
  int count = 0;
  for (int i = skipDelims(pos_); isInside(i); i = skipDelims(readToken(i))) ++count;
  return count;
}

String StringTokenizer::nextToken() {
  const Trace trace(traceUnit);
  const int start = skipDelims(pos_);
  pos_ = readToken(start);
  return str_.substr(static_cast<unsigned int>(start), static_cast<unsigned int>(pos_ - start));
}
