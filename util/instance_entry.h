#pragma once
// One instance of an agent in the run-as database.

#include "util/string.h"

namespace VMQ {

/// An instance's name and the operating-system user it runs as. Belongs to one thread at a time.
class InstanceEntry {
 public:
  /// An empty user means: no run-as user.
  InstanceEntry(const String& instanceName, const String& user);
  InstanceEntry(const InstanceEntry& other);
  InstanceEntry& operator=(const InstanceEntry&) = delete;
  virtual ~InstanceEntry();

  [[nodiscard]] String getInstanceName() const;
  [[nodiscard]] String getUser() const;
  void setUser(const String& user);

 private:
  const String instance_name_;
  String user_;
};

}  // namespace VMQ
