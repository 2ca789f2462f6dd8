#pragma once
// Push parser for XML of the host agent. A parser belongs to one thread at a time.
// Protected against documents that are made to exhaust the machine: the expansion of entities is limited and elements
// nest at most XML1_MAXIMUM_DEPTH deep (a document that nests deeper fails with XML1_ERROR_TOO_DEEP).

#include <cstdint>

extern "C" {

struct XML1_Parser;

inline constexpr int XML1_MAXIMUM_DEPTH = 256;
inline constexpr int XML1_ERROR_TOO_DEEP = 10001;

/// `attributes`: alternating names and values, ended by a null name. Texts are in UTF-8.
typedef void (*XML1_StartElementHandler)(void* userData, const char* name, const char** attributes);
typedef void (*XML1_EndElementHandler)(void* userData, const char* name);
/// `characters` is not terminated. One text may arrive in several calls.
typedef void (*XML1_CharacterDataHandler)(void* userData, const char* characters, int length);

/// A new parser, or null without memory. `encoding` overrides the document's own declaration; null leaves it.
struct XML1_Parser* XML1_ParserCreate(const char* encoding);
void XML1_ParserFree(struct XML1_Parser* parser);

void XML1_SetUserData(struct XML1_Parser* parser, void* userData);
void XML1_SetElementHandler(struct XML1_Parser* parser, XML1_StartElementHandler start, XML1_EndElementHandler end);
void XML1_SetCharacterDataHandler(struct XML1_Parser* parser, XML1_CharacterDataHandler handler);

/// A buffer of the parser's own for at least `length` bytes of input, or null without memory.
void* XML1_GetBuffer(struct XML1_Parser* parser, int length);

/// Parses the first `length` bytes of the buffer; `isFinal` ends the document. Returns 1 on success, 0 on failure.
/// A handler that throws ends the parse with a failure; the exception does not pass through.
int XML1_ParseBuffer(struct XML1_Parser* parser, int length, int isFinal);

/// The code of the last failure (0 when there was none) and a static text for a code, null when it has none.
int XML1_GetErrorCode(struct XML1_Parser* parser);
const char* XML1_ErrorString(int code);

/// Position of the failure; lines count from 1, columns from 0.
unsigned long XML1_GetCurrentLineNumber(struct XML1_Parser* parser);
unsigned long XML1_GetCurrentColumnNumber(struct XML1_Parser* parser);

}  // extern "C"
