// START, STOP and RESTART of a real agent, from the client's request to the agent's port.

#include <signal.h>

#include <chrono>
#include <filesystem>
#include <set>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

class StartStop : public Deployment {
 protected:
  StartStop() { startDaemon(); }

  /// What a process has open beyond files: "socket:[4711]", "pipe:[4712]".
  static std::set<std::string> channels(pid_t pid) {
    std::set<std::string> result;
    for (const auto& entry : fs::directory_iterator("/proc/" + std::to_string(pid) + "/fd")) {
      std::error_code gone;
      const std::string target = fs::read_symlink(entry.path(), gone).string();
      if (target.starts_with("socket:") || target.starts_with("pipe:")) result.insert(target);
    }
    return result;
  }
};

TEST_F(StartStop, StartedAgentAnswersOnItsPort) {
  ASSERT_FALSE(answers(home.port("ux")));
  const Json outcome = carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}});
  EXPECT_THAT(outcome, Succeeded());
  EXPECT_EQ(outcome["COMMAND"], "START");
  EXPECT_EQ(outcome["TRANSID"], "t1");
  EXPECT_TRUE(answers(home.port("ux")));
}

TEST_F(StartStop, StoppedAgentIsGoneAndItsPortRefuses) {
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  const pid_t agent = home.pid("ux").value();
  EXPECT_THAT(carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_FALSE(isRunning(agent));
  EXPECT_FALSE(answers(home.port("ux")));
}

TEST_F(StartStop, RestartedAgentIsAnotherProcessOnTheSamePort) {
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  const pid_t before = home.pid("ux").value();
  EXPECT_THAT(carryOut({{"COMMAND", "RESTART"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_FALSE(isRunning(before));
  EXPECT_NE(home.pid("ux").value(), before);
  EXPECT_TRUE(answers(home.port("ux")));
}

TEST_F(StartStop, InstanceIsStartedByItsNameAndStoppedByItsManagedSystemName) {
  EXPECT_THAT(carryOut({{"COMMAND", "START"},
                        {"TRANSID", "t1"},
                        {"PRODUCT", "ux"},
                        {"OPTIONAL", "INSTANCE"},
                        {"TARGETMSN", "inst1"}}),
              Succeeded());
  EXPECT_TRUE(answers(home.port("ux_inst1")));
  EXPECT_FALSE(answers(home.port("ux")));
  const Json stopped =
      carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}, {"TARGETMSN", "inst1:node7:UX"}});
  EXPECT_THAT(stopped, Succeeded());
  EXPECT_EQ(stopped["TARGETMSN"], "inst1:node7:UX");
  EXPECT_FALSE(answers(home.port("ux_inst1")));
}

TEST_F(StartStop, ManagedSystemNameThatNobodyKnowsMeansTheAgentWithoutAnInstance) {
  EXPECT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}, {"TARGETMSN", "inst9:node7:UX"}}),
              Succeeded());
  EXPECT_TRUE(answers(home.port("ux")));
}

TEST_F(StartStop, AgentHoldsNothingOfTheDaemonOpen) {
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  const auto of_daemon = channels(daemon->process().pid());
  EXPECT_FALSE(of_daemon.empty());
  for (const std::string& channel : channels(home.pid("ux").value()))
    EXPECT_FALSE(of_daemon.contains(channel)) << channel;
}

TEST_F(StartStop, FailedStartNamesTheWholeCommand) {
  const OccupiedPort occupied;
  home.configure("ux_inst1", "PORT=" + std::to_string(occupied.number()));
  EXPECT_THAT(carryOut({{"COMMAND", "START"},
                        {"TRANSID", "t1"},
                        {"PRODUCT", "ux"},
                        {"OPTIONAL", "INSTANCE"},
                        {"TARGETMSN", "inst1"}}),
              Failed(1024, command("-o inst1 start ux")));
}

TEST_F(StartStop, UnknownProductIsWhatTheAgentScriptRefuses) {
  EXPECT_THAT(carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t1"}, {"PRODUCT", "lz"}}),
              Failed(1024, command("-c stop lz")));
}

TEST_F(StartStop, AgentScriptThatCannotBeRunIsAnotherFailure) {
  fs::permissions(home / "bin/CorvelAgent", fs::perms(0644));
  EXPECT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}),
              Failed(1025, command("start ux")));
}

// Deliberate: the outcome of a restart is that of its start, but what the stop left in the message stays there.
TEST_F(StartStop, RestartWhoseStopFailsSucceedsAndStillTellsOfTheStop) {
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  home.configure("ux", "WAIT_SECONDS=1");
  const pid_t agent = home.pid("ux").value();
  ASSERT_EQ(kill(agent, SIGSTOP), 0);  // it can neither end nor go away; the start then finds it running

  const Json outcome = carryOut({{"COMMAND", "RESTART"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}});
  EXPECT_EQ(outcome["RETVAL"], 0);
  EXPECT_EQ(outcome["RETMSGID"], "VMQ1024E");
  EXPECT_EQ(outcome["RETMSGPARM"], command("-c stop ux"));
  EXPECT_EQ(home.pid("ux"), agent);
}

TEST_F(StartStop, RequestsRunOneAfterTheOtherInTheOrderOfTheirArrival) {
  Watcher watcher(daemon->socket());
  const auto began = std::chrono::steady_clock::now();
  ASSERT_THAT(ask({{"COMMAND", "START"}, {"TRANSID", "first"}, {"PRODUCT", "ux"}}), Succeeded());
  ASSERT_THAT(ask({{"COMMAND", "STOP"}, {"TRANSID", "second"}, {"PRODUCT", "ux"}}), Succeeded());
  const Json first = watcher.next();
  const Json second = watcher.next();
  EXPECT_EQ(first["TRANSID"], "first");
  EXPECT_THAT(first, Succeeded());
  EXPECT_EQ(second["TRANSID"], "second");
  EXPECT_THAT(second, Succeeded());
  EXPECT_GE(std::chrono::steady_clock::now() - began, std::chrono::seconds(2)) << "a second lies before each event";
  EXPECT_FALSE(answers(home.port("ux")));
}

TEST_F(StartStop, WatcherThatGoesAwayHoldsUpNobody) {
  { const Watcher brief(daemon->socket()); }
  EXPECT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
}

TEST_F(StartStop, OutcomeIsToldOnceAndOnlyToThoseWhoWatchThatRequestThen) {
  Watcher watcher(daemon->socket(), "TRANSID=t1");
  Watcher other(daemon->socket(), "TRANSID=t2");
  ASSERT_THAT(ask({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_EQ(watcher.next()["COMMAND"], "START");
  Watcher late(daemon->socket(), "TRANSID=t1");
  EXPECT_EQ(query("KAGDYST", {{"TRANSID", "t1"}}), Json::array()) << "outcomes are not kept";

  ASSERT_THAT(ask({{"COMMAND", "RESTART"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}), Succeeded());
  ASSERT_THAT(ask({{"COMMAND", "STOP"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_EQ(other.next()["COMMAND"], "RESTART") << "it has seen another request";
  EXPECT_EQ(watcher.next()["COMMAND"], "STOP") << "the start was told twice";
  EXPECT_EQ(late.next()["COMMAND"], "STOP") << "the start was told again";
}

}  // namespace
