#pragma once
// For tests of what a process does only once.

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>

/// Runs the statements in a process of their own, which has done nothing before; their failures are this test's.
#define IN_FRESH_PROCESS(...)                                               \
  do {                                                                      \
    GTEST_FLAG_SET(death_test_style, "threadsafe");                         \
    EXPECT_EXIT(                                                            \
        {                                                                   \
          __VA_ARGS__;                                                      \
          fflush(nullptr);                                                  \
          _exit(testing::Test::HasFailure() ? EXIT_FAILURE : EXIT_SUCCESS); \
        },                                                                  \
        testing::ExitedWithCode(EXIT_SUCCESS), "");                         \
  } while (false)
