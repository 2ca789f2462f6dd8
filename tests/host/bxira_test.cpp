// A request object: its predicates, its waiting rows and their dispatch.

#include "bxira.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <stdexcept>

#include "tests/host/sample_table.h"
#include "tests/support/failing_allocation.h"

namespace {

using testing::ElementsAre;

/// A request of its own table, not opened by the framework.
class Request : public testing::Test {
 protected:
  SampleRequest& make(std::vector<RequestDetail::Predicate> predicates) {
    RequestDetail detail = sampleDetail("REQUEST", std::move(predicates));
    request_ = std::make_unique<SampleRequest>(&detail, &context_, &manager_);
    return *request_;
  }
  /// Whether the request takes the row.
  bool takes(const std::vector<RequestDetail::Predicate>& predicates, std::string row) {
    return make(predicates).CheckForException(row.data()) != 0;
  }
  unsigned insert(const std::string& row) {
    std::string writable = row;
    return request_->InsertRow(writable.data());
  }

  SampleManager manager_{"REQUEST"};
  Collector collector_;
  ContextInfo context_{&collector_};
  std::unique_ptr<SampleRequest> request_;
};

const std::string kRow = sampleRow("alpha", 3, "n");

// ---- predicates --------------------------------------------------------------------------------------------------

TEST_F(Request, HandsOutItsPredicatesInTheOrderSent) {
  SampleRequest& request = make({{"NOTE", INTF_NE, "x"}, {"NAME", INTF_EQ, "alpha  "}, {"NOTE", INTF_GE, ""}});
  FLT1_FILTERINFO info{};
  const struct {
    const char *column, *value;
    _IntfOper oper;
  } kExpected[] = {{"NOTE", "x", INTF_NE}, {"NAME", "alpha  ", INTF_EQ}, {"NOTE", "", INTF_GE}};
  for (const auto& each : kExpected) {
    ASSERT_EQ(request.GetFilterInfo(&info), 0u);
    EXPECT_STREQ(info.column, each.column);
    EXPECT_STREQ(info.value, each.value);
    EXPECT_EQ(info.value_length, std::strlen(each.value));
    EXPECT_EQ(info.oper, each.oper);
  }
  EXPECT_NE(request.GetFilterInfo(&info), 0u);
}

TEST_F(Request, StartsOverAfterItsLastPredicate) {
  SampleRequest& request = make({{"NAME", INTF_EQ, "a"}});
  FLT1_FILTERINFO info{};
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(request.GetFilterInfo(&info), 0u);
    EXPECT_NE(request.GetFilterInfo(&info), 0u);
  }
}

TEST_F(Request, WithoutPredicatesHandsOutNone) {
  FLT1_FILTERINFO info{};
  EXPECT_NE(make({}).GetFilterInfo(&info), 0u);
  EXPECT_NE(make({{"NAME", INTF_EQ, "a"}}).GetFilterInfo(nullptr), 0u);
}

TEST_F(Request, KeepsLongValuesWholeUpToTheLengthThatCanBeTold) {
  FLT1_FILTERINFO info{};
  for (const size_t length : {3072u, 32768u, 65535u}) {
    ASSERT_EQ(make({{"NAME", INTF_EQ, std::string(length, 'x')}}).GetFilterInfo(&info), 0u);
    EXPECT_EQ(info.value_length, length);
    EXPECT_EQ(std::strlen(info.value), length);
  }
  ASSERT_EQ(make({{"NAME", INTF_EQ, std::string(65536, 'x')}}).GetFilterInfo(&info), 0u);
  EXPECT_EQ(info.value_length, 65535u);
  EXPECT_EQ(std::strlen(info.value), 65535u);
}

TEST_F(Request, CopiesWhatItIsAskedFor) {
  RequestDetail detail = sampleDetail("REQUEST", {{"NAME", INTF_EQ, "alpha"}});
  detail.interval_seconds = 60;
  detail.sample_type = 2;
  const SampleRequest request(&detail, &context_, &manager_);
  detail.predicates.clear();
  detail.interval_seconds = 0;
  EXPECT_EQ(request.detail().interval_seconds, 60);
  EXPECT_EQ(request.detail().sample_type, 2);
  EXPECT_EQ(request.detail().predicates.size(), 1u);
  EXPECT_EQ(request.manager(), &manager_);
}

