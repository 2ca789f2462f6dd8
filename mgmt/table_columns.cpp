#include "mgmt/table_columns.h"

#include <cstring>

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"mgmt/table_columns"};

/// Rows are packed, so an integer in one may stand at any address.
int32_t integerAt(const char* place) {
  int32_t number;
  std::memcpy(&number, place, sizeof number);
  return number;
}

}  // namespace

unsigned describeColumn(TableColumns columns, ColumnInfo* info, int index) {
  const Trace trace(traceUnit);
  if (index < 0 || static_cast<size_t>(index) > columns.size()) return STATUS_NO_SUCH_COLUMN;
  if (static_cast<size_t>(index) == columns.size()) return 0;
  const TableColumn& column = columns[static_cast<size_t>(index)];
  *info = {
      .attribute = column.attribute, .byte_offset = column.offset, .byte_width = column.width, .type = column.type};
  return 0;
}

unsigned columnIsException(TableColumns columns, const char* name, const char* row, _IntfOper oper, const char* value) {
  const Trace trace(traceUnit);
  for (const TableColumn& column : columns) {
    if (std::strcmp(column.name, name) != 0) continue;
    const char* const place = row + column.offset;
    return column.type == COLUMN_INTEGER ? bxira::IsException(oper, integerAt(place), value)
                                         : bxira::IsException(oper, place, column.width, value);
  }
  return 0;
}

void traceRow(const Trace& trace, TableColumns columns, const char* row) {
  TRACE_DETAIL(trace, "\t\t{\n");
  for (const TableColumn& column : columns) {
    const char* const place = row + column.offset;
    if (column.type == COLUMN_INTEGER)
      TRACE_DETAIL(trace, "\t\t%s=%d\n", column.attribute, integerAt(place));
    else
      TRACE_DETAIL(trace, "\t\t%s=\"%.*s\"\n", column.attribute, static_cast<int>(column.width), place);
  }
  TRACE_DETAIL(trace, "\t\t}\n");
}

}  // namespace VMQ
