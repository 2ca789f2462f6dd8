#include "util/dom_parser.h"

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "util/current_exception.h"
#include "util/trace.h"
#include "xml1.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/dom_parser"};

// Two numbers and the longest text of a push parser with room to spare; a longer one is cut.
constexpr size_t messageBytes = 512;

}  // namespace

DOMParser::DOMParser(const char* xml) : parser_(XML1_ParserCreate(nullptr)) {
  const Trace trace(traceUnit);
  if (parser_ == nullptr) return;
  XML1_SetElementHandler(parser_, onStartTag, onEndTag);
  XML1_SetCharacterDataHandler(parser_, onCharacters);
  XML1_SetUserData(parser_, this);

  const size_t length = std::strlen(xml);
  if (length > INT_MAX) return;  // more than the push parser takes; parsing nothing fails
  length_ = static_cast<int>(length);
  buffer_ = static_cast<char*>(XML1_GetBuffer(parser_, length_));
  if (buffer_ != nullptr) std::memcpy(buffer_, xml, length);
}

DOMParser::~DOMParser() {
  const Trace trace(traceUnit);
  if (parser_ != nullptr) XML1_ParserFree(parser_);
  std::free(error_message_);
  delete document_;
}

bool DOMParser::parse() {
  const Trace trace(traceUnit);
  if (parser_ == nullptr) {
    setErrorMessage("no parser");
    return false;
  }
  const int result = XML1_ParseBuffer(parser_, length_, /*isFinal=*/1);
  if (failed_) {
    setErrorMessage("the document could not be built");
    return false;
  }
  if (result != 1) {
    recordError();
    return false;
  }
  if (current_ != nullptr) {
    setErrorMessage("incomplete xml");
    return false;
  }
  return document_ != nullptr;
}

void DOMParser::onStartTag(void* userData, const char* name, const char** attributes) noexcept {
  const Trace trace(traceUnit);
  auto& self = *static_cast<DOMParser*>(userData);
  if (self.failed_) return;
  try {
    self.startElement(name, attributes);
  } catch (...) {
    traceCurrentException(trace, "starting an element");
    self.failed_ = true;
  }
}

void DOMParser::onEndTag(void* userData, const char* /*name*/) noexcept {
  const Trace trace(traceUnit);
  auto& self = *static_cast<DOMParser*>(userData);
  if (self.failed_) return;
  try {
    self.endElement();
  } catch (...) {
    traceCurrentException(trace, "ending an element");
    self.failed_ = true;
  }
}

void DOMParser::onCharacters(void* userData, const char* characters, int length) noexcept {
  const Trace trace(traceUnit);
  auto& self = *static_cast<DOMParser*>(userData);
  if (self.failed_) return;
  try {
    self.pending_text_.append(characters, static_cast<size_t>(length));
  } catch (...) {
    traceCurrentException(trace, "gathering text");
    self.failed_ = true;
  }
}

void DOMParser::startElement(const char* name, const char** attributes) {
  auto element = std::make_unique<DOMElement>(name);
  for (const char** pair = attributes; *pair != nullptr; pair += 2) element->setAttribute(pair[0], pair[1]);
  // A second root cannot be: the push parser refuses it.
  if (document_ == nullptr) {
    document_ = element.get();
  } else if (current_ != nullptr) {
    current_->addChild(element.get());
  } else {
    return;
  }
  current_ = element.release();
}

void DOMParser::endElement() {
  if (current_ == nullptr) return;
  current_->setElementText(pending_text_.c_str());
  current_ = current_->getParent();
  pending_text_.clear();
}

void DOMParser::recordError() {
  const Trace trace(traceUnit);
  const int code = XML1_GetErrorCode(parser_);
  const char* const text = XML1_ErrorString(code);
  char message[messageBytes];
  if (text != nullptr) {
    (void)std::snprintf(message, sizeof message, "%d:%d: %s\n", static_cast<int>(XML1_GetCurrentLineNumber(parser_)),
                        static_cast<int>(XML1_GetCurrentColumnNumber(parser_)), text);
  } else {
    (void)std::snprintf(message, sizeof message, "Unknown error code: %d", code);
  }
  setErrorMessage(message);
}

void DOMParser::setErrorMessage(const char* message) {
  std::free(error_message_);
  error_message_ = strdup(message);
}

}  // namespace VMQ
