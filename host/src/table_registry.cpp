// Registration of tables by application and table name.

#include "table_registry.h"

#include <algorithm>
#include <cerrno>
#include <mutex>
#include <new>
#include <string_view>

#include "seam.h"
#include "table_client.h"

namespace {

constinit std::mutex mutex;

/// REQUIRES: mutex held.
std::vector<TableManager*>& tables() {
  static auto& registered = *new std::vector<TableManager*>;
  return registered;
}

/// REQUIRES: mutex held.
TableManager* find(std::string_view application, std::string_view table) {
  const auto found = std::find_if(tables().begin(), tables().end(), [&](const TableManager* manager) {
    return manager->application() == application && manager->table() == table;
  });
  return found == tables().end() ? nullptr : *found;
}

}  // namespace

unsigned TableManager::RegisterWithManager(TableManager* manager) try {
  if (int status; vmqhost::seam::fails("RegisterWithManager", &status)) return static_cast<unsigned>(status);
  if (manager == nullptr) return EINVAL;
  const std::lock_guard held(mutex);
  if (find(manager->application(), manager->table()) != nullptr) return EEXIST;
  tables().push_back(manager);
  return 0;
} catch (const std::bad_alloc&) {
  return ENOMEM;
}

std::vector<TableManager*> vmqhost::registeredTables() {
  const std::lock_guard held(mutex);
  return tables();
}

TableManager* vmqhost::findTable(const std::string& application, const std::string& table) {
  const std::lock_guard held(mutex);
  return find(application, table);
}
