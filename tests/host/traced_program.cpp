// A process that traces and never calls RAS1_Configure.

#include <cerrno>

#include "ras1.h"

namespace {
constinit RAS1_Unit unit{"tests/traced_program"};
}

int main() {
  errno = ENOTDIR;
  if (RAS1_Enabled(unit, RAS1_ERROR)) RAS1_Printf(&unit, RAS1_ERROR, 1, "main", "an error");
  if (RAS1_Enabled(unit, RAS1_DETAIL)) RAS1_Printf(&unit, RAS1_DETAIL, 2, "main", "a detail");
  return errno == ENOTDIR ? 0 : 1;  // the first line, which reads the configuration, leaves it alone as well
}
