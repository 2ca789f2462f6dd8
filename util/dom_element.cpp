#include "util/dom_element.h"

#include <memory>

#include "util/dom_attr.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/dom_element"};

constexpr bool ownsNodes = true;

}  // namespace

DOMElement::DOMElement(const char* tagName)
    : tag_name_(String::createUnicodeString(tagName)), attributes_(ownsNodes), children_(ownsNodes) {
  tag_cache_.setAutoDeleteValues(true);
  tag_cache_.setFreeValueFunc(reinterpret_cast<void*>(freeDOMNodeListFunc));
}

DOMElement::DOMElement(const DOMElement& other)
    : DOMNode(other),
      tag_name_(other.tag_name_ == nullptr ? nullptr : String::copyUnicodeString(other.tag_name_)),
      attributes_(ownsNodes),
      children_(ownsNodes) {
  setElementText(other.text_);
  tag_cache_.setAutoDeleteValues(true);
  tag_cache_.setFreeValueFunc(reinterpret_cast<void*>(freeDOMNodeListFunc));
}

DOMElement::~DOMElement() {
  String::releaseUnicodeString(tag_name_);
  String::releaseUnicodeString(text_);
}

void DOMElement::setElementText(const unsigned short* text) {
  unsigned short* const copy = text == nullptr ? nullptr : String::copyUnicodeString(text);
  String::releaseUnicodeString(text_);
  text_ = copy;
}

void DOMElement::setElementText(const char* text) {
  unsigned short* const converted = String::createUnicodeString(text);
  String::releaseUnicodeString(text_);
  text_ = converted;
}

void DOMElement::setAttribute(const char* name, const char* value) {
  const Trace trace(traceUnit);
  if (name == nullptr || value == nullptr) return;
  auto attribute = std::make_unique<DOMAttr>(name, value);
  attributes_.append(attribute.get());
  (void)attribute.release();  // the list's from now on
}

const unsigned short* DOMElement::getAttribute(const char* name) const {
  const Trace trace(traceUnit);
  return name == nullptr ? nullptr : getAttribute(String(name).getData());
}

const unsigned short* DOMElement::getAttribute(const unsigned short* name) const {
  const Trace trace(traceUnit);
  if (name == nullptr) return nullptr;
  for (const DOMNode* const node : attributes_) {
    const auto* const attribute = static_cast<const DOMAttr*>(node);
    if (String::compare(attribute->getName(), name) == 0) return attribute->getValue();
  }
  return nullptr;
}

void DOMElement::addChild(DOMElement* child) {
  if (child == nullptr) return;
  children_.append(child);
  child->parent_ = this;
}

DOMNodeList* DOMElement::getElementsByTagName(const char* tagName) {
  const Trace trace(traceUnit);
  return tagName == nullptr ? nullptr : getElementsByTagName(String(tagName).getData());
}

DOMNodeList* DOMElement::getElementsByTagName(const unsigned short* tagName) {
  const Trace trace(traceUnit);
  if (tagName == nullptr) return nullptr;
  const String name(tagName);
  void* cached = nullptr;
  if (tag_cache_.get(name, &cached)) return static_cast<DOMNodeList*>(cached);

  auto found = std::make_unique<DOMNodeList>(!ownsNodes);
  for (DOMNode* const node : children_) {
    auto* const child = static_cast<DOMElement*>(node);
    if (String::compare(child->getTagName(), tagName) == 0) found->append(child);
  }
  tag_cache_.put(name, found.get());
  return found.release();  // the cache's from now on
}

void DOMElement::dump(String& out) const {
  const Trace trace(traceUnit);
  dump(String(), out);
}

void DOMElement::dump(const String& indentation, String& out) const {
  const Trace trace(traceUnit);
  const String name(tag_name_);
  out.append(indentation).append(String("<")).append(name).append(String(" "));
  for (const DOMNode* const attribute : attributes_) {
    attribute->dump(out);
    out.append(String(" "));
  }
  out.append(String(">\n"));
  const String deeper = indentation + String("\t");
  for (const DOMNode* const child : children_) {
    static_cast<const DOMElement*>(child)->dump(deeper, out);
    out.append(String("\n"));
  }
  out.append(indentation).append(String("</")).append(name).append(String(">"));
}

}  // namespace VMQ
