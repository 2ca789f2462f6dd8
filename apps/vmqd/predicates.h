#pragma once
// The predicates of a query or a watch, checked against the table that they are for.

#include <cstdint>
#include <string>
#include <string_view>

#include "apps/vmqd/table_catalog.h"

namespace vmqd {

/// Collects predicates in the order in which they come. Everything throws Refusal, with a sentence that names the
/// column.
class Predicates {
 public:
  explicit Predicates(const Table& table);

  /// The named operator: eq, ne, lt, le, gt or ge.
  static _IntfOper operatorNamed(std::string_view column, std::string_view name);

  void add(std::string_view column, _IntfOper oper, std::string_view value);

  [[nodiscard]] const Table& table() const { return table_; }
  [[nodiscard]] const RequestDetail& request() const { return request_; }

 private:
  const Table& table_;
  RequestDetail request_;
};

}  // namespace vmqd
