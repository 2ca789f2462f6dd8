#pragma once
// The columns of a table as data, and everything that follows from them alone.

#include <cstddef>
#include <cstdint>
#include <span>

#include "bxira.h"
#include "util/trace.h"

namespace VMQ {

struct TableColumn {
  const char* name;       ///< upper case, as a predicate names it
  const char* attribute;  ///< lower case
  uint16_t type;          ///< COLUMN_CHARACTER or COLUMN_INTEGER
  uint16_t width;         ///< bytes
  uint32_t offset;        ///< bytes from the start of the row
};

using TableColumns = std::span<const TableColumn>;

template <class Member>
inline constexpr uint16_t columnType = COLUMN_CHARACTER;
template <>
inline constexpr uint16_t columnType<int32_t> = COLUMN_INTEGER;

// One column, described by the member of the row that holds it. A macro, because offsetof and the attribute's text need
// the member's name.
#define VMQ_COLUMN(NAME, Row, member)                                                                 \
  VMQ::TableColumn {                                                                                  \
    NAME, #member, VMQ::columnType<decltype(Row::member)>, sizeof(Row::member), offsetof(Row, member) \
  }

/// Status of a request that names a column which is not there.
inline constexpr unsigned STATUS_NO_SUCH_COLUMN = 0x21060007;

/// Describes one column. STATUS_NO_SUCH_COLUMN for a negative index or one above the number of columns. Kept on
/// purpose: the number of columns itself is accepted (0) and describes nothing.
unsigned describeColumn(TableColumns columns, ColumnInfo* info, int index);

/// Non-zero when the named column of the row satisfies the predicate; 0 for a column that is not there.
unsigned columnIsException(TableColumns columns, const char* name, const char* row, _IntfOper oper, const char* value);

/// Traces one row, a line for each column, at the detail level.
void traceRow(const Trace& trace, TableColumns columns, const char* row);

}  // namespace VMQ
