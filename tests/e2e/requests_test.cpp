// What the daemon answers at once: refusals, rows that the query's own predicates reject, inventory and configuration.

#include <filesystem>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

using testing::HasSubstr;

class Requests : public Deployment {
 protected:
  Requests() { startDaemon(); }
};

TEST_F(Requests, UnknownCommandIsRefusedByName) {
  EXPECT_THAT(ask({{"COMMAND", "EXPLODE"}, {"TRANSID", "t1"}}), Failed(1006, "EXPLODE"));
  EXPECT_THAT(ask({{"COMMAND", "start"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Failed(1006, "start"));
  EXPECT_FALSE(answers(home.port("ux")));
}

TEST_F(Requests, RequestWithoutATransactionIdIsRefused) {
  EXPECT_THAT(ask({{"COMMAND", "START"}, {"PRODUCT", "ux"}}), Failed(1002, ""));
  EXPECT_THAT(ask({{"COMMAND", "START"}, {"TRANSID", ""}, {"PRODUCT", "ux"}}), Failed(1002, ""));
}

TEST_F(Requests, WhatACommandNeedsIsAskedFor) {
  EXPECT_THAT(ask({{"TRANSID", "t1"}}), Failed(1001, ""));
  EXPECT_THAT(ask(Json::object()), Failed(1002, "")) << "the later check wins";
  EXPECT_THAT(ask({{"COMMAND", "START"}, {"TRANSID", "t1"}}), Failed(1003, ""));
  EXPECT_THAT(ask({{"COMMAND", "SETCONFIG"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Failed(1004, ""));
  EXPECT_THAT(ask({{"COMMAND", "REMOVEINSTANCE"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Failed(1005, ""));
  EXPECT_THAT(ask({{"COMMAND", "INSTALL"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}, {"CONTEXT", "x"}}), Failed(1029, ""));
}

TEST_F(Requests, AnswerRepeatsTheRequestUnderTheNodesOwnName) {
  const Json row = ask({{"COMMAND", "EXPLODE"}, {"TRANSID", "t\u00e4st 1"}, {"PRODUCT", "ux"}, {"VERSION", "1.0"}});
  EXPECT_EQ(row["ORIGINNODE"], DaemonFixture::node);
  EXPECT_EQ(row["TRANSID"], "t\u00e4st 1");
  EXPECT_EQ(row["PRODUCT"], "ux");
  EXPECT_EQ(row["VERSION"], "1.0");
}

// Predicates carry the command and filter the answer: what is rejected here is the row, not the command.
TEST_F(Requests, QueryThatRejectsItsAnswerRunsTheCommandAllTheSame) {
  Watcher watcher(daemon->socket(), "TRANSID=t1");
  EXPECT_EQ(query("KAGREQT", {{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}, {"RETVAL", {{"ne", 0}}}}),
            Json::array());
  EXPECT_THAT(watcher.next(), Succeeded());
  EXPECT_TRUE(answers(home.port("ux")));
}

TEST_F(Requests, InventoryListsWhatIsInstalledAndWhatRuns) {
  const Json rows = query("KINAGT", Json::object());
  ASSERT_EQ(rows.size(), 3U);
  EXPECT_EQ(rows[0]["PRODUCT"], "ux");
  EXPECT_EQ(rows[0]["PRODDESC"], "Unix host agent");
  EXPECT_EQ(rows[0]["PLATFORM"], "lx8266");
  EXPECT_EQ(rows[0]["VERSION"], "010000000");
  EXPECT_EQ(rows[0]["RELEASE"], "100");
  EXPECT_EQ(rows[0]["CORVELHOME"], home.path());
  EXPECT_EQ(rows[0]["HOSTTYPE"], "Linux");
  EXPECT_EQ(rows[1]["PRODUCT"], "um");
  EXPECT_EQ(rows[2]["PRODUCT"], "ax");

  EXPECT_EQ(query("KINAGT", {{"PRODDESC", "RUNNING"}}), Json::array());
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  const Json running = query("KINAGT", {{"PRODDESC", "RUNNING"}});
  ASSERT_EQ(running.size(), 1U);
  EXPECT_EQ(running[0]["PRODUCT"], "ux");
}

TEST_F(Requests, ConfigurationIsReadChangedAndUsedByTheNextStart) {
  const Json got = ask({{"COMMAND", "GETCONFIG"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}, {"TARGETMSN", "inst1"}});
  EXPECT_THAT(got, Succeeded());
  std::string configuration = got["CONTEXT"];
  EXPECT_THAT(configuration, testing::StartsWith("INSTANCE=inst1\nPORT="));

  const uint16_t port = freePort();
  configuration += "PORT=" + std::to_string(port) + "\n";
  EXPECT_THAT(carryOut({{"COMMAND", "SETCONFIG"},
                        {"TRANSID", "t2"},
                        {"PRODUCT", "ux"},
                        {"TARGETMSN", "inst1"},
                        {"CONTEXT", configuration}}),
              Succeeded());
  EXPECT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t3"}, {"PRODUCT", "ux"}, {"TARGETMSN", "inst1"}}),
              Succeeded());
  EXPECT_TRUE(answers(port));
}

TEST_F(Requests, RemovedInstanceCannotBeStarted) {
  EXPECT_THAT(carryOut({{"COMMAND", "REMOVEINSTANCE"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}, {"TARGETMSN", "inst1"}}),
              Succeeded());
  EXPECT_FALSE(std::filesystem::exists(home / "config/ux_inst1.config"));
  EXPECT_THAT(carryOut({{"COMMAND", "START"},
                        {"TRANSID", "t2"},
                        {"PRODUCT", "ux"},
                        {"OPTIONAL", "INSTANCE"},
                        {"TARGETMSN", "inst1"}}),
              Failed(1024, command("-o inst1 start ux")));
}

}  // namespace
