#pragma once
// One attribute of an element.

#include "util/dom_node.h"

namespace VMQ {

/// Belongs to one thread at a time; never changes.
class DOMAttr : public DOMNode {
 public:
  /// Both texts are in the process's code page; a null one stays null.
  DOMAttr(const char* name, const char* value);
  DOMAttr(const DOMAttr& other);
  DOMAttr& operator=(const DOMAttr&) = delete;
  ~DOMAttr() override;

  [[nodiscard]] const unsigned short* getName() const { return name_; }
  [[nodiscard]] const unsigned short* getValue() const { return value_; }
  [[nodiscard]] uint8_t getNodeType() const override { return DOM_ATTRIBUTE; }
  /// Appends name="value"; nothing is escaped.
  void dump(String& out) const override;

 private:
  unsigned short* const name_;   // owned
  unsigned short* const value_;  // owned
};

}  // namespace VMQ
