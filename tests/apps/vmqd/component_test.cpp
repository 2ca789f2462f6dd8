// The daemon with the project's own component.

#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"

namespace {

using nlohmann::json;
using ::testing::ElementsAre;

std::string commandBody(const std::string& transaction) {
  return R"({"predicates":{"COMMAND":"START","TRANSID":")" + transaction + R"(","PRODUCT":"ux"}})";
}

TEST(Component, OffersItsThreeTables) {
  const DaemonFixture daemon;
  const json tables = parsedJson(HttpClient(daemon.socket()).get("/v1/tables").body)["tables"];
  std::vector<std::string> names;
  for (const auto& table : tables) {
    EXPECT_EQ("VMQ", table["application"]);
    names.push_back(table["table"].get<std::string>() + " " + std::to_string(table["row_bytes"].get<int>()) + " " +
                    std::to_string(table["columns"].size()));
  }
  EXPECT_THAT(names, ElementsAre("KAGREQT 4196 13", testing::EndsWith(" 9"), "KAGDYST 504 7"));
}

TEST(Component, AnswersACommandAndReportsItsOutcome) {
  const DaemonFixture daemon;
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/KAGDYST/events?TRANSID=t1").status);
  ASSERT_EQ("open", watcher.nextEvent()->name);
  HttpClient client(daemon.socket());
  (void)client.post("/v1/tables/KAGREQT/query", commandBody("t2"));
  const json row = parsedJson(client.post("/v1/tables/KAGREQT/query", commandBody("t1")).body)["rows"][0];
  EXPECT_EQ("testnode", row["ORIGINNODE"]);
  EXPECT_EQ("t1", row["TRANSID"]);
  EXPECT_EQ(0, row["RETVAL"]);
  // The scratch home has no agent control script, so the start fails.
  const json outcome = parsedJson(watcher.nextEvent()->data);
  EXPECT_EQ("testnode", outcome["ORIGINNODE"]);
  EXPECT_EQ("t1", outcome["TRANSID"]);
  EXPECT_EQ("START", outcome["COMMAND"]);
  EXPECT_EQ(1025, outcome["RETVAL"]);
  EXPECT_EQ("VMQ1025E", outcome["RETMSGID"]);
}

TEST(Component, IsFoundFromWhereTheProgramIs) {
  const DaemonFixture daemon;  // its configuration names no library
  EXPECT_EQ(3u, parsedJson(HttpClient(daemon.socket()).get("/v1/tables").body)["tables"].size());
}

}  // namespace
