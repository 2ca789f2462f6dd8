#include "util/agent_entry.h"

#include <memory>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/agent_entry"};

InstanceEntry* instanceOf(long slot) {
  return reinterpret_cast<InstanceEntry*>(slot);  // NOLINT(performance-no-int-to-ptr): a slot is a long
}
long slotOf(InstanceEntry* instance) {
  return reinterpret_cast<long>(instance);
}

}  // namespace

AgentEntry::AgentEntry(const String& productCode) : product_code_(productCode) {}

// By way of the other constructor, so that the destructor frees what was copied when a later copy fails.
AgentEntry::AgentEntry(const AgentEntry& other) : AgentEntry(other.product_code_) {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < other.getNumInstances(); ++i) {
    const InstanceEntry* const instance = other.getInstance(i);
    addInstance(instance == nullptr ? nullptr : new InstanceEntry(*instance));
  }
}

AgentEntry::~AgentEntry() {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < instances_.getSize(); ++i) delete instanceOf(instances_[i]);
}

void AgentEntry::addInstance(InstanceEntry* instance) {
  std::unique_ptr<InstanceEntry> owner(instance);
  instances_.append(slotOf(instance));
  (void)owner.release();  // the slot's from now on
}

void AgentEntry::removeInstance(unsigned index) {
  const Trace trace(traceUnit);
  if (index >= instances_.getSize()) return;
  delete instanceOf(instances_[index]);
  instances_[index] = slotOf(nullptr);
}

InstanceEntry* AgentEntry::getInstance(unsigned index) const {
  return index < instances_.getSize() ? instanceOf(instances_[index]) : nullptr;
}

InstanceEntry* AgentEntry::getInstance(const String& instanceName) const {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < instances_.getSize(); ++i) {
    InstanceEntry* const instance = instanceOf(instances_[i]);
    if (instance != nullptr && instance->getInstanceName() == instanceName) return instance;
  }
  return nullptr;
}

unsigned AgentEntry::getNumInstances() const {
  return instances_.getSize();
}

String AgentEntry::getProductCode() const {
  return product_code_;
}

}  // namespace VMQ
