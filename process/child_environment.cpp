#include "process/child_environment.h"

#include <unistd.h>

#include <algorithm>
#include <string_view>

#include "bss1.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/child_environment"};

/// Holds the host's environment lock, or goes on without it when it cannot be had: a child without PATH or CORVELHOME
/// would do harm.
class EnvironmentLocked {
 public:
  EnvironmentLocked() : held_(BSS1_GetLock(BSS1_EnvironmentLock()) == 0) {}
  ~EnvironmentLocked() {
    if (held_) (void)BSS1_ReleaseLock(BSS1_EnvironmentLock());  // fails only for a lock that is not held
  }
  EnvironmentLocked(const EnvironmentLocked&) = delete;
  EnvironmentLocked& operator=(const EnvironmentLocked&) = delete;

 private:
  const bool held_;
};

std::string_view nameOf(std::string_view entry) {
  return entry.substr(0, entry.find('='));
}

}  // namespace

ChildEnvironment::ChildEnvironment() {
  const Trace trace(traceUnit);
  const EnvironmentLocked locked;
  for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) entries_.emplace_back(*entry);
}

void ChildEnvironment::put(const char* entry) {
  const Trace trace(traceUnit);
  const std::string_view text(entry);
  const std::string_view name = nameOf(text);
  const auto sameName = [name](const std::string& other) { return nameOf(other) == name; };
  if (name.size() == text.size()) {
    entries_.erase(std::remove_if(entries_.begin(), entries_.end(), sameName), entries_.end());
    return;
  }
  const auto found = std::find_if(entries_.begin(), entries_.end(), sameName);
  if (found != entries_.end()) {
    *found = text;
  } else {
    entries_.emplace_back(text);
  }
}

const char* ChildEnvironment::get(const char* name) const {
  const Trace trace(traceUnit);
  const std::string_view wanted(name);
  for (const std::string& entry : entries_) {
    if (nameOf(entry) == wanted && entry.size() > wanted.size()) return entry.c_str() + wanted.size() + 1;
  }
  return nullptr;
}

char* const* ChildEnvironment::entries() {
  const Trace trace(traceUnit);
  pointers_.clear();
  for (std::string& entry : entries_) pointers_.push_back(entry.data());
  pointers_.push_back(nullptr);
  return pointers_.data();
}

void setEnv(ChildEnvironment& environment, const char* const* entries) {
  const Trace trace(traceUnit);
  for (; entries != nullptr && *entries != nullptr; ++entries) environment.put(*entries);
}

}  // namespace VMQ
