// The request table as the management server uses it.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "mgmt/rows.h"
#include "tasks/task_queue_elem.h"
#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/support/failing_allocation.h"
#include "tests/tasks/rows.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class RequestTable : public testing::Test {
 protected:
  InstallationHome& home = runningComponent();
  TEST_RecordedSleeps sleeps;
  TEST_TraceCapture trace;
};

TEST_F(RequestTable, QueryWithoutCommandIsAnsweredWithItsCode) {
  const AnswerRow expected{.originnode = kNode, .transid = "t1", .retval = 1001, .retmsgid = "VMQ1001E"};
  EXPECT_THAT(ask({equal("TRANSID", "t1")}), ElementsAre(expected.bytes()));
}

TEST_F(RequestTable, QueryWithoutCommandAndTransactionIsAnsweredWithTheLaterCode) {
  const AnswerRow expected{.originnode = kNode, .retval = 1002, .retmsgid = "VMQ1002E"};
  EXPECT_THAT(ask({}), ElementsAre(expected.bytes()));
}

TEST_F(RequestTable, AnswerRepeatsTheParametersAndThisAgentsNode) {
  const AnswerRow expected{.originnode = kNode,
                           .transid = "t1",
                           .command = "NONE",
                           .product = "ux",
                           .context = "text for the task",
                           .optional = "INSTANCE",
                           .daconfig = "model.mdl",
                           .dascript = "a.sh,b.sh",
                           .retval = 1006,
                           .version = "062000",
                           .retmsgid = "VMQ1006E",
                           .retmsgparm = "NONE",
                           .targetmsn = "inst1"};
  EXPECT_THAT(ask({{"ORIGINNODE", INTF_NE, "elsewhere"},
                   equal("TRANSID", "t1"),
                   equal("COMMAND", "NONE"),
                   equal("PRODUCT", "ux"),
                   equal("CONTEXT", "text for the task"),
                   equal("OPTIONAL", "INSTANCE"),
                   equal("DACONFIG", "model.mdl"),
                   equal("DASCRIPT", "a.sh,b.sh"),
                   equal("VERSION", "062000"),
                   equal("TARGETMSN", "inst1")}),
              ElementsAre(expected.bytes()));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Passing row 0 to InsertRow()."));
}

TEST_F(RequestTable, QueryForAnotherNodeGetsNoRow) {
  EXPECT_THAT(ask({equal("ORIGINNODE", "elsewhere"), equal("TRANSID", "t1")}), IsEmpty());
}

TEST_F(RequestTable, QueryThatItsAnswerDoesNotMatchGetsNoRowThoughTheCommandHasRun) {
  home.controlScript("exit 0");
  StatusEvents events;
  EXPECT_THAT(ask({equal("COMMAND", "START"), equal("TRANSID", "t2"), equal("PRODUCT", "ux"), equal("RETVAL", "1024")}),
              IsEmpty());
  const StatusEvent expected{.originnode = kNode, .transid = "t2", .command = "START"};
  EXPECT_EQ(events.next(), expected.bytes());
  EXPECT_EQ(home.runs().size(), 1u);
}

TEST_F(RequestTable, OutputColumnsAreNoParameters) {
  const AnswerRow expected{.originnode = kNode,
                           .transid = "t1",
                           .command = "NONE",
                           .retval = 1006,
                           .retmsgid = "VMQ1006E",
                           .retmsgparm = "NONE"};
  EXPECT_THAT(ask({equal("TRANSID", "t1"),
                   equal("COMMAND", "NONE"),
                   {"RETVAL", INTF_GT, "5"},
                   {"RETMSGID", INTF_NE, "VMQ1001E"},
                   {"RETMSGPARM", INTF_NE, "x"}}),
              ElementsAre(expected.bytes()));
}