// ---- filter ------------------------------------------------------------------------------------------------------

TEST_F(Request, WithoutPredicatesTakesEveryRow) {
  EXPECT_TRUE(takes({}, kRow));
}

TEST_F(Request, TakesARowThatSatisfiesEveryPredicate) {
  EXPECT_TRUE(takes({{"NAME", INTF_EQ, "alpha"}, {"COUNT", INTF_GT, "2"}, {"NOTE", INTF_NE, "x"}}, kRow));
  EXPECT_FALSE(takes({{"NAME", INTF_EQ, "alpha"}, {"COUNT", INTF_GT, "3"}, {"NOTE", INTF_NE, "x"}}, kRow));
  EXPECT_FALSE(takes({{"NAME", INTF_EQ, "beta"}, {"COUNT", INTF_GT, "2"}}, kRow));
  EXPECT_FALSE(takes({{"COUNT", INTF_EQ, "3"}, {"COUNT", INTF_EQ, "4"}}, kRow));
}

TEST_F(Request, TakesNoRowForAPredicateOnAColumnThatIsNotThere) {
  EXPECT_FALSE(takes({{"NOBODY", INTF_NE, "x"}}, kRow));
}

// ---- rows --------------------------------------------------------------------------------------------------------

TEST_F(Request, DispatchesItsWaitingRowsInOneCallAndInOrder) {
  SampleRequest& request = make({});
  EXPECT_EQ(insert(kRow), 0u);
  EXPECT_EQ(insert(sampleRow("beta", 4, "")), 0u);
  EXPECT_EQ(request.row_count, 2u);
  EXPECT_EQ(request.Dispatch(), 0u);
  EXPECT_EQ(collector_.calls, 1u);
  EXPECT_THAT(collector_.rows, ElementsAre(kRow, sampleRow("beta", 4, "")));
  EXPECT_EQ(request.row_count, 0u);
}

TEST_F(Request, DispatchesNothingWhenNoRowWaits) {
  SampleRequest& request = make({});
  collector_.status = 5;
  EXPECT_EQ(request.Dispatch(), 0u);
  insert(kRow);
  EXPECT_EQ(request.Dispatch(), 5u);
  EXPECT_EQ(request.Dispatch(), 0u);
  EXPECT_EQ(collector_.calls, 1u);
}

TEST_F(Request, GivesARowAwayOnlyOnce) {
  SampleRequest& request = make({});
  for (int i = 0; i < 3; ++i) {
    insert(sampleRow("row", i, ""));
    request.Dispatch();
  }
  EXPECT_THAT(collector_.rows, ElementsAre(sampleRow("row", 0, ""), sampleRow("row", 1, ""), sampleRow("row", 2, "")));
}

TEST_F(Request, KeepsARowThatCameInBetweenDispatchAndTheEndOfAnEvent) {
  SampleRequest& request = make({});
  insert(kRow);
  request.row_count = 0;  // what the end of another thread's event does
  EXPECT_EQ(request.Dispatch(), 0u);
  EXPECT_THAT(collector_.rows, ElementsAre(kRow));
}

TEST_F(Request, TellsWhatItsWaitingRowsTake) {
  SampleRequest& request = make({});
  EXPECT_EQ(request.allocatedRows(), 0u);
  EXPECT_EQ(request.allocatedBytes(), 0u);
  insert(kRow);
  insert(sampleRow("beta", 4, ""));
  EXPECT_GE(request.allocatedRows(), 2u);
  EXPECT_GE(request.allocatedBytes(), 2 * kSampleRowBytes);
  EXPECT_EQ(std::string(request.waitingRows(), 2 * kSampleRowBytes), kRow + sampleRow("beta", 4, ""));
}

TEST_F(Request, CopiesARowWhenItIsInserted) {
  SampleRequest& request = make({});
  std::string row = kRow;
  request.InsertRow(row.data());
  row.assign(kSampleRowBytes, '#');
  request.Dispatch();
  EXPECT_THAT(collector_.rows, ElementsAre(kRow));
}

TEST_F(Request, RefusesToInsertNoRow) {
  EXPECT_EQ(make({}).InsertRow(nullptr), unsigned{EINVAL});
}

