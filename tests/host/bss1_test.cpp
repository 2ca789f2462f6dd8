// Environment, locks, clocks and one-time initialisation, as one thread sees them.

#include "bss1.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <climits>
#include <ctime>
#include <stdexcept>
#include <string>

#include "tests/support/scoped_variable.h"

namespace {

// ---- environment -------------------------------------------------------------------------------------------------

TEST(Environment, GivesTheValueOrTheDefault) {
  const ScopedVariable set("VMQ_TEST_A", "value");
  const ScopedVariable empty("VMQ_TEST_B", "");
  const ScopedVariable unset("VMQ_TEST_C", std::nullopt);
  EXPECT_STREQ(BSS1_GetEnv("VMQ_TEST_A", "default"), "value");
  EXPECT_STREQ(BSS1_GetEnv("VMQ_TEST_B", "default"), "");
  EXPECT_STREQ(BSS1_GetEnv("VMQ_TEST_C", "default"), "default");
  EXPECT_EQ(BSS1_GetEnv("VMQ_TEST_C", nullptr), nullptr);
  EXPECT_EQ(BSS1_GetEnv(nullptr, nullptr), nullptr);
}

TEST(Environment, ValueStaysUnchangedWhenTheVariableChangesOrGoes) {
  const ScopedVariable restores("VMQ_TEST_A", "first");
  const char* const first = BSS1_GetEnv("VMQ_TEST_A", nullptr);
  ASSERT_EQ(BSS1_PutEnv("VMQ_TEST_A=second, and longer than before"), 0);
  const char* const second = BSS1_GetEnv("VMQ_TEST_A", nullptr);
  ASSERT_EQ(unsetenv("VMQ_TEST_A"), 0);
  EXPECT_STREQ(first, "first");
  EXPECT_STREQ(second, "second, and longer than before");
}

TEST(Environment, ValueReadManyTimesIsKeptOnce) {
  const ScopedVariable set("VMQ_TEST_A", "value");
  const char* const once = BSS1_GetEnv("VMQ_TEST_A", nullptr);
  EXPECT_EQ(BSS1_GetEnv("VMQ_TEST_A", nullptr), once);
}

TEST(Environment, AssignmentIsCopied) {
  const ScopedVariable restores("VMQ_TEST_A", std::nullopt);
  char assignment[] = "VMQ_TEST_A=a=b";
  ASSERT_EQ(BSS1_PutEnv(assignment), 0);
  assignment[sizeof assignment - 2] = 'X';
  EXPECT_STREQ(getenv("VMQ_TEST_A"), "a=b");
  ASSERT_EQ(BSS1_PutEnv("VMQ_TEST_A="), 0);
  EXPECT_STREQ(getenv("VMQ_TEST_A"), "");
}

TEST(Environment, RefusesWhatIsNoAssignment) {
  for (const char* const wrong : {"", "NAME", "=value", "="}) EXPECT_EQ(BSS1_PutEnv(wrong), EINVAL) << wrong;
  EXPECT_EQ(BSS1_PutEnv(nullptr), EINVAL);
}

TEST(Environment, CallsWorkWhileTheThreadHoldsTheLock) {
  const ScopedVariable restores("VMQ_TEST_A", std::nullopt);
  ASSERT_EQ(BSS1_GetLock(BSS1_EnvironmentLock()), 0);
  EXPECT_EQ(BSS1_PutEnv("VMQ_TEST_A=x"), 0);
  EXPECT_STREQ(BSS1_GetEnv("VMQ_TEST_A", nullptr), "x");
  EXPECT_EQ(BSS1_ReleaseLock(BSS1_EnvironmentLock()), 0);
}

// ---- locks -------------------------------------------------------------------------------------------------------

TEST(Lock, MayBeTakenAgainByItsHolder) {
  BSS1_Lock* const lock = BSS1_NewLock();
  ASSERT_NE(lock, nullptr);
  for (int i = 0; i < 3; ++i) EXPECT_EQ(BSS1_GetLock(lock), 0);
  for (int i = 0; i < 3; ++i) EXPECT_EQ(BSS1_ReleaseLock(lock), 0);
  BSS1_DeleteLock(lock);
}

TEST(Lock, CannotBeGivenBackByAThreadThatDoesNotHoldIt) {
  BSS1_Lock* const lock = BSS1_NewLock();
  EXPECT_EQ(BSS1_ReleaseLock(lock), EPERM);
  EXPECT_EQ(BSS1_GetLock(lock), 0);
  EXPECT_EQ(BSS1_ReleaseLock(lock), 0);
  EXPECT_EQ(BSS1_ReleaseLock(lock), EPERM);
  BSS1_DeleteLock(lock);
}

TEST(Lock, ThatIsNotThereIsAnError) {
  EXPECT_EQ(BSS1_GetLock(nullptr), EINVAL);
  EXPECT_EQ(BSS1_ReleaseLock(nullptr), EINVAL);
  BSS1_DeleteLock(nullptr);
}

// ---- time --------------------------------------------------------------------------------------------------------

TEST(Clock, TellsWallClockSeconds) {
  const time_t before = std::time(nullptr);
  const int64_t told = BSS1_GetTime();
  // std::time may lag behind by a timer tick.
  EXPECT_GE(told, before);
  EXPECT_LE(told, std::time(nullptr) + 1);
}

TEST(Clock, OfElapsedMillisecondsNeverStepsBack) {
  int64_t last = BSS1_GetElapsed();
  for (int i = 0; i < 100000; ++i) {
    const int64_t now = BSS1_GetElapsed();
    ASSERT_GE(now, last);
    last = now;
  }
}

TEST(Clock, SleepsWholeSeconds) {
  BSS1_Sleep(0);
  const int64_t before = BSS1_GetElapsed();
  BSS1_Sleep(1);
  EXPECT_GE(BSS1_GetElapsed() - before, 999);
}

class TimedWait : public testing::Test {
 protected:
  int wait(int64_t milliseconds) {
    pthread_mutex_lock(&mutex_);
    const int result = BSS1_TimedWait(&condition_, &mutex_, milliseconds);
    pthread_mutex_unlock(&mutex_);
    return result;
  }

