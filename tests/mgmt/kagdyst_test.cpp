// The status table as the management server uses it.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/tasks/rows.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class StatusTable : public testing::Test {
 protected:
  StatusTable() { home.controlScript("exit 0"); }
  void start(const std::string& transid) {
    ask({equal("COMMAND", "START"), equal("TRANSID", transid), equal("PRODUCT", "ux")});
  }
  static std::string ended(const std::string& transid) {
    return StatusEvent{.originnode = kNode, .transid = transid, .command = "START"}.bytes();
  }
  InstallationHome& home = runningComponent();
  TEST_RecordedSleeps sleeps;
  TEST_TraceCapture trace;  // keeps the output quiet
};

TEST_F(StatusTable, SamplingGivesNothingEvenRightAfterATaskHasEnded) {
  StatusEvents events;
  start("t1");
  EXPECT_EQ(events.next(), ended("t1"));
  EXPECT_THAT(events.sample(), IsEmpty());
}

TEST_F(StatusTable, EventThatNobodyWaitsForIsDropped) {
  start("t1");
  // The next event that is listened for shows that the first one is over.
  StatusEvents second({equal("TRANSID", "t2")});
  start("t2");
  EXPECT_EQ(second.next(), ended("t2"));
  StatusEvents late;  // opened after both
  EXPECT_TRUE(late.none());
}

TEST_F(StatusTable, QueryForATransactionGetsOneEventForEachOfItsRequests) {
  StatusEvents all;
  StatusEvents mine({equal("TRANSID", "t2")});
  for (const char* transid : {"t1", "t2", "t3", "t2"}) start(transid);
  for (const char* transid : {"t1", "t2", "t3", "t2"}) EXPECT_EQ(all.next(), ended(transid));
  EXPECT_EQ(mine.next(), ended("t2"));
  EXPECT_EQ(mine.next(), ended("t2"));
  EXPECT_TRUE(mine.none());
}

TEST_F(StatusTable, EachEventIsPrecededByOneSecond) {
  StatusEvents events;
  start("t1");
  start("t2");
  events.next();
  events.next();
  EXPECT_THAT(sleeps.seconds(), ElementsAre(1u, 1u));
}

/// Notes each event in the same file as the control script notes its runs.
class NotedEvents : public RowRequester {
 public:
  explicit NotedEvents(std::string file) : file_(std::move(file)) {}
  unsigned rowsArrived(const char*, unsigned, unsigned) override {
    std::ofstream(file_, std::ios::app) << "event\n";
    return 0;
  }

 private:
  const std::string file_;
};

TEST_F(StatusTable, SecondOfTwoRequestsRunsAfterTheFirstOnesEvent) {
  NotedEvents noted(home.path() + "/runs");
  const auto request = vmqhost::OpenRequest::open(query("KAGDYST"), noted);
  ASSERT_NE(request, nullptr);
  StatusEvents events;  // opened later, so told after the note was made
  ask({equal("COMMAND", "STOP"), equal("TRANSID", "t1"), equal("PRODUCT", "ux")});
  start("t2");
  events.next();
  EXPECT_EQ(events.next(), ended("t2"));
  EXPECT_THAT(home.runs(),
              ElementsAre("-h " + home.path() + " -c stop ux", "event", "-h " + home.path() + " start ux", "event"));
}

TEST_F(StatusTable, RequestsOfManyThreadsAllGetTheirEvents) {
  constexpr int kThreads = 3;
  constexpr int kEach = 3;
  StatusEvents events;
  std::vector<std::thread> servers;
  for (int thread = 0; thread < kThreads; ++thread) {
    servers.emplace_back([this, thread] {
      StatusEvents mine({equal("TRANSID", std::to_string(thread))});
      for (int i = 0; i < kEach; ++i) start(std::to_string(thread));
      for (int i = 0; i < kEach; ++i) EXPECT_EQ(mine.next(), ended(std::to_string(thread)));
    });
  }
  for (std::thread& server : servers) server.join();
  std::vector<std::string> received;
  for (int i = 0; i < kThreads * kEach; ++i) received.push_back(events.next());
  for (int thread = 0; thread < kThreads; ++thread)
    EXPECT_EQ(std::count(received.begin(), received.end(), ended(std::to_string(thread))), kEach);
}

}  // namespace
