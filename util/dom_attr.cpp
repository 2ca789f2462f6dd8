#include "util/dom_attr.h"

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/dom_attr"};

unsigned short* copyOf(const unsigned short* text) {
  return text == nullptr ? nullptr : String::copyUnicodeString(text);
}

}  // namespace

DOMAttr::DOMAttr(const char* name, const char* value)
    : name_(String::createUnicodeString(name)), value_(String::createUnicodeString(value)) {}

DOMAttr::DOMAttr(const DOMAttr& other) : DOMNode(other), name_(copyOf(other.name_)), value_(copyOf(other.value_)) {}

DOMAttr::~DOMAttr() {
  String::releaseUnicodeString(name_);
  String::releaseUnicodeString(value_);
}

void DOMAttr::dump(String& out) const {
  const Trace trace(traceUnit);
  out.append(String(name_)).append(String("=\"")).append(String(value_)).append(String("\""));
}

}  // namespace VMQ
