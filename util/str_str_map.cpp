#include "util/str_str_map.h"

namespace VMQ {

namespace {
RAS1_Unit traceUnit{"util/str_str_map"};
}

StrStrMap::StrStrMap(const StrStrMap& other) : StrStrMap() {
  copyEntries(other);
}

void StrStrMap::put(const String& key, const String& value) {
  const Trace trace(traceUnit);
  const unsigned int hash = hashCode(key);
  if (Entry* entry = findEntry(key, hash)) {
    entry->value = value;
  } else {
    insertEntry(hash, key, value);
  }
}

bool StrStrMap::get(const String& key, String& value) const {
  const Trace trace(traceUnit);
  const Entry* entry = findEntry(key, hashCode(key));
  if (entry) value = entry->value;
  return entry != nullptr;
}

void StrStrMap::remove(const String& key) {
  const Trace trace(traceUnit);
  delete takeEntry(key);
}

void StrStrMap::removeAll() {
  removeAllEntries([](const String&) {});
}

}  // namespace VMQ
