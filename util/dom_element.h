#pragma once
// One element of a parsed document.

#include "util/dom_node.h"
#include "util/dom_node_list.h"
#include "util/str_ptr_map.h"

namespace VMQ {

/// An element owns its attributes and children. Everything it hands out is valid until it is destroyed. Belongs to one
/// thread at a time. Narrow texts are in the process's code page.
class DOMElement : public DOMNode {
 public:
  explicit DOMElement(const char* tagName);
  /// Copies the tag name and the text only: the copy has no attributes, no children and no parent.
  DOMElement(const DOMElement& other);
  DOMElement& operator=(const DOMElement&) = delete;
  ~DOMElement() override;

  [[nodiscard]] uint8_t getNodeType() const override { return DOM_ELEMENT; }
  [[nodiscard]] const unsigned short* getTagName() const { return tag_name_; }
  /// Null for the document's root.
  [[nodiscard]] DOMElement* getParent() const { return parent_; }
  [[nodiscard]] DOMNodeList* getAttributes() { return &attributes_; }
  [[nodiscard]] DOMNodeList* getChildren() { return &children_; }

  /// The text given last, null when there was none. A parser gives each element, at its end tag, everything read since
  /// the end tag before it: the text in front of the element inside its parent is part of it, and of a parent's own
  /// text only what follows its last child is left. Kept on purpose; readers trim.
  [[nodiscard]] const unsigned short* getElementText() const { return text_; }
  void setElementText(const unsigned short* text);
  void setElementText(const char* text);

  /// Appends an attribute when neither text is null. A name may repeat; getAttribute finds the first.
  void setAttribute(const char* name, const char* value);
  /// The value of the first attribute of exactly this name; null when there is none or the name is null.
  [[nodiscard]] const unsigned short* getAttribute(const char* name) const;
  [[nodiscard]] const unsigned short* getAttribute(const unsigned short* name) const;

  /// Takes ownership and becomes the child's parent; null is ignored.
  void addChild(DOMElement* child);

  /// The direct children of exactly this tag name, in order, in a list that belongs to the element; null for a null
  /// name. Computed by the first call for a name and never refreshed: children added later are not in it. Kept on
  /// purpose.
  [[nodiscard]] DOMNodeList* getElementsByTagName(const char* tagName);
  [[nodiscard]] DOMNodeList* getElementsByTagName(const unsigned short* tagName);

  /// Appends the element as text, without its element text: a blank follows each name and attribute, children stand one
  /// tab deeper on lines of their own, no line feed follows.
  void dump(String& out) const override;
  virtual void dump(const String& indentation, String& out) const;

 private:
  unsigned short* const tag_name_;  // owned
  DOMElement* parent_ = nullptr;    // not owned
  unsigned short* text_ = nullptr;  // owned
  DOMNodeList attributes_;          // of DOMAttr, owned
  DOMNodeList children_;            // of DOMElement, owned
  StrPtrMap tag_cache_;             // tag name to a DOMNodeList, which it owns and which owns no node
};

}  // namespace VMQ
