#include "tests/mgmt/fresh_process.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#ifdef VMQ_COVERAGE
extern "C" void __gcov_dump();  // its header leaves the language out
#endif

void endWithTestResult() {
  const testing::TestResult& result = *testing::UnitTest::GetInstance()->current_test_info()->result();
  for (int part = 0; part < result.total_part_count(); ++part) {
    const testing::TestPartResult& each = result.GetTestPartResult(part);
    if (each.failed()) fprintf(stderr, "%s:%d: %s\n", each.file_name(), each.line_number(), each.message());
  }
  fflush(nullptr);
#ifdef VMQ_COVERAGE
  __gcov_dump();  // which _exit leaves out
#endif
  _exit(result.Failed() ? EXIT_FAILURE : EXIT_SUCCESS);
}