  pthread_mutex_t mutex_ = PTHREAD_MUTEX_INITIALIZER;
  pthread_cond_t condition_ = PTHREAD_COND_INITIALIZER;
};

TEST_F(TimedWait, EndsAfterItsTime) {
  const int64_t before = BSS1_GetElapsed();
  int result = 0;
  while (result == 0) result = wait(30);
  EXPECT_EQ(result, ETIMEDOUT);
  EXPECT_GE(BSS1_GetElapsed() - before, 29);
}

TEST_F(TimedWait, EndsAtOnceWithoutTime) {
  EXPECT_EQ(wait(0), ETIMEDOUT);
  EXPECT_EQ(wait(-5), ETIMEDOUT);
  EXPECT_EQ(wait(INT64_MIN), ETIMEDOUT);
}

// ---- once --------------------------------------------------------------------------------------------------------

int calls = 0;
BSS1_Once innerOnce = BSS1_ONCE_INIT;

TEST(Once, RunsTheFirstTimeOnly) {
  static BSS1_Once once;
  once = BSS1_ONCE_INIT;  // also when the test runs again
  calls = 0;
  for (int i = 0; i < 3; ++i) EXPECT_EQ(BSS1_InitializeOnce(&once, [] { ++calls; }), 0);
  EXPECT_EQ(calls, 1);
}

TEST(Once, MayNeedAnother) {
  static BSS1_Once outer;
  outer = BSS1_ONCE_INIT;  // also when the test runs again
  innerOnce = BSS1_ONCE_INIT;
  calls = 0;
  EXPECT_EQ(BSS1_InitializeOnce(&outer,
                                [] {
                                  EXPECT_EQ(BSS1_InitializeOnce(&innerOnce, [] { calls += 10; }), 0);
                                  ++calls;
                                }),
            0);
  EXPECT_EQ(calls, 11);
}

TEST(Once, KeepsAnExceptionAndDoesNotRunAgain) {
  static BSS1_Once once;
  once = BSS1_ONCE_INIT;  // also when the test runs again
  calls = 0;
  EXPECT_EQ(BSS1_InitializeOnce(&once,
                                [] {
                                  ++calls;
                                  throw std::runtime_error("no");
                                }),
            ECANCELED);
  EXPECT_EQ(BSS1_InitializeOnce(&once, [] { ++calls; }), 0);
  EXPECT_EQ(calls, 1);
}

TEST(Once, RefusesNull) {
  static BSS1_Once once;
  once = BSS1_ONCE_INIT;  // also when the test runs again
  EXPECT_EQ(BSS1_InitializeOnce(nullptr, [] {}), EINVAL);
  EXPECT_EQ(BSS1_InitializeOnce(&once, nullptr), EINVAL);
}

}  // namespace
