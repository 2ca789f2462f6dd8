#include "util/startup_elements.h"

#include <memory>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/startup_elements"};

// The text in front of an element inside its parent is part of the element's text, so it begins with indentation.
String trimmedText(const DOMElement* element) {
  String text;
  if (element != nullptr) text.assign(element->getElementText());
  text.trim();
  return text;
}

}  // namespace

DOMElement* asElement(DOMNode* node, const char* tagName) {
  const Trace trace(traceUnit);
  if (node == nullptr || node->getNodeType() != DOM_ELEMENT) return nullptr;
  auto* const element = static_cast<DOMElement*>(node);
  return String::compare(element->getTagName(), String(tagName).getData()) == 0 ? element : nullptr;
}

DOMElement* getChildElement(DOMElement* parent, const char* tagName) {
  const Trace trace(traceUnit);
  if (parent == nullptr) return nullptr;
  const DOMNodeList* const found = parent->getElementsByTagName(tagName);
  return found == nullptr ? nullptr : static_cast<DOMElement*>(found->item(0));
}

InstanceEntry* buildInstanceEntry(DOMElement* element) {
  const Trace trace(traceUnit);
  DOMElement* const name = getChildElement(element, "name");
  DOMElement* const user = name == nullptr ? nullptr : getChildElement(element, "user");
  return new InstanceEntry(trimmedText(name), trimmedText(user));
}

AgentEntry* buildAgentEntry(DOMElement* element) {
  const Trace trace(traceUnit);
  DOMElement* const product_code = getChildElement(element, "productCode");
  if (product_code == nullptr) {
    TRACE_ERROR(trace, "Agent element missing <productCode> element");
    return nullptr;
  }
  auto agent = std::make_unique<AgentEntry>(trimmedText(product_code));
  for (DOMNode* const node : *element->getChildren()) {
    if (DOMElement* const instance = asElement(node, "instance")) {
      agent->addInstance(buildInstanceEntry(instance));
    }
  }
  return agent.release();
}

}  // namespace VMQ
