#pragma once
// One agent in the run-as database.

#include "util/array.h"
#include "util/instance_entry.h"
#include "util/string.h"

namespace VMQ {

/// A product code and the instances known for it, which it owns. Belongs to one thread at a time. Pointers handed out
/// are valid until the entry is destroyed or the instance removed.
class AgentEntry {
 public:
  explicit AgentEntry(const String& productCode);
  /// Copies every instance.
  AgentEntry(const AgentEntry& other);
  AgentEntry& operator=(const AgentEntry&) = delete;
  virtual ~AgentEntry();

  /// Takes ownership. Names may repeat; lookups find the first.
  void addInstance(InstanceEntry* instance);
  /// Destroys the instance but keeps its slot, which holds null from then on: the count does not change. Kept on
  /// purpose, unlike StartupDB::removeAgent. Does nothing when the index is not below the count.
  void removeInstance(unsigned index);
  /// Null when the index is not below the count, or its instance was removed.
  [[nodiscard]] InstanceEntry* getInstance(unsigned index) const;
  /// The first instance of exactly this name, or null.
  [[nodiscard]] InstanceEntry* getInstance(const String& instanceName) const;
  /// Slots of removed instances included.
  [[nodiscard]] unsigned getNumInstances() const;
  [[nodiscard]] String getProductCode() const;

 private:
  const String product_code_;
  Array<long> instances_;  // InstanceEntry pointers, owned; null where one was removed
};

}  // namespace VMQ
