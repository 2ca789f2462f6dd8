// The push parser over expat.

#include "xml1.h"

#include <expat.h>

#include <exception>
#include <new>

#include "seam.h"

struct XML1_Parser {
  XML_Parser expat;
  void* userData = nullptr;
  XML1_StartElementHandler start = nullptr;
  XML1_EndElementHandler end = nullptr;
  XML1_CharacterDataHandler characters = nullptr;
  int depth = 0;
  bool stopped = false;  // expat may still call after XML_StopParser; the handlers must not hear of it
  int error = 0;
  unsigned long line = 0;  // of the event at which it was stopped: expat's own position moves past it
  unsigned long column = 0;
};

namespace {

/// Entities may let a document grow to ten times its length; below a mebibyte in all nobody minds.
[[maybe_unused]] constexpr float kMaximumAmplification = 10;
[[maybe_unused]] constexpr unsigned long long kAmplificationCheckedFromBytes = 1 << 20;

void stop(XML1_Parser& parser, int error) {
  parser.stopped = true;
  parser.error = error;
  parser.line = XML_GetCurrentLineNumber(parser.expat);
  parser.column = XML_GetCurrentColumnNumber(parser.expat);
  (void)XML_StopParser(parser.expat, XML_FALSE);  // fails only when the parse is over anyway
}

/// Calls a handler; what it throws must not unwind through expat's frames.
template <class Handler, class... Arguments>
void call(XML1_Parser& parser, Handler handler, Arguments... arguments) {
  if (parser.stopped || handler == nullptr) return;
  try {
    handler(parser.userData, arguments...);
  } catch (...) {
    stop(parser, XML_ERROR_ABORTED);
  }
}

void XMLCALL onStart(void* self, const char* name, const char** attributes) {
  XML1_Parser& parser = *static_cast<XML1_Parser*>(self);
  if (++parser.depth > XML1_MAXIMUM_DEPTH) return stop(parser, XML1_ERROR_TOO_DEEP);
  call(parser, parser.start, name, attributes);
}

void XMLCALL onEnd(void* self, const char* name) {
  XML1_Parser& parser = *static_cast<XML1_Parser*>(self);
  --parser.depth;
  call(parser, parser.end, name);
}

void XMLCALL onCharacters(void* self, const char* characters, int length) {
  XML1_Parser& parser = *static_cast<XML1_Parser*>(self);
  call(parser, parser.characters, characters, length);
}

void limitEntities([[maybe_unused]] XML_Parser expat) {
#ifdef VMQHOST_EXPAT_AMPLIFICATION_LIMITS
  (void)XML_SetBillionLaughsAttackProtectionMaximumAmplification(expat, kMaximumAmplification);
  (void)XML_SetBillionLaughsAttackProtectionActivationThreshold(expat, kAmplificationCheckedFromBytes);
#endif
}

}  // namespace

XML1_Parser* XML1_ParserCreate(const char* encoding) {
  if (int status; vmqhost::seam::fails("XML1_ParserCreate", &status)) return nullptr;
  const XML_Parser expat = XML_ParserCreate(encoding);
  if (expat == nullptr) return nullptr;
  // cppcheck-suppress legacyUninitvar ; does not understand the initialiser
  auto* const parser = new (std::nothrow) XML1_Parser{.expat = expat};
  if (parser == nullptr) {
    XML_ParserFree(expat);
    return nullptr;
  }
  limitEntities(expat);
  XML_SetUserData(expat, parser);
  XML_SetElementHandler(expat, onStart, onEnd);
  XML_SetCharacterDataHandler(expat, onCharacters);
  return parser;
}

void XML1_ParserFree(XML1_Parser* parser) {
  if (parser == nullptr) return;
  XML_ParserFree(parser->expat);
  delete parser;
}

void XML1_SetUserData(XML1_Parser* parser, void* userData) {
  if (parser != nullptr) parser->userData = userData;
}

void XML1_SetElementHandler(XML1_Parser* parser, XML1_StartElementHandler start, XML1_EndElementHandler end) {
  if (parser == nullptr) return;
  parser->start = start;
  parser->end = end;
}

void XML1_SetCharacterDataHandler(XML1_Parser* parser, XML1_CharacterDataHandler handler) {
  if (parser != nullptr) parser->characters = handler;
}

void* XML1_GetBuffer(XML1_Parser* parser, int length) {
  if (int status; vmqhost::seam::fails("XML1_GetBuffer", &status)) return nullptr;
  if (parser == nullptr) return nullptr;
  // Some expat 2.5 have no buffer of no bytes, and then nothing to parse an empty document from.
  return XML_GetBuffer(parser->expat, length == 0 ? 1 : length);
}

int XML1_ParseBuffer(XML1_Parser* parser, int length, int isFinal) {
  if (parser == nullptr) return 0;
  if (int status; vmqhost::seam::fails("XML1_ParseBuffer", &status)) {
    parser->error = status;
    return 0;
  }
  if (XML_ParseBuffer(parser->expat, length, isFinal) == XML_STATUS_OK) return 1;
  if (!parser->stopped) parser->error = XML_GetErrorCode(parser->expat);
  return 0;
}

int XML1_GetErrorCode(XML1_Parser* parser) {
  return parser == nullptr ? 0 : parser->error;
}

const char* XML1_ErrorString(int code) {
  if (code == XML1_ERROR_TOO_DEEP) return "elements nest too deep";
  return XML_ErrorString(static_cast<XML_Error>(code));
}

unsigned long XML1_GetCurrentLineNumber(XML1_Parser* parser) {
  if (parser == nullptr) return 0;
  return parser->stopped ? parser->line : XML_GetCurrentLineNumber(parser->expat);
}

unsigned long XML1_GetCurrentColumnNumber(XML1_Parser* parser) {
  if (parser == nullptr) return 0;
  return parser->stopped ? parser->column : XML_GetCurrentColumnNumber(parser->expat);
}
