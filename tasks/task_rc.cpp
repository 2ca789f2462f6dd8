#include "tasks/task_rc.h"

#include <iterator>

namespace {

constexpr int kFirstCode = 1000;

// Indexed by code minus kFirstCode. Writable only because callers get `char*`; nobody writes to them.
char kMessageIds[][9] = {
    "",                                                          // 1000, and success
    "VMQ1001E", "VMQ1002E", "VMQ1003E", "VMQ1004E", "VMQ1005E",  //
    "VMQ1006E", "VMQ1007E", "VMQ1008E", "VMQ1009E", "VMQ1010E",  //
    "VMQ1011E", "VMQ1012E", "VMQ1013E", "VMQ1014E", "VMQ1015E",  //
    "VMQ1016E", "VMQ1017E", "VMQ1018E", "VMQ1019E", "VMQ1020E",  //
    "VMQ1021E", "VMQ1022E", "VMQ1023E", "VMQ1024E", "VMQ1025E",  //
    "VMQ1026E", "VMQ1027E", "VMQ1028E", "VMQ1029E", "VMQ1030E",  //
    "VMQ1031E", "VMQ1032E", "VMQ1033E", "VMQ1034E",
    "VMQ1035I",  // the one informational message
};
static_assert(std::size(kMessageIds) == TASK_INFORMATION - kFirstCode + 1);

}  // namespace

char* rcToMsgId(TASK_RC rc) {
  if (rc <= kFirstCode || rc > TASK_INFORMATION) return kMessageIds[0];
  return kMessageIds[rc - kFirstCode];
}
