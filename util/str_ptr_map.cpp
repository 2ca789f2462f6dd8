#include "util/str_ptr_map.h"

#include <memory>

namespace VMQ {

namespace {
RAS1_Unit traceUnit{"util/str_ptr_map"};
}

void StrPtrMap::put(const String& key, void* value) {
  const Trace trace(traceUnit);
  const unsigned int hash = hashCode(key);
  if (Entry* entry = findEntry(key, hash)) {
    // A pointer put again is still in the map: it must not be released.
    if (entry->value != value) release(std::exchange(entry->value, value));
  } else {
    insertEntry(hash, key, value);
  }
}

bool StrPtrMap::get(const String& key, void** value) const {
  const Trace trace(traceUnit);
  const Entry* entry = findEntry(key, hashCode(key));
  if (entry) *value = entry->value;
  return entry != nullptr;
}

void StrPtrMap::remove(const String& key) {
  const Trace trace(traceUnit);
  if (const std::unique_ptr<Entry> entry{takeEntry(key)}) release(entry->value);
}

void StrPtrMap::removeAll() {
  removeAllEntries([this](void* value) { release(value); });
}

void StrPtrMap::release(void* value) const {
  if (!autoDeleteValues_ || !value) return;
  if (freeValueFunc_) {
    freeValueFunc_(value);
  } else {
    ::operator delete(value);
  }
}

}  // namespace VMQ
