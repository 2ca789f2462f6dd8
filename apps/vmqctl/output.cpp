// Writes tables and JSON.

#include "apps/vmqctl/output.h"

#include <algorithm>

namespace vmqctl {
namespace {

constexpr std::string_view gap = "  ";
constexpr std::string_view ellipsis = "...";
constexpr std::size_t narrowest = 8;  // a column is not cut below this, nor below its name

struct Column {
  std::string name;
  bool number = true;
  std::size_t width = 0;
  std::vector<std::string> cells;
};

std::size_t total(const std::vector<Column>& columns) {
  std::size_t sum = columns.empty() ? 0 : gap.size() * (columns.size() - 1);
  for (const Column& column : columns) sum += column.width;
  return sum;
}

/// Takes width away, one from the widest column at a time, until the columns fit. False when they cannot.
bool shrink(std::vector<Column>& columns, std::size_t width) {
  for (std::size_t excess = total(columns); excess > width; --excess) {
    Column* widest = nullptr;
    for (Column& column : columns) {
      const bool canGive = !column.number && column.width > std::max(narrowest, displayWidth(column.name));
      if (canGive && (widest == nullptr || column.width > widest->width)) widest = &column;
    }
    if (widest == nullptr) return false;
    --widest->width;
  }
  return true;
}

std::string fitted(const std::string& text, const Column& column) {
  if (displayWidth(text) <= column.width) return text;
  return text.substr(0, within(text, column.width - ellipsis.size()).bytes) + std::string(ellipsis);
}

/// One line; blanks at its end are left out.
template <typename CellOf>
std::string line(const std::vector<Column>& columns, CellOf cellOf) {
  std::string text;
  for (const Column& column : columns) {
    if (&column != &columns.front()) text += gap;
    const std::string cell = fitted(cellOf(column), column);
    const std::string blanks(column.width - displayWidth(cell), ' ');
    text += column.number ? blanks + cell : cell + blanks;
  }
  text.erase(text.find_last_not_of(' ') + 1);
  return text + "\n";
}

Column makeColumn(const std::string& name, const std::vector<Json>& rows, Charset charset) {
  Column column;
  column.name = escaped(name, charset);
  column.width = displayWidth(column.name);
  column.number = !rows.empty();
  for (const Json& row : rows) {
    const auto value = row.find(name);
    column.cells.push_back(value == row.end() ? "" : escaped(plain(*value), charset));
    column.width = std::max(column.width, displayWidth(column.cells.back()));
    column.number = column.number && value != row.end() && value->is_number();
  }
  return column;
}

}  // namespace

Layout layoutFor(const Stream& stream) {
  return {stream.width(), stream.charset};
}

std::string plain(const Json& value) {
  return value.is_string() ? value.get<std::string>()
                           : value.dump(-1, ' ', /*ensure_ascii=*/false, Json::error_handler_t::replace);
}

std::string table(const std::vector<std::string>& names, const std::vector<Json>& rows, const Layout& layout) {
  std::vector<Column> columns;
  columns.reserve(names.size());
  for (const std::string& name : names) columns.push_back(makeColumn(name, rows, layout.charset));

  if (layout.width != 0 && !shrink(columns, layout.width)) {
    std::string text;
    for (const Json& row : rows) {
      if (!text.empty()) text += "\n";
      text += record(row, layout);
    }
    return text;
  }
  std::string text = line(columns, [](const Column& column) { return column.name; });
  for (std::size_t row = 0; row < rows.size(); ++row) {
    text += line(columns, [row](const Column& column) { return column.cells[row]; });
  }
  return text;
}

std::string record(const Json& object, const Layout& layout) {
  std::size_t names = 0;
  for (const auto& [name, value] : object.items()) names = std::max(names, displayWidth(escaped(name, layout.charset)));
  const std::size_t indent = names + gap.size();
  const bool wraps = layout.width > indent + narrowest;

  std::string text;
  for (const auto& [name, value] : object.items()) {
    std::string head = escaped(name, layout.charset);
    head += std::string(indent - displayWidth(head), ' ');
    std::string rest = escaped(plain(value), layout.charset);
    do {
      const std::size_t bytes = wraps ? within(rest, layout.width - indent).bytes : rest.size();
      std::string written = head + rest.substr(0, bytes);
      written.erase(written.find_last_not_of(' ') + 1);
      text += written + "\n";
      rest.erase(0, bytes);
      head.assign(indent, ' ');
    } while (!rest.empty());
  }
  return text;
}

std::string linesText(std::string_view text, const Stream& stream) {
  if (!stream.terminal) return std::string(text);
  std::string shown;
  for (;;) {
    const std::size_t end = text.find('\n');
    shown += escaped(text.substr(0, end), stream.charset);
    if (end == std::string_view::npos) return shown;
    shown += '\n';
    text.remove_prefix(end + 1);
  }
}

std::string jsonText(const Json& value, bool oneLine, const Stream& stream) {
  return value.dump(oneLine ? -1 : 2, ' ', /*ensure_ascii=*/stream.terminal, Json::error_handler_t::replace) + "\n";
}

}  // namespace vmqctl
