#pragma once
// What elements and attributes of a parsed document have in common. There are no other kinds of node: text belongs to
// its element, and comments, processing instructions and namespaces are not kept.
//
// Texts of a document are 0-terminated UTF-16 arrays that belong to their node. They are made from the parser's bytes
// by String's conversion from the process's code page; the parser delivers UTF-8, so that in a UTF-8 locale they are
// the document's characters, and in the plain C locale each byte of them is one unit, which goes back to the same byte.

#include <cstdint>

#include "util/string.h"

namespace VMQ {

enum DOMNodeType : uint8_t { DOM_ELEMENT = 1, DOM_ATTRIBUTE = 2 };

class DOMNode {
 public:
  DOMNode() = default;
  DOMNode(const DOMNode&) = default;
  DOMNode& operator=(const DOMNode&) = delete;
  virtual ~DOMNode() = default;

  [[nodiscard]] virtual uint8_t getNodeType() const = 0;
  /// Appends a text form to `out`.
  virtual void dump(String& /*out*/) const {}
};

}  // namespace VMQ
