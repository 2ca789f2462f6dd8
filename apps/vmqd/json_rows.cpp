// Rows of one table as JSON objects.

#include "apps/vmqd/json_rows.h"

#include <cstdint>
#include <cstring>

#include "apps/vmqd/json_text.h"

namespace vmqd {

size_t unpaddedBytes(const char* text, size_t width) {
  // Most of a wide column is padding, so it is skipped eight bytes at a time.
  constexpr uint64_t blanks = 0x2020202020202020;
  for (uint64_t block; width >= sizeof block; width -= sizeof block) {
    std::memcpy(&block, text + width - sizeof block, sizeof block);
    if (block != blanks && block != 0) break;
  }
  while (width > 0 && (text[width - 1] == ' ' || text[width - 1] == '\0')) --width;
  return width;
}

JsonRowWriter::JsonRowWriter(const vmqhost::TableDescription& table) {
  for (const auto& [name, info] : table.columns) {
    std::string key = columns_.empty() ? "{" : ",";
    appendJsonString(key, name);
    key += ':';
    columns_.push_back({std::move(key), info.byte_offset, info.byte_width, info.type == COLUMN_INTEGER});
  }
}

void JsonRowWriter::append(std::string& out, const char* row) const {
  if (columns_.empty()) out += '{';
  for (const Column& column : columns_) {
    out += column.key;
    const char* const cell = row + column.offset;
    if (column.is_integer) {
      int32_t number;
      std::memcpy(&number, cell, sizeof number);
      appendJsonNumber(out, number);
    } else {
      appendJsonString(out, {cell, unpaddedBytes(cell, column.width)});
    }
  }
  out += '}';
}

}  // namespace vmqd
