// Registration of tables and requests on them.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>

#include "table_client.h"
#include "test_seam.h"
#include "tests/host/sample_table.h"

namespace {

using testing::ElementsAre;
using vmqhost::findTable;
using vmqhost::listTables;
using vmqhost::OpenRequest;

// ---- registration ------------------------------------------------------------------------------------------------

TEST(Tables, AreFoundByApplicationAndName) {
  SampleManager& manager = SampleManager::registered("FOUND");
  const std::string name = manager.table();
  EXPECT_EQ(findTable("TEST", name), &manager);
  EXPECT_EQ(findTable("OTHER", name), nullptr);
  EXPECT_EQ(findTable("TEST", "found" + name.substr(5)), nullptr);
  EXPECT_EQ(findTable("TEST", name + "x"), nullptr);
  EXPECT_EQ(findTable("", ""), nullptr);
}

TEST(Tables, KeepTheirNames) {
  std::string table = "NAMED";
  const SampleManager manager(table);
  table.assign("#####");
  EXPECT_STREQ(manager.application(), "TEST");
  EXPECT_STREQ(manager.table(), "NAMED");
  EXPECT_NE(manager.lock(), nullptr);
}

TEST(Tables, AreRegisteredOnlyOnceByTheSameName) {
  SampleManager& first = SampleManager::registered("TWICE");
  SampleManager second(first.table());
  EXPECT_EQ(TableManager::RegisterWithManager(&second), unsigned{EEXIST});
  EXPECT_EQ(TableManager::RegisterWithManager(&first), unsigned{EEXIST});
  EXPECT_EQ(findTable("TEST", first.table()), &first);
  EXPECT_EQ(TableManager::RegisterWithManager(nullptr), unsigned{EINVAL});
}

TEST(Tables, AreListedInTheOrderOfRegistrationWithTheirColumns) {
  const SampleManager& first = SampleManager::registered("LISTED");
  const SampleManager& second = SampleManager::registered("LISTED");
  const std::vector<vmqhost::TableDescription> tables = listTables();
  ASSERT_GE(tables.size(), 2u);
  const vmqhost::TableDescription& last = tables.back();
  EXPECT_EQ(tables[tables.size() - 2].table, first.table());
  EXPECT_EQ(last.table, second.table());
  EXPECT_EQ(last.application, "TEST");
  EXPECT_EQ(last.row_bytes, kSampleRowBytes);
  ASSERT_EQ(last.columns.size(), 3u);
  EXPECT_EQ(last.columns[1].name, "COUNT");
  EXPECT_STREQ(last.columns[1].info.attribute, "count");
  EXPECT_EQ(last.columns[1].info.byte_offset, 9u);
  EXPECT_EQ(last.columns[1].info.byte_width, 4u);
  EXPECT_EQ(last.columns[1].info.type, COLUMN_INTEGER);
}

TEST(Tables, ThatCannotMakeARequestAreListedWithoutColumns) {
  SampleManager& manager = SampleManager::registered("REFUSING");
  manager.refuse = true;
  EXPECT_EQ(listTables().back().table, manager.table());
  EXPECT_TRUE(listTables().back().columns.empty());
}

TEST(OriginNode, IsWhatTheProcessHasSet) {
  std::string node = "node7.example.com";
  vmqhost::setOriginNode(node);
  node.clear();
  const char* const told = IRA_GetOriginnode();
  EXPECT_STREQ(told, "node7.example.com");
  vmqhost::setOriginNode("node8");
  EXPECT_STREQ(told, "node7.example.com");
  EXPECT_STREQ(IRA_GetOriginnode(), "node8");
}

// ---- requests ----------------------------------------------------------------------------------------------------

class OpenRequests : public testing::Test {
 protected:
  /// A table of the test's own.
  SampleManager& table_ = SampleManager::registered("OPEN");
  Collector collector_;

