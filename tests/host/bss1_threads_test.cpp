// Environment, locks, timed waits and one-time initialisation between threads and across fork.

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "bss1.h"

namespace {

TEST(LockThreads, KeepEachOtherOut) {
  BSS1_Lock* const lock = BSS1_NewLock();
  int counter = 0;
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      for (int turn = 0; turn < 2000; ++turn) {
        BSS1_GetLock(lock);
        BSS1_GetLock(lock);
        ++counter;
        BSS1_ReleaseLock(lock);
        ++counter;
        BSS1_ReleaseLock(lock);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(counter, 16000);
  BSS1_DeleteLock(lock);
}

TEST(LockThreads, CannotGiveBackWhatAnotherHolds) {
  BSS1_Lock* const lock = BSS1_NewLock();
  BSS1_GetLock(lock);
  std::thread([&] { EXPECT_EQ(BSS1_ReleaseLock(lock), EPERM); }).join();
  EXPECT_EQ(BSS1_ReleaseLock(lock), 0);
  BSS1_DeleteLock(lock);
}

TEST(LockThreads, LeaveAForkedChildTheLocksOfTheThreadThatForked) {
  BSS1_Lock* const lock = BSS1_NewLock();
  BSS1_GetLock(lock);
  BSS1_GetLock(BSS1_EnvironmentLock());
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    alarm(30);
    const bool held = BSS1_GetLock(lock) == 0 && BSS1_ReleaseLock(lock) == 0 && BSS1_ReleaseLock(lock) == 0;
    const bool environment_held = BSS1_ReleaseLock(BSS1_EnvironmentLock()) == 0;
    const bool nothing_left = BSS1_ReleaseLock(BSS1_EnvironmentLock()) == EPERM && BSS1_ReleaseLock(lock) == EPERM;
    _exit(held && environment_held && nothing_left && BSS1_PutEnv("VMQ_TEST_CHILD=1") == 0 ? 0 : 1);
  }
  int status = -1;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(status, 0);
  BSS1_ReleaseLock(BSS1_EnvironmentLock());
  BSS1_ReleaseLock(lock);
  BSS1_DeleteLock(lock);
}

TEST(EnvironmentThreads, ReadWriteAndCopyTheEnvironmentAtTheSameTime) {
  std::atomic<bool> done = false;
  std::thread writer([&] {
    for (int i = 0; i < 3000; ++i) (void)BSS1_PutEnv(i % 2 == 0 ? "VMQ_TEST_T=even" : "VMQ_TEST_T=odd, and longer");
    done = true;
  });
  std::thread reader([&] {
    while (!done) {
      const char* const value = BSS1_GetEnv("VMQ_TEST_T", "even");
      EXPECT_TRUE(std::strcmp(value, "even") == 0 || std::strcmp(value, "odd, and longer") == 0);
    }
  });
  std::thread copier([&] {
    while (!done) {
      BSS1_GetLock(BSS1_EnvironmentLock());
      size_t bytes = 0;
      for (char** entry = environ; *entry != nullptr; ++entry) bytes += std::strlen(*entry);
      BSS1_ReleaseLock(BSS1_EnvironmentLock());
      EXPECT_GT(bytes, 0u);
    }
  });
  for (std::thread* thread : {&writer, &reader, &copier}) thread->join();
  unsetenv("VMQ_TEST_T");
}

TEST(TimedWaitThreads, WakeOnTheSignal) {
  pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
  pthread_cond_t condition = PTHREAD_COND_INITIALIZER;
  bool ready = false;
  std::thread signaller([&] {
    pthread_mutex_lock(&mutex);
    ready = true;
    pthread_cond_signal(&condition);
    pthread_mutex_unlock(&mutex);
  });
  int result = 0;
  pthread_mutex_lock(&mutex);
  while (!ready && result == 0) result = BSS1_TimedWait(&condition, &mutex, INT64_MAX);
  pthread_mutex_unlock(&mutex);
  signaller.join();
  EXPECT_EQ(result, 0);
}

std::atomic<int> initialisations = 0;

TEST(OnceThreads, WaitForTheOneThatInitialises) {
  static BSS1_Once once;
  once = BSS1_ONCE_INIT;  // also when the test runs again
  initialisations = 0;
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      EXPECT_EQ(BSS1_InitializeOnce(&once,
                                    [] {
                                      for (int turn = 0; turn < 1000; ++turn) std::this_thread::yield();
                                      ++initialisations;
                                    }),
                0);
      EXPECT_EQ(initialisations, 1);
    });
  }
  for (std::thread& thread : threads) thread.join();
}

}  // namespace
