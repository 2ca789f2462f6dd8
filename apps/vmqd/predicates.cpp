// The predicates of a query or a watch.

#include "apps/vmqd/predicates.h"

#include <charconv>

#include "apps/vmqd/json_text.h"
#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

struct Operator {
  std::string_view name;
  _IntfOper oper;
};
constexpr Operator operators[] = {
    {"eq", INTF_EQ}, {"ne", INTF_NE}, {"lt", INTF_LT}, {"le", INTF_LE}, {"gt", INTF_GT}, {"ge", INTF_GE},
};

bool isInteger(std::string_view text) {
  int32_t number;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  return error == std::errc() && end == text.data() + text.size();
}

[[noreturn]] void refuse(std::string_view column, std::string_view what) {
  throw Refusal(errors::badRequest, "The value of " + std::string(column) + " " + std::string(what) + ".");
}

}  // namespace

Predicates::Predicates(const Table& table) : table_(table) {
  request_.application = table.description.application;
  request_.table = table.description.table;
  request_.predicates.reserve(16);
}

_IntfOper Predicates::operatorNamed(std::string_view column, std::string_view name) {
  for (const Operator& each : operators) {
    if (each.name == name) return each.oper;
  }
  throw Refusal(errors::unknownOperator, inQuotes(name) + ", given for " + inQuotes(column) +
                                             ", is not one of the operators eq, ne, lt, le, gt and ge.");
}

void Predicates::add(std::string_view column, _IntfOper oper, std::string_view value) {
  const vmqhost::ColumnDescription* const known = table_.findColumn(column);
  if (known == nullptr) {
    throw Refusal(errors::unknownColumn,
                  "The table " + table_.description.table + " has no column " + inQuotes(column) + ".");
  }
  if (value.size() > UINT16_MAX) refuse(column, "is longer than 65535 bytes");
  if (value.find('\0') != std::string_view::npos) refuse(column, "holds a NUL character");
  if (!isUtf8(value)) refuse(column, "is not UTF-8");
  if (known->info.type == COLUMN_INTEGER && !isInteger(value)) refuse(column, "is not a 32-bit integer");
  request_.predicates.push_back({known->name, oper, std::string(value)});
}

}  // namespace vmqd
