// Tables and their registration.

#include "table_manager.h"

#include <new>

#include "handles.h"
#include "table_registry.h"

namespace {

BSS1_Lock* newLockOrThrow() {
  BSS1_Lock* const lock = BSS1_NewLock();
  if (lock == nullptr) throw std::bad_alloc();
  return lock;
}

const char* orEmpty(const char* text) {
  return text == nullptr ? "" : text;
}

}  // namespace

TableManager::TableManager(const char* application, const char* table)
    : application_(orEmpty(application)),
      table_(orEmpty(table)),
      handle_(vmqhost::newHandle()),
      lock_(newLockOrThrow()) {}

TableManager::~TableManager() {
  BSS1_DeleteLock(lock_);
  vmqhost::retireHandle(handle_);
}
