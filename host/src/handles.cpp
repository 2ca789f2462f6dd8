// One locked table of handles.

#include "handles.h"

#include <cerrno>
#include <unordered_map>

namespace {

struct Entry {
  bool retired = false;
  unsigned uses = 0;
};

constinit std::mutex mutex;
RES1_Handle lastHandle = 0;  // guarded by mutex, like the table

std::unordered_map<RES1_Handle, Entry>& table() {
  static auto& handles = *new std::unordered_map<RES1_Handle, Entry>;
  return handles;
}

thread_local RES1_Handle currentHandle = 0;

}  // namespace

namespace vmqhost {

RES1_Handle newHandle() {
  const std::lock_guard held(mutex);
  do {
    ++lastHandle;
  } while (lastHandle == 0 || !table().try_emplace(lastHandle).second);
  return lastHandle;
}

void retireHandle(RES1_Handle handle) {
  const std::lock_guard held(mutex);
  const auto found = table().find(handle);
  if (found == table().end()) return;
  found->second.retired = true;
  if (found->second.uses == 0) table().erase(found);
}

}  // namespace vmqhost

unsigned bxira::UseHandle(RES1_Handle handle) {
  const std::lock_guard held(mutex);
  const auto found = table().find(handle);
  if (found == table().end()) return ENOENT;
  ++found->second.uses;
  currentHandle = handle;
  return 0;
}

RES1_Handle bxira::CurrentHandle() {
  return currentHandle;
}

unsigned RES1_Drop(RES1_Handle handle) {
  const std::lock_guard held(mutex);
  const auto found = table().find(handle);
  if (found == table().end() || found->second.uses == 0) return ENOENT;
  if (currentHandle == handle) currentHandle = 0;
  if (--found->second.uses == 0 && found->second.retired) table().erase(found);
  return 0;
}