TEST_F(Request, TellsThatThereIsNoMemoryForARowAndKeepsTheOthers) {
  SampleRequest& request = make({});
  insert(kRow);
  std::string row = sampleRow("lost", 0, "");
  {
    const FailingAllocation failing(1);
    EXPECT_EQ(request.InsertRow(row.data()), unsigned{ENOMEM});
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(request.row_count, 1u);
  EXPECT_EQ(request.Dispatch(), 0u);
  EXPECT_THAT(collector_.rows, ElementsAre(kRow));
  EXPECT_EQ(request.takeInsertionFailure(), unsigned{ENOMEM}) << "they are not all there was";
  EXPECT_EQ(request.takeInsertionFailure(), 0u) << "told once";
}

TEST_F(Request, WithoutARequesterDropsItsRowsAndSaysSo) {
  context_.requester = nullptr;
  SampleRequest& request = make({});
  insert(kRow);
  EXPECT_EQ(request.Dispatch(), unsigned{ENOTCONN});
  EXPECT_EQ(request.Dispatch(), 0u);
}

TEST_F(Request, OutlivesARequesterThatThrows) {
  struct : RowRequester {
    unsigned rowsArrived(const char*, unsigned, unsigned) override { throw std::runtime_error("no"); }
  } throwing;
  context_.requester = &throwing;
  SampleRequest& request = make({});
  insert(kRow);
  EXPECT_EQ(request.Dispatch(), unsigned{EIO});
  EXPECT_EQ(request.Dispatch(), 0u);
}

TEST_F(Request, KnowsNoCommands) {
  char command[] = "x";
  char reply[8];
  EXPECT_EQ(make({}).ExecuteCommand(command, 1, reply), unsigned{ENOSYS});
  request_->CommandCompleted(nullptr);
}

// ---- handles -----------------------------------------------------------------------------------------------------

TEST_F(Request, HasAHandleOfItsOwn) {
  const RES1_Handle first = make({}).handle();
  SampleRequest other(nullptr, &context_, &manager_);
  EXPECT_NE(first, 0u);
  EXPECT_NE(other.handle(), 0u);
  EXPECT_NE(other.handle(), first);
  EXPECT_NE(manager_.handle(), 0u);
  EXPECT_NE(manager_.handle(), first);
}

TEST_F(Request, IsCurrentWhileItsHandleIsInUse) {
  const RES1_Handle handle = make({}).handle();
  EXPECT_EQ(bxira::CurrentHandle(), 0u);
  EXPECT_EQ(bxira::UseHandle(handle), 0u);
  EXPECT_EQ(bxira::CurrentHandle(), handle);
  EXPECT_EQ(RES1_Drop(handle), 0u);
  EXPECT_EQ(bxira::CurrentHandle(), 0u);
}

TEST_F(Request, CannotBeDroppedMoreOftenThanUsed) {
  const RES1_Handle handle = make({}).handle();
  EXPECT_EQ(RES1_Drop(handle), unsigned{ENOENT});
  EXPECT_EQ(bxira::UseHandle(handle), 0u);
  EXPECT_EQ(bxira::UseHandle(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), unsigned{ENOENT});
}

TEST_F(Request, LeavesAHandleInUseWorkingUntilItIsDropped) {
  const RES1_Handle handle = make({}).handle();
  ASSERT_EQ(bxira::UseHandle(handle), 0u);
  request_.reset();
  EXPECT_EQ(bxira::UseHandle(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), 0u);
  EXPECT_EQ(RES1_Drop(handle), unsigned{ENOENT});
  EXPECT_EQ(bxira::UseHandle(handle), unsigned{ENOENT});
}

TEST_F(Request, TakesAHandleThatNobodyUsesWithIt) {
  const RES1_Handle handle = make({}).handle();
  request_.reset();
  EXPECT_EQ(bxira::UseHandle(handle), unsigned{ENOENT});
}

TEST(Handle, ZeroNamesNothing) {
  EXPECT_EQ(bxira::UseHandle(0), unsigned{ENOENT});
  EXPECT_EQ(RES1_Drop(0), unsigned{ENOENT});
}

}  // namespace
