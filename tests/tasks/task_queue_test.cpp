#include "tasks/task_queue.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <string>
#include <thread>
#include <vector>

#include "tasks/task_manager.h"
#include "test_seam.h"
#include "tests/support/failing_allocation.h"
#include "tests/tasks/failing_calls.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using VMQ::String;

TaskQueueElem request(const std::string& transid) {
  TaskQueueElem element;
  element.transid = String(transid.c_str());
  return element;
}

std::string takenTransid() {
  const auto taken = takeTask();
  return taken ? taken->transid.toNarrow() : "nothing";
}

class TaskQueue : public testing::Test {
 protected:
  void SetUp() override {
    (void)String("converted before there are threads, as the entry point does");
    initializeTaskQueue();
    trace.clear();
  }
  void TearDown() override {
    taskQueue.clear();
    if (queueMutexIsHeld()) pthread_mutex_unlock(&queue_mutex);  // a failed call of the test left it so
  }
  FailingCalls calls;
  TEST_TraceCapture trace;
};

TEST_F(TaskQueue, GivesRequestsInTheOrderOfTheirArrival) {
  for (const char* transid : {"t1", "t2", "t3"}) queueTask(request(transid));
  EXPECT_EQ(takenTransid(), "t1");
  EXPECT_EQ(takenTransid(), "t2");
  EXPECT_EQ(takenTransid(), "t3");
  EXPECT_THAT(taskQueue, IsEmpty());
  EXPECT_FALSE(queueMutexIsHeld());
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
}

TEST_F(TaskQueue, TellsHowManyRequestsItHolds) {
  queueTask(request("t1"));
  queueTask(request("t2"));
  takeTask();
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Executor has 2 items on queue"));
}

TEST_F(TaskQueue, WakesTheThreadThatWaits) {
  std::string taken;
  std::thread executor([&] { taken = takenTransid(); });
  queueTask(request("t1"));
  executor.join();
  EXPECT_EQ(taken, "t1");
}

TEST_F(TaskQueue, LosesNothingOfManyThreads) {
  constexpr int kThreads = 4;
  constexpr int kEach = 50;
  std::vector<std::thread> requesters;
  for (int thread = 0; thread < kThreads; ++thread) {
    requesters.emplace_back([thread] {
      for (int i = 0; i < kEach; ++i) queueTask(request(std::to_string(thread) + "-" + std::to_string(i)));
    });
  }
  std::vector<int> next(kThreads, 0);
  for (int i = 0; i < kThreads * kEach; ++i) {
    const std::string transid = takenTransid();
    const size_t dash = transid.find('-');
    ASSERT_NE(dash, std::string::npos) << transid;
    const auto thread = static_cast<size_t>(std::stoi(transid.substr(0, dash)));
    EXPECT_EQ(std::stoi(transid.substr(dash + 1)), next[thread]++);  // each requester's own order
  }
  for (std::thread& requester : requesters) requester.join();
  EXPECT_THAT(taskQueue, IsEmpty());
}

TEST_F(TaskQueue, WakeUpWithoutWorkWaitsAgain) {
  int waits = 0;
  calls.wait = [&] {
    if (++waits == 3) taskQueue.push_back(request("t1"));
    return 0;
  };
  EXPECT_EQ(takenTransid(), "t1");
  EXPECT_EQ(waits, 3);
  EXPECT_FALSE(queueMutexIsHeld());
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Executor awoken by signal"));
}

TEST_F(TaskQueue, FailedWaitOnAnEmptyQueueKeepsTheMutexForTheNextAttempt) {
  calls.wait = [] { return EINVAL; };
  EXPECT_EQ(takenTransid(), "nothing");
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Failed to wait on condition, return code 22"));
  EXPECT_TRUE(queueMutexIsHeld());
}

TEST_F(TaskQueue, FailedWaitWithARequestTakesIt) {
  calls.wait = [] {
    taskQueue.push_back(request("t1"));
    return EINVAL;
  };
  EXPECT_EQ(takenTransid(), "t1");
  EXPECT_FALSE(queueMutexIsHeld());
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Failed to wait on condition, return code 22"));
}

TEST_F(TaskQueue, FailedLockOfTheExecutorTakesNothing) {
  queueTask(request("t1"));
  calls.lock = EDEADLK;
  EXPECT_EQ(takenTransid(), "nothing");
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Failed to lock queue mutex, return code 35"));
  EXPECT_EQ(takenTransid(), "t1");
}

TEST_F(TaskQueue, FailedUnlockOfTheExecutorDropsTheRequest) {
  queueTask(request("t1"));
  calls.unlock = EPERM;
  EXPECT_EQ(takenTransid(), "nothing");
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Failed to unlock queue mutex, return code 1"));
  EXPECT_THAT(taskQueue, IsEmpty());
}

TEST_F(TaskQueue, RequestIsQueuedEvenWhenTheLockFails) {
  calls.lock = EINVAL;
  calls.unlock = EPERM;
  queueTask(request("t1"));
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Unable to get lock on queue mutex, return code 22\n",
                                                   "Unable to unlock queue mutex, return code 1\n"));
  EXPECT_EQ(takenTransid(), "t1");
}

TEST_F(TaskQueue, RequestIsQueuedEvenWhenTheSignalFails) {
  calls.signal = EINVAL;
  queueTask(request("t1"));
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Unable to signal executor thread, return code 22\n"));
  EXPECT_EQ(takenTransid(), "t1");
}

TEST_F(TaskQueue, RequestThatFindsNoMemoryLeavesTheMutexFree) {
  TaskQueueElem element = request("t1");
  {
    FailingAllocation failing(sizeof(TaskQueueElem));
    EXPECT_THROW(queueTask(std::move(element)), std::bad_alloc);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_FALSE(queueMutexIsHeld());
  EXPECT_THAT(taskQueue, IsEmpty());
}

TEST_F(TaskQueue, FailedPreparationIsTraced) {
  calls.mutex_init = ENOMEM;
  calls.cond_init = EAGAIN;
  initializeTaskQueue();
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Unable to initialize queue mutex, return code 12\n",
                                                   "Unable to initialize condition variable, return code 11\n"));
}

}  // namespace
