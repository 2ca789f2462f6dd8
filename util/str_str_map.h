#pragma once
// Text to text: parsed key/value files and option sets.

#include "util/string_hash_table.h"

namespace VMQ {

/// Owns copies of its keys and values. Not thread-safe.
class StrStrMap : public StringHashTable<String> {
 public:
  StrStrMap() = default;
  /// The same entries; keys that share a bucket come in the opposite order.
  StrStrMap(const StrStrMap& other);
  StrStrMap& operator=(const StrStrMap&) = delete;
  virtual ~StrStrMap() { removeAll(); }

  /// Inserts or replaces.
  void put(const String& key, const String& value);
  /// True, and a copy in `value`. False, and `value` untouched, when the key is absent.
  bool get(const String& key, String& value) const;
  /// Nothing happens when the key is absent.
  void remove(const String& key);
  void removeAll();
};

}  // namespace VMQ
