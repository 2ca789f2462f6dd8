#pragma once
// Reads the JSON body of a query.

#include <string_view>

#include "apps/vmqd/predicates.h"

namespace vmqd {

/// Adds the predicates of {"predicates":{"COLUMN":value,...}}, where a value is a string, an integer, or an object that
/// maps one operator to a string or an integer. Throws Refusal.
void readQueryBody(std::string_view body, Predicates& predicates);

}  // namespace vmqd
