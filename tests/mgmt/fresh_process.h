#pragma once
// For tests of what a process does only once.

#include <gtest/gtest.h>

/// Ends this process, with the failures of the running test on standard error and in the exit code.
[[noreturn]] void endWithTestResult();

/// Runs the statements in a process of their own, which has done nothing before; their failures are this test's.
#define IN_FRESH_PROCESS(...)                       \
  do {                                              \
    GTEST_FLAG_SET(death_test_style, "threadsafe"); \
    EXPECT_EXIT(                                    \
        {                                           \
          __VA_ARGS__;                              \
          endWithTestResult();                      \
        },                                          \
        testing::ExitedWithCode(EXIT_SUCCESS), ""); \
  } while (false)
