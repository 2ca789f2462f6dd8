// The tables that the component has registered, as clients see them.

#include "apps/vmqd/table_catalog.h"

#include <algorithm>
#include <utility>

#include "apps/vmqd/json_text.h"

namespace vmqd {
namespace {

void appendColumn(std::string& out, const vmqhost::ColumnDescription& column) {
  out += R"({"name":)";
  appendJsonString(out, column.name);
  out += column.info.type == COLUMN_INTEGER ? R"(,"type":"integer","width":)" : R"(,"type":"character","width":)";
  appendJsonNumber(out, column.info.byte_width);
  out += R"(,"offset":)";
  appendJsonNumber(out, column.info.byte_offset);
  out += '}';
}

void appendTable(std::string& out, const vmqhost::TableDescription& table) {
  out += R"({"application":)";
  appendJsonString(out, table.application);
  out += R"(,"table":)";
  appendJsonString(out, table.table);
  out += R"(,"row_bytes":)";
  appendJsonNumber(out, table.row_bytes);
  out += R"(,"columns":[)";
  for (const auto& column : table.columns) {
    if (&column != &table.columns.front()) out += ',';
    appendColumn(out, column);
  }
  out += "]}";
}

}  // namespace

const vmqhost::ColumnDescription* Table::findColumn(std::string_view name) const {
  const auto& columns = description.columns;
  const auto found = std::find_if(columns.begin(), columns.end(), [&](const auto& each) { return each.name == name; });
  return found == columns.end() ? nullptr : &*found;
}

TableCatalog::TableCatalog(std::vector<vmqhost::TableDescription> descriptions) : json_(R"({"tables":[)") {
  tables_.reserve(descriptions.size());
  for (auto& description : descriptions) {
    if (!tables_.empty()) json_ += ',';
    appendTable(json_, description);
    tables_.emplace_back(std::move(description));
  }
  json_ += "]}";
}

const Table* TableCatalog::find(std::string_view name) const {
  const auto found =
      std::find_if(tables_.begin(), tables_.end(), [&](const Table& each) { return each.description.table == name; });
  return found == tables_.end() ? nullptr : &*found;
}

}  // namespace vmqd
