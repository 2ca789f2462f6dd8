#pragma once
// One table of an application: creates its request objects and keeps the list of the open ones.

#include <string>

#include "bss1.h"
#include "bxira.h"
#include "linked_list.h"

class TableManager {
 public:
  /// The texts are copied. Throws std::bad_alloc.
  TableManager(const char* application, const char* table);
  virtual ~TableManager();
  TableManager(const TableManager&) = delete;
  TableManager& operator=(const TableManager&) = delete;

  /// A new request object, for the framework to destroy.
  virtual bxira* CreateBxira(RequestDetail* detail, ContextInfo* context) = 0;

  /// Makes the table known under its application and table name. Returns 0, EINVAL for null, EEXIST when the name is
  /// taken, or ENOMEM. The manager must live as long as the process.
  static unsigned RegisterWithManager(TableManager* manager);

  [[nodiscard]] const char* application() const { return application_.c_str(); }
  [[nodiscard]] const char* table() const { return table_.c_str(); }
  [[nodiscard]] RES1_Handle handle() const { return handle_; }
  [[nodiscard]] BSS1_Lock* lock() const { return lock_; }

  LinkedList requests;  ///< the open requests, oldest first; guarded by lock()

 private:
  const std::string application_;
  const std::string table_;
  const RES1_Handle handle_;
  BSS1_Lock* const lock_;
};
