#pragma once
// The hashing and the buckets of both string-keyed maps. The order of the keys follows from the rules kept here, and
// callers show it to people: change nothing.

#include <cstdint>
#include <new>
#include <utility>

#include "util/string.h"
#include "util/trace.h"

namespace VMQ {

inline RAS1_Unit stringHashTableTraceUnit{"util/string_hash_table"};

/// A chained hash table from texts to `Value`s. Maps derive from it and say what becomes of values. Not thread-safe.
template <typename Value>
class StringHashTable {
 public:
  struct Entry {
    unsigned int hash;
    String key;
    Value value;
    Entry* next;
  };

  StringHashTable(const StringHashTable&) = delete;
  StringHashTable& operator=(const StringHashTable&) = delete;

  [[nodiscard]] unsigned int getSize() const { return count_; }
  /// In table order: buckets from first to last, in each the key that was linked last comes first.
  [[nodiscard]] Array<String> getKeys() const;

  /// h = h * 33 + unit over the units up to the first 0, in 32 bits; the result modulo 2^31 - 1.
  [[nodiscard]] static unsigned int hashCode(const String& key);
  /// `size` empty buckets, to be freed with delete[]. False, and `*table` null, when there is no memory.
  static bool createTable(Entry*** table, unsigned int size);

 protected:
  StringHashTable() = default;
  /// The derived map has removed its entries by now.
  ~StringHashTable() = default;

  [[nodiscard]] Entry* findEntry(const String& key, unsigned int hash) const;
  /// REQUIRES: the key is not there yet.
  void insertEntry(unsigned int hash, const String& key, const Value& value);
  /// Takes the key's entry out; the caller deletes it. Null when it is absent.
  [[nodiscard]] Entry* takeEntry(const String& key);
  /// Takes all entries out, hands each value to `release` and deletes the entries and the buckets. The number of
  /// buckets for the next put stays as it has grown.
  template <typename Release>
  void removeAllEntries(Release release);
  /// Fills this empty table with the other's entries, with as many buckets. Chains come out reversed.
  void copyEntries(const StringHashTable& other);

 private:
  [[nodiscard]] Entry*& bucketOf(unsigned int hash) const { return table_[(hash & 0x7FFFFFFF) % tableSize_]; }
  static void link(Entry* entry, Entry*& bucket) {
    entry->next = bucket;
    bucket = entry;
  }
  static Entry** newTable(unsigned int size);
  void rehash();

  Entry** table_ = nullptr;  ///< null until the first entry
  unsigned int tableSize_ = 11;
  unsigned int count_ = 0;
  unsigned int threshold_ = 8;  ///< so many entries, and the next new key makes the table grow
  float loadFactor_ = 0.75F;
};

template <typename Value>
unsigned int StringHashTable<Value>::hashCode(const String& key) {
  // Four units at a time: the same sum, with a quarter of the multiplications waiting for each other.
  uint32_t h = 0;
  for (const unsigned short* unit = key.getData();; unit += 4) {
    if (unit[0] == 0) break;
    if (unit[1] == 0) {
      h = h * 33 + unit[0];
      break;
    }
    if (unit[2] == 0) {
      h = h * (33 * 33) + (unit[0] * 33u + unit[1]);
      break;
    }
    if (unit[3] == 0) {
      h = h * (33 * 33 * 33) + (unit[0] * (33u * 33) + unit[1] * 33u + unit[2]);
      break;
    }
    h = h * (33 * 33 * 33 * 33) + (unit[0] * (33u * 33 * 33) + unit[1] * (33u * 33) + unit[2] * 33u + unit[3]);
  }
  return h % 0x7FFFFFFF;
}

template <typename Value>
Array<String> StringHashTable<Value>::getKeys() const {
  const Trace trace(stringHashTableTraceUnit);
  Array<String> keys;
  keys.reserveCapacity(count_);
  for (unsigned int i = 0; table_ && i < tableSize_; ++i) {
    for (const Entry* entry = table_[i]; entry; entry = entry->next) keys.append(entry->key);
  }
  return keys;
}

template <typename Value>
bool StringHashTable<Value>::createTable(Entry*** table, unsigned int size) {
  const Trace trace(stringHashTableTraceUnit);
  *table = new (std::nothrow) Entry*[size]();
  return *table != nullptr;
}

template <typename Value>
typename StringHashTable<Value>::Entry* StringHashTable<Value>::findEntry(const String& key, unsigned int hash) const {
  if (!table_) return nullptr;
  Entry* entry = bucketOf(hash);
  while (entry && !(entry->hash == hash && entry->key == key)) entry = entry->next;
  return entry;
}

template <typename Value>
void StringHashTable<Value>::insertEntry(unsigned int hash, const String& key, const Value& value) {
  if (!table_) table_ = newTable(tableSize_);
  if (count_ >= threshold_) rehash();
  link(new Entry{hash, key, value, nullptr}, bucketOf(hash));
  ++count_;
}

template <typename Value>
typename StringHashTable<Value>::Entry* StringHashTable<Value>::takeEntry(const String& key) {
  if (!table_) return nullptr;
  const unsigned int hash = hashCode(key);
  for (Entry** at = &bucketOf(hash); *at; at = &(*at)->next) {
    if ((*at)->hash != hash || !((*at)->key == key)) continue;
    --count_;
    return std::exchange(*at, (*at)->next);
  }
  return nullptr;
}

template <typename Value>
template <typename Release>
void StringHashTable<Value>::removeAllEntries(Release release) {
  const Trace trace(stringHashTableTraceUnit);
  Entry** table = std::exchange(table_, nullptr);
  count_ = 0;
  for (unsigned int i = 0; table && i < tableSize_; ++i) {
    while (Entry* entry = table[i]) {
      table[i] = entry->next;
      release(entry->value);
      delete entry;
    }
  }
  delete[] table;
}

template <typename Value>
void StringHashTable<Value>::copyEntries(const StringHashTable& other) {
  const Trace trace(stringHashTableTraceUnit);
  tableSize_ = other.tableSize_;
  threshold_ = other.threshold_;
  loadFactor_ = other.loadFactor_;
  if (!other.table_) return;
  table_ = newTable(tableSize_);
  for (unsigned int i = 0; i < other.tableSize_; ++i) {
    for (const Entry* entry = other.table_[i]; entry; entry = entry->next) {
      insertEntry(entry->hash, entry->key, entry->value);
    }
  }
}

template <typename Value>
typename StringHashTable<Value>::Entry** StringHashTable<Value>::newTable(unsigned int size) {
  Entry** table = nullptr;
  if (!createTable(&table, size)) throw std::bad_alloc();
  return table;
}

template <typename Value>
void StringHashTable<Value>::rehash() {
  const Trace trace(stringHashTableTraceUnit);
  const unsigned int newSize = tableSize_ * 2 + 1;
  Entry** oldTable = std::exchange(table_, newTable(newSize));
  const unsigned int oldSize = std::exchange(tableSize_, newSize);
  threshold_ = static_cast<unsigned int>(static_cast<float>(newSize) * loadFactor_);
  for (unsigned int i = oldSize; i-- > 0;) {
    while (Entry* entry = oldTable[i]) {
      oldTable[i] = entry->next;
      link(entry, bucketOf(entry->hash));
    }
  }
  delete[] oldTable;
}

}  // namespace VMQ