  std::unique_ptr<OpenRequest> open(std::vector<RequestDetail::Predicate> predicates, RowRequester& requester) {
    return OpenRequest::open(sampleDetail(table_.table(), std::move(predicates)), requester);
  }
};

TEST_F(OpenRequests, AreOnTheListOfTheirTableWhileTheyLive) {
  auto first = open({}, collector_);
  auto second = open({}, collector_);
  ASSERT_NE(first, nullptr);
  ASSERT_NE(second, nullptr);
  {
    LinkedListIter walk(table_.requests);
    EXPECT_EQ(walk.next(), &first->request());
    EXPECT_EQ(walk.next(), &second->request());
    EXPECT_EQ(walk.next(), nullptr);
  }
  first.reset();
  EXPECT_EQ(table_.requests.length(), 1u);
  second.reset();
  EXPECT_EQ(table_.requests.length(), 0u);
}

TEST_F(OpenRequests, GetTheRowsOfASampleThatSatisfyThem) {
  table_.sample = {sampleRow("a", 1, ""), sampleRow("b", 2, ""), sampleRow("c", 3, "")};
  const auto request = open({{"COUNT", INTF_GE, "2"}}, collector_);
  EXPECT_EQ(request->sample(), 0u);
  EXPECT_THAT(collector_.rows, ElementsAre(table_.sample[1], table_.sample[2]));
  EXPECT_EQ(request->sample(), 0u);
  EXPECT_EQ(collector_.rows.size(), 4u);
}

TEST_F(OpenRequests, GetNothingFromAnEmptySample) {
  const auto request = open({}, collector_);
  EXPECT_EQ(request->sample(), 0u);
  EXPECT_EQ(collector_.calls, 0u);
}

TEST_F(OpenRequests, GiveBackWhatTheRequesterAnswers) {
  table_.sample = {sampleRow("a", 1, "")};
  collector_.status = 77;
  EXPECT_EQ(open({}, collector_)->sample(), 77u);
}

TEST_F(OpenRequests, GiveBackThatARowCouldNotBeInserted) {
  table_.sample = {sampleRow("a", 1, ""), sampleRow("b", 2, "")};
  const auto request = open({}, collector_);
  const TEST_FailCall failing("InsertRow", 2, ENOMEM);
  EXPECT_EQ(request->sample(), unsigned{ENOMEM});
  EXPECT_THAT(collector_.rows, ElementsAre(table_.sample[0]));
}

TEST_F(OpenRequests, AreCurrentWhileTheyAreSampled) {
  RES1_Handle current = 0;
  table_.while_sampling = [&](SampleRequest&) { current = bxira::CurrentHandle(); };
  const auto request = open({}, collector_);
  request->sample();
  EXPECT_EQ(current, request->request().handle());
  EXPECT_EQ(bxira::CurrentHandle(), 0u);
  EXPECT_EQ(RES1_Drop(current), unsigned{ENOENT});
}

TEST_F(OpenRequests, GetTheEventsThatSatisfyThem) {
  Collector other;
  const auto request = open({{"NAME", INTF_EQ, "mine"}}, collector_);
  const auto everything = open({}, other);
  table_.deliver(sampleRow("mine", 1, ""));
  table_.deliver(sampleRow("yours", 2, ""));
  EXPECT_THAT(collector_.rows, ElementsAre(sampleRow("mine", 1, "")));
  EXPECT_THAT(other.rows, ElementsAre(sampleRow("mine", 1, ""), sampleRow("yours", 2, "")));
}

TEST_F(OpenRequests, GetNoEventFromBeforeTheyWereOpened) {
  table_.deliver(sampleRow("early", 1, ""));
  const auto request = open({}, collector_);
  table_.deliver(sampleRow("late", 2, ""));
  EXPECT_THAT(collector_.rows, ElementsAre(sampleRow("late", 2, "")));
}

TEST_F(OpenRequests, AreRefusedOnATableThatIsNotThere) {
  EXPECT_EQ(OpenRequest::open(sampleDetail("NOBODY"), collector_), nullptr);
}

TEST_F(OpenRequests, AreRefusedWhenTheTableCannotMakeThem) {
  table_.refuse = true;
  EXPECT_EQ(open({}, collector_), nullptr);
  EXPECT_EQ(table_.requests.length(), 0u);
}

TEST_F(OpenRequests, AreRefusedForValuesThatCannotBeHandedOut) {
  EXPECT_NE(open({{"NAME", INTF_EQ, std::string(65535, 'x')}}, collector_), nullptr);
  EXPECT_EQ(open({{"NAME", INTF_EQ, std::string(65536, 'x')}}, collector_), nullptr);
  EXPECT_EQ(open({{"NAME", INTF_EQ, std::string("a\0b", 3)}}, collector_), nullptr);
}

}  // namespace
