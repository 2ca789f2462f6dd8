#include "util/dom_node_list.h"

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/dom_node_list"};

}  // namespace

DOMNodeList::DOMNodeList(bool ownsNodes) : owns_nodes_(ownsNodes) {}

DOMNodeList::~DOMNodeList() {
  while (head_ != nullptr) {
    Cell* const next = head_->next;
    if (owns_nodes_) delete head_->node;
    delete head_;
    head_ = next;
  }
}

void DOMNodeList::append(DOMNode* node) {
  if (node == nullptr) return;
  Cell* const cell = new Cell{node, nullptr};
  (tail_ == nullptr ? head_ : tail_->next) = cell;
  tail_ = cell;
  ++count_;
}

DOMNode* DOMNodeList::item(unsigned index) const {
  if (index >= count_) return nullptr;
  const Cell* cell = head_;
  while (index-- > 0) cell = cell->next;
  return cell->node;
}

void freeDOMNodeListFunc(void* list) {
  const Trace trace(traceUnit);
  delete static_cast<DOMNodeList*>(list);
}

}  // namespace VMQ
