#pragma once
// A singly linked list of nodes.

#include "util/dom_node.h"

namespace VMQ {

/// Belongs to one thread at a time.
class DOMNodeList {
 public:
  /// `ownsNodes`: whether the list deletes its nodes when it is destroyed.
  explicit DOMNodeList(bool ownsNodes);
  DOMNodeList(const DOMNodeList&) = delete;
  DOMNodeList& operator=(const DOMNodeList&) = delete;
  virtual ~DOMNodeList();

  /// Adds at the end; null is ignored.
  void append(DOMNode* node);
  [[nodiscard]] unsigned getLength() const { return count_; }
  /// The node at a position, found by walking from the head; null when the index is not below the length.
  [[nodiscard]] DOMNode* item(unsigned index) const;

 private:
  struct Cell {
    DOMNode* node;
    Cell* next;
  };

 public:
  /// For loops over the nodes, which item would walk from the head for each of them.
  class Iterator {
   public:
    explicit Iterator(const Cell* cell) : cell_(cell) {}
    DOMNode* operator*() const { return cell_->node; }
    Iterator& operator++() {
      cell_ = cell_->next;
      return *this;
    }
    bool operator==(const Iterator&) const = default;

   private:
    const Cell* cell_;
  };
  [[nodiscard]] Iterator begin() const { return Iterator(head_); }
  [[nodiscard]] Iterator end() const { return Iterator(nullptr); }

 private:
  const bool owns_nodes_;
  unsigned count_ = 0;
  Cell* head_ = nullptr;
  Cell* tail_ = nullptr;
};

/// Deletes a DOMNodeList, for a map of them; null is ignored.
void freeDOMNodeListFunc(void* list);

}  // namespace VMQ