TEST_F(RequestTable, PredicateGivesItsValueWhateverItsOperator) {
  home.controlScript("exit 0");
  StatusEvents events;
  // The answer does not pass such a predicate; the command runs all the same.
  EXPECT_THAT(ask({{"COMMAND", INTF_NE, "START"}, equal("TRANSID", "t3"), equal("PRODUCT", "ux")}), IsEmpty());
  const StatusEvent expected{.originnode = kNode, .transid = "t3", .command = "START"};
  EXPECT_EQ(events.next(), expected.bytes());
}

TEST_F(RequestTable, LaterPredicateOnTheSameColumnWins) {
  const AnswerRow expected{.originnode = kNode, .transid = "t2", .retval = 1001, .retmsgid = "VMQ1001E"};
  EXPECT_THAT(ask({{"TRANSID", INTF_NE, "t1"}, {"TRANSID", INTF_EQ, "t2"}}), ElementsAre(expected.bytes()));
}

TEST_F(RequestTable, ParameterThatIsTooLongIsCutInTheAnswerAndWholeForTheTask) {
  home.controlScript("exit 0");
  StatusEvents events;
  const std::string product(40, 'p');
  const AnswerRow expected{.originnode = kNode, .transid = "t4", .command = "START", .product = std::string(32, 'p')};
  EXPECT_THAT(ask({equal("COMMAND", "START"), equal("TRANSID", "t4"), equal("PRODUCT", product)}),
              ElementsAre(expected.bytes()));
  events.next();
  EXPECT_THAT(home.runs(), ElementsAre("-h " + home.path() + " start " + product));
}

TEST_F(RequestTable, EachSamplingRunsTheCommandAnew) {
  home.controlScript("exit 0");
  StatusEvents events;
  vmqhost::RowBuffer rows(10);
  const auto request = vmqhost::OpenRequest::open(
      query("KAGREQT", {equal("COMMAND", "START"), equal("TRANSID", "t5"), equal("PRODUCT", "ux")}), rows);
  ASSERT_NE(request, nullptr);
  EXPECT_THAT(home.runs(), IsEmpty());  // opening alone runs nothing
  EXPECT_EQ(request->sample(), 0u);
  EXPECT_EQ(request->sample(), 0u);
  const StatusEvent expected{.originnode = kNode, .transid = "t5", .command = "START"};
  EXPECT_EQ(events.next(), expected.bytes());
  EXPECT_EQ(events.next(), expected.bytes());
  EXPECT_EQ(home.runs().size(), 2u);
}

TEST(RequestWithoutMemory, GetsNoRowAndHarmsNobody) {
  const InstallationHome& home = runningComponent();
  home.controlScript("exit 0");
  const TEST_RecordedSleeps sleeps;
  StatusEvents events;
  vmqhost::RowBuffer rows(10);
  const auto request = vmqhost::OpenRequest::open(
      query("KAGREQT", {equal("COMMAND", "START"), equal("TRANSID", "t1"), equal("PRODUCT", "ux")}), rows);
  ASSERT_NE(request, nullptr);
  {
    const FailingAllocation failing(sizeof(TaskQueueElem));  // its place in the queue
    EXPECT_EQ(request->sample(), 0u);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(rows.take(std::chrono::milliseconds(0)).kind, vmqhost::RowBuffer::Item::kTimedOut);
  EXPECT_EQ(request->sample(), 0u);
  EXPECT_EQ(rows.take(std::chrono::milliseconds(0)).kind, vmqhost::RowBuffer::Item::kRow);
  events.next();
  EXPECT_EQ(home.runs().size(), 1u);
}

TEST_F(RequestTable, RowsComeOnlyFromItsOwnQuery) {
  // Nobody sends events on this table, but its manager would deliver them.
  vmqhost::RowBuffer rows(10);
  const auto request = vmqhost::OpenRequest::open(query("KAGREQT", {equal("TRANSID", "t6")}), rows);
  ask({equal("TRANSID", "t6")});
  EXPECT_EQ(rows.take(std::chrono::milliseconds(0)).kind, vmqhost::RowBuffer::Item::kTimedOut);
}

}  // namespace
