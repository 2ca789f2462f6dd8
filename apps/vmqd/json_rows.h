#pragma once
// Rows of one table as JSON objects.

#include <string>
#include <vector>

#include "table_client.h"

namespace vmqd {

/// Knows where each column stands and what its key looks like. Immutable: any thread.
class JsonRowWriter {
 public:
  explicit JsonRowWriter(const vmqhost::TableDescription& table);

  /// Appends one object with every column: character columns without the blanks and zero bytes at their end, integers
  /// as numbers. `row` has the table's row_bytes.
  void append(std::string& out, const char* row) const;

 private:
  struct Column {
    std::string key;  ///< with quotes and colon, and what separates it from the column before
    size_t offset;
    size_t width;
    bool is_integer;
  };
  std::vector<Column> columns_;
};

/// The bytes of a column that was filled up with blanks or zero bytes.
size_t unpaddedBytes(const char* text, size_t width);

}  // namespace vmqd
