// An XML text. What was parsed and dumped parses again, to the same dump.

#include <string>

#include "fuzz/support.h"
#include "util/dom_attr.h"
#include "util/dom_parser.h"

using namespace VMQ;

namespace {

/// The XML library lets letters pass in Latin-1 that it refuses in UTF-8.
bool isAscii(const unsigned short* name) {
  for (; *name != 0; ++name) {
    if (*name >= 0x80) return false;
  }
  return true;
}

/// Dumps escape nothing, on purpose, and blanks other than " " do not survive in an attribute.
bool canBeDumped(DOMElement& element) {
  if (!isAscii(element.getTagName())) return false;
  for (DOMNode* const node : *element.getAttributes()) {
    const auto& attribute = static_cast<DOMAttr&>(*node);
    const std::string value = String(attribute.getValue()).toNarrow();
    if (!isAscii(attribute.getName()) || value.find_first_of("<&\"\t\r\n") != std::string::npos) return false;
  }
  for (DOMNode* const child : *element.getChildren()) {  // NOLINT(readability-use-anyofallof): it has not the iterators
    if (!canBeDumped(static_cast<DOMElement&>(*child))) return false;
  }
  return true;
}

void look(DOMElement& element) {
  unsigned position = 0;
  for (DOMNode* const node : *element.getChildren()) {
    auto& child = static_cast<DOMElement&>(*node);
    fuzz::require(element.getChildren()->item(position++) == node, "an item is what stands at its position");
    fuzz::require(child.getParent() == &element && child.getElementText() != nullptr, "a child has parent and text");
    unsigned found = 0;
    for (DOMNode* const same : *element.getElementsByTagName(child.getTagName())) found += same == node ? 1 : 0;
    fuzz::require(found == 1, "a child is found by its name, once");
    look(child);
  }
  fuzz::require(position == element.getChildren()->getLength(), "the length is the number of children");
  for (DOMNode* const node : *element.getAttributes()) {
    const auto& attribute = static_cast<DOMAttr&>(*node);
    fuzz::require(String::compare(element.getAttribute(attribute.getName()), attribute.getValue()) == 0,
                  "an attribute is found by its name");
  }
}

std::string dumpOf(DOMElement& element) {
  String dump;
  element.dump(dump);
  return dump.toNarrow();
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  DOMParser parser(text.c_str());
  if (!parser.parse()) return 0;
  DOMElement& root = *parser.getDocument();
  look(root);
  const std::string dump = dumpOf(root);
  if (!canBeDumped(root)) return 0;
  DOMParser again(dump.c_str());
  fuzz::require(again.parse(), "a dump can be parsed");
  fuzz::require(dumpOf(*again.getDocument()) == dump, "to what was dumped");
  return 0;
}
