#pragma once
// The tables that the process has registered.

#include <string>
#include <vector>

#include "table_manager.h"

namespace vmqhost {

/// In the order of registration. Thread-safe; registered managers live as long as the process.
std::vector<TableManager*> registeredTables();

}  // namespace vmqhost
