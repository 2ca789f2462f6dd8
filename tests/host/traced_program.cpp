// A process that traces and never calls RAS1_Configure.

#include "ras1.h"

namespace {
constinit RAS1_Unit unit{"tests/traced_program"};
}

int main() {
  if (RAS1_Enabled(unit, RAS1_ERROR)) RAS1_Printf(&unit, RAS1_ERROR, 1, "main", "an error");
  if (RAS1_Enabled(unit, RAS1_DETAIL)) RAS1_Printf(&unit, RAS1_DETAIL, 2, "main", "a detail");
  return 0;
}
