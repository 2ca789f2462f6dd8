#pragma once
// From the elements of a run-as file to the entries of the database.

#include "util/agent_entry.h"
#include "util/dom_element.h"
#include "util/instance_entry.h"

namespace VMQ {

/// The node itself when it is an element of exactly this tag name, else null.
DOMElement* asElement(DOMNode* node, const char* tagName);

/// The first direct child of this tag name; null when there is none or the parent is null.
DOMElement* getChildElement(DOMElement* parent, const char* tagName);

/// A new entry, which the caller owns, of an "instance" element. Kept on purpose: without a "name" the "user" is not
/// read either.
InstanceEntry* buildInstanceEntry(DOMElement* element);

/// A new entry, which the caller owns, of an "agent" element with its instances; null, with an error trace, when it has
/// no "productCode".
AgentEntry* buildAgentEntry(DOMElement* element);

}  // namespace VMQ
