// The list of open requests.

#include "linked_list.h"

LinkedList::~LinkedList() {
  while (head_ != nullptr) {
    Cell* const next = head_->next;
    delete head_;
    head_ = next;
  }
}

void LinkedList::append(bxira* request) {
  Cell* const cell = new Cell{request, tail_, nullptr};
  (tail_ == nullptr ? head_ : tail_->next) = cell;
  tail_ = cell;
  ++length_;
}

void LinkedList::remove(bxira* request) {
  Cell* cell = head_;
  while (cell != nullptr && cell->request != request) cell = cell->next;
  if (cell == nullptr) return;
  (cell->previous == nullptr ? head_ : cell->previous->next) = cell->next;
  (cell->next == nullptr ? tail_ : cell->next->previous) = cell->previous;
  delete cell;
  --length_;
}

bxira* LinkedListIter::next() {
  if (next_ == nullptr) return nullptr;
  bxira* const request = next_->request;
  next_ = next_->next;
  return request;
}
