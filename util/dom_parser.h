#pragma once
// Builds the tree of an XML text.

#include <string>

#include "util/dom_element.h"

struct XML1_Parser;

namespace VMQ {

/// Owns the document that it builds: everything reached through getDocument is valid until the parser is destroyed.
/// Belongs to one thread at a time.
class DOMParser {
 public:
  /// Copies the 0-terminated text, which may be freed at once. It is read as XML says: UTF-8, unless it declares
  /// another encoding.
  explicit DOMParser(const char* xml);
  DOMParser(const DOMParser&) = delete;
  DOMParser& operator=(const DOMParser&) = delete;
  virtual ~DOMParser();

  /// True when a complete document was built. REQUIRES: called once.
  bool parse();
  /// The root element; null before parse and when there was no element. After a failed parse, whatever had been built:
  /// not for use.
  [[nodiscard]] DOMElement* getDocument() const { return document_; }
  /// Why parse failed: "line:column: what\n" with lines counted from 1 and columns from 0, or another short text. Null
  /// when nothing was recorded (no failure, or an input without any element that the host's parser let pass).
  [[nodiscard]] const char* getErrorMessage() const { return error_message_; }

 private:
  // Handlers of the push parser; `userData` is the DOMParser. Nothing thrown passes through the push parser: it ends
  // up in failed_.
  static void onStartTag(void* userData, const char* name, const char** attributes) noexcept;
  static void onEndTag(void* userData, const char* name) noexcept;
  static void onCharacters(void* userData, const char* characters, int length) noexcept;

  void startElement(const char* name, const char** attributes);
  void endElement();
  void recordError();
  void setErrorMessage(const char* message);

  int length_ = 0;          // bytes
  char* buffer_ = nullptr;  // the push parser's own
  XML1_Parser* const parser_;
  DOMElement* document_ = nullptr;  // owned
  DOMElement* current_ = nullptr;   // the element whose end tag is awaited
  // Characters since the last end tag, wherever it was. As bytes, for most texts come in several pieces: the push
  // parser cuts between characters only, so converting all of them at once gives what converting each would.
  std::string pending_text_;
  char* error_message_ = nullptr;  // from strdup
  bool failed_ = false;            // a handler has failed; the tree is not complete
};

}  // namespace VMQ
