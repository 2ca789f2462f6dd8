#pragma once
// Text to a pointer, owned or borrowed.

#include "util/string_hash_table.h"

namespace VMQ {

/// Owns copies of its keys; owns its values only after setAutoDeleteValues(true). Then a value that leaves the map
/// (replaced, removed, or dropped with the map) and is not null is released: by the free function when there is one,
/// else by the plain delete of a pointer to nothing in particular, which runs no destructor. So a map whose values
/// need more than their memory freed sets both. Putting the pointer that is already there changes nothing.
/// Not copied: two maps could own the same values. Not thread-safe.
class StrPtrMap : public StringHashTable<void*> {
 public:
  StrPtrMap() = default;
  StrPtrMap(const StrPtrMap&) = delete;
  StrPtrMap& operator=(const StrPtrMap&) = delete;
  virtual ~StrPtrMap() { removeAll(); }

  /// False, as at first: values are never touched.
  void setAutoDeleteValues(bool autoDelete) { autoDeleteValues_ = autoDelete; }
  /// The address of a `void (*)(void*)`; null for none.
  void setFreeValueFunc(void* function) { freeValueFunc_ = reinterpret_cast<void (*)(void*)>(function); }

  /// Inserts or replaces.
  void put(const String& key, void* value);
  /// True, and the pointer in `*value`; ownership stays. False, and `*value` untouched, when the key is absent.
  bool get(const String& key, void** value) const;
  /// Nothing happens when the key is absent.
  void remove(const String& key);
  void removeAll();

 private:
  void release(void* value) const;

  bool autoDeleteValues_ = false;
  void (*freeValueFunc_)(void*) = nullptr;
};

}  // namespace VMQ
