#include "util/instance_entry.h"

namespace VMQ {

InstanceEntry::InstanceEntry(const String& instanceName, const String& user)
    : instance_name_(instanceName), user_(user) {}

InstanceEntry::InstanceEntry(const InstanceEntry& other) = default;

InstanceEntry::~InstanceEntry() = default;

String InstanceEntry::getInstanceName() const {
  return instance_name_;
}

String InstanceEntry::getUser() const {
  return user_;
}

void InstanceEntry::setUser(const String& user) {
  user_ = user;
}

}  // namespace VMQ
