#pragma once
// The tables that the component has registered, as clients see them.

#include <string>
#include <string_view>
#include <vector>

#include "apps/vmqd/json_rows.h"
#include "table_client.h"

namespace vmqd {

struct Table {
  explicit Table(vmqhost::TableDescription described) : description(std::move(described)), rows(description) {}

  vmqhost::TableDescription description;
  JsonRowWriter rows;

  [[nodiscard]] const vmqhost::ColumnDescription* findColumn(std::string_view name) const;
};

/// Immutable: any thread.
class TableCatalog {
 public:
  explicit TableCatalog(std::vector<vmqhost::TableDescription> descriptions);

  /// The first table of this name, or null.
  [[nodiscard]] const Table* find(std::string_view name) const;
  [[nodiscard]] bool empty() const { return tables_.empty(); }

  /// {"tables":[...]}, in the order of registration.
  [[nodiscard]] const std::string& json() const { return json_; }

 private:
  std::vector<Table> tables_;
  std::string json_;
};

}  // namespace vmqd
