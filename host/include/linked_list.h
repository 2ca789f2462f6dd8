#pragma once
// The list of open requests that a table manager keeps. Not locked by itself: the manager's lock guards it.

class bxira;

/// A doubly linked list of request objects that it does not own.
class LinkedList {
 public:
  LinkedList() = default;
  ~LinkedList();
  LinkedList(const LinkedList&) = delete;
  LinkedList& operator=(const LinkedList&) = delete;

  void append(bxira* request);
  /// Takes the request off the list; nothing happens when it is not on it.
  void remove(bxira* request);
  [[nodiscard]] unsigned length() const { return length_; }

 private:
  friend class LinkedListIter;
  struct Cell {
    bxira* request;
    Cell* previous;
    Cell* next;
  };
  Cell* head_ = nullptr;
  Cell* tail_ = nullptr;
  unsigned length_ = 0;
};

/// Walks a list from its first to its last request. The list must not change meanwhile.
class LinkedListIter {
 public:
  explicit LinkedListIter(const LinkedList& list) : next_(list.head_) {}
  /// The next request, or null at the end.
  bxira* next();

 private:
  const LinkedList::Cell* next_;
};
