#pragma once
// The product listing that the installation's inventory tool prints: a header line, then one line of five quoted and
// comma-separated fields for each product and platform.

#include <functional>

#include "util/string.h"

/// One product line.
struct InventoryRecord {
  VMQ::String product_code;
  VMQ::String description;
  VMQ::String platform;
  VMQ::String version;
  VMQ::String release;
};

/// Which lines count. Fields are split at newline, carriage return, comma and double quote, so that quotes and empty
/// fields vanish, and a comma inside a description makes one field more.
enum class InventoryFields {
  kExactlyFive,
  kAtLeastFive,  ///< the fields behind the fifth are ignored
};

/// The installation home + "/bin/qinfo " + the option.
VMQ::String inventoryCommand(const char* option);

/// Calls `visit` for each product line behind the header, in order, until it returns false. Lines with other numbers of
/// fields are traced and skipped; a listing without its header, or with nothing behind it, is traced and has no lines.
void forEachInventoryRecord(const VMQ::String& listing, InventoryFields fields,
                            const std::function<bool(const InventoryRecord&)>& visit);
