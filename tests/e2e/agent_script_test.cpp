// bin/CorvelAgent of the sample home, as a person runs it.

#include <gmock/gmock.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include "tests/e2e/loopback.h"
#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

class AgentScript : public testing::Test {
 protected:
  /// Runs it and fails unless it exits with 0.
  void succeed(const std::string& arguments) {
    const Outcome outcome = home.control(arguments);
    ASSERT_EQ(outcome.exit_code, 0) << outcome.output;
  }

  /// A sleeping child of the test, standing in for some process that is none of the agent's business.
  class Bystander {
   public:
    Bystander() : pid(fork()) {
      if (pid == 0) {
        execl("/bin/sleep", "sleep", "1000", nullptr);
        _exit(127);
      }
      if (pid < 0) throw std::runtime_error("no child");  // the signal for it would be one for everybody
    }
    ~Bystander() {
      kill(pid, SIGKILL);
      waitpid(pid, nullptr, 0);
    }
    const pid_t pid;
  };

  SampleHome home;
};

TEST_F(AgentScript, StartedAgentAnswersOnItsPort) {
  ASSERT_FALSE(answers(home.port("ux")));
  succeed("start ux");
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_TRUE(isRunning(home.pid("ux").value()));
}

TEST_F(AgentScript, StartedAgentHasASessionOfItsOwnAndItsOwnStreams) {
  succeed("start ux");
  const pid_t agent = home.pid("ux").value();
  EXPECT_EQ(getsid(agent), agent);
  const fs::path process = "/proc/" + std::to_string(agent);
  EXPECT_EQ(fs::read_symlink(process / "fd/0"), "/dev/null");
  EXPECT_EQ(fs::read_symlink(process / "fd/1"), home / "logs/ux.log");
  EXPECT_EQ(fs::read_symlink(process / "fd/2"), home / "logs/ux.log");
  EXPECT_EQ(fs::read_symlink(process / "cwd"), "/");
}

TEST_F(AgentScript, InstanceIsAnAgentOfItsOwn) {
  succeed("start ux");
  succeed("-o inst1 start ux");
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_TRUE(answers(home.port("ux_inst1")));
  succeed("-c -o inst1 stop ux");
  EXPECT_FALSE(answers(home.port("ux_inst1")));
  EXPECT_TRUE(answers(home.port("ux"))) << "the stop of one took the other";
}

TEST_F(AgentScript, SecondStartSaysSoAndLeavesTheAgentAlone) {
  succeed("start ux");
  const pid_t agent = home.pid("ux").value();
  const Outcome second = home.control("start ux");
  EXPECT_EQ(second.exit_code, 0);
  EXPECT_EQ(second.output, "ux is already running (pid " + std::to_string(agent) + ")\n");
  EXPECT_EQ(home.pid("ux"), agent);
  EXPECT_TRUE(isRunning(agent));
}

TEST_F(AgentScript, StartsAtTheSameTimeMakeOneAgent) {
  const std::string start = quoted(home / "bin/CorvelAgent") + " -h " + quoted(home.path()) + " start ux";
  const Outcome outcome = runShell(start + " & one=$!; " + start + " & two=$!; wait $one && wait $two");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_THAT(outcome.output, HasSubstr("ux started"));
  EXPECT_THAT(outcome.output, HasSubstr("ux is already running"));
  EXPECT_EQ(signalEveryProcessNaming(home / "prometheus-node-exporter", 0), 1U);
}

TEST_F(AgentScript, StopEndsTheAgentBeforeItReturns) {
  succeed("start ux");
  const pid_t agent = home.pid("ux").value();
  succeed("-c stop ux");
  EXPECT_FALSE(isRunning(agent));
  EXPECT_FALSE(answers(home.port("ux")));
  EXPECT_EQ(home.pid("ux"), std::nullopt);
}

TEST_F(AgentScript, StopOfWhatDoesNotRunIsNoError) {
  const Outcome outcome = home.control("-c stop ux");
  EXPECT_EQ(outcome.exit_code, 0);
  EXPECT_EQ(outcome.output, "ux is not running\n");
}

TEST_F(AgentScript, StatusTellsWhetherItRuns) {
  EXPECT_EQ(home.control("status ux").exit_code, 3);
  succeed("start ux");
  EXPECT_EQ(home.control("status ux").exit_code, 0);
}

TEST_F(AgentScript, PidThatAnotherProcessHasNowIsLeftAlone) {
  const Bystander bystander;
  succeed("start ux");
  const pid_t agent = home.pid("ux").value();
  ASSERT_EQ(kill(agent, SIGKILL), 0);
  ASSERT_TRUE(soon([agent] { return !isRunning(agent); }));
  std::string recorded = readWholeFile(home / "run/ux.pid");
  recorded.replace(0, recorded.find(' '), std::to_string(bystander.pid));
  std::ofstream(home / "run/ux.pid") << recorded;

  EXPECT_EQ(home.control("status ux").exit_code, 3);
  succeed("-c stop ux");
  EXPECT_TRUE(isRunning(bystander.pid));
}

TEST_F(AgentScript, ProcessThatDoesNotLookLikeAnAgentIsLeftAlone) {
  const Bystander bystander;
  fs::create_directories(home / "run");
  // The right time of birth too, as after a restart of the machine it may happen to be.
  const Outcome birth = runShell("cut -d ' ' -f 22 /proc/" + std::to_string(bystander.pid) + "/stat");
  std::ofstream(home / "run/ux.pid") << bystander.pid << " " << birth.output;
  succeed("-c stop ux");
  EXPECT_TRUE(isRunning(bystander.pid));
}

// What they name is nobody or the bystander: a script that believed them would do no harm to others.
TEST_F(AgentScript, StalePidFileDoesNotKeepTheAgentFromStarting) {
  const Bystander bystander;
  const std::string other = std::to_string(bystander.pid);
  fs::create_directories(home / "run");
  for (const std::string& stale :
       {std::string(), std::string("\n"), other + "\n", other + " 1\n", std::string("-999999999 1\n"),
        std::string("self 1\n"), std::string("999999999 12\n"), other + " 2 3\n", "../" + other + " x"}) {
    SCOPED_TRACE(stale);
    std::ofstream(home / "run/ux.pid") << stale;
    EXPECT_EQ(home.control("status ux").exit_code, 3);
    succeed("start ux");
    EXPECT_TRUE(answers(home.port("ux")));
    succeed("-c stop ux");
    std::ofstream(home / "run/ux.pid") << stale;
    succeed("-c stop ux");
    EXPECT_TRUE(isRunning(bystander.pid));
  }
}

TEST_F(AgentScript, PortOfAnotherProgramIsRefused) {
  const OccupiedPort occupied;
  home.configure("ux", "PORT=" + std::to_string(occupied.number()));
  const Outcome outcome = home.control("start ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("port " + std::to_string(occupied.number()) + " is taken by another program"));
  EXPECT_EQ(home.pid("ux"), std::nullopt);
}

TEST_F(AgentScript, PortOfAnotherAgentIsRefused) {
  succeed("start ux");
  home.configure("ux_inst1", "PORT=" + std::to_string(home.port("ux")));
  const Outcome outcome = home.control("-o inst1 start ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("is taken by another program"));
}

TEST_F(AgentScript, ProgramThatEndsAtOnceIsAFailure) {
  home.configure("ux", "PROGRAM=" + home.writeProgram("brief", "echo no mood today >&2; exit 0"));
  const Outcome outcome = home.control("start ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("ux ended at once; see " + (home / "logs/ux.log")));
  EXPECT_EQ(readWholeFile(home / "logs/ux.log"), "no mood today\n");
  EXPECT_EQ(home.pid("ux"), std::nullopt);
}

TEST_F(AgentScript, ProgramThatDoesNotAnswerInTimeIsAFailureAndIsEnded) {
  const std::string program = home.writeProgram("silent", "while :; do sleep 0.1; done");
  home.configure("ux", "PROGRAM=" + program);
  home.configure("ux", "WAIT_SECONDS=1");
  const Outcome outcome = home.control("start ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output,
              HasSubstr("ux did not answer on port " + std::to_string(home.port("ux")) + " within 1 sec"));
  EXPECT_EQ(signalEveryProcessNaming(program, 0), 0U);
  EXPECT_EQ(home.pid("ux"), std::nullopt);
}

TEST_F(AgentScript, StopThatCannotEndTheAgentFails) {
  succeed("start ux");
  home.configure("ux", "WAIT_SECONDS=1");
  const pid_t agent = home.pid("ux").value();
  ASSERT_EQ(kill(agent, SIGSTOP), 0);
  const Outcome outcome = home.control("-c stop ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("ux (pid " + std::to_string(agent) + ") has not ended within 1 seconds"));
  EXPECT_EQ(home.pid("ux"), agent) << "what still runs must stay known";
}

TEST_F(AgentScript, ConfigurationThatCannotBeUsedIsNamed) {
  struct {
    const char* line;
    const char* complaint;
  } const cases[] = {
      {"PROGRAM=", "ux: there is no program \"\" (PROGRAM in "},
      {"PROGRAM=/no/such/program", "ux: there is no program \"/no/such/program\" (PROGRAM in "},
      {"PORT=", "ux: PORT in "},
      {"PORT=http", "ux: PORT in "},
      {"PORT=0", "ux: PORT in "},
      {"PORT=65536", "ux: PORT in "},
      {"PORT=99999999999999999999", "ux: PORT in "},
      {"WAIT_SECONDS=soon", "ux: WAIT_SECONDS in "},
      {"WAIT_SECONDS=86401", "ux: WAIT_SECONDS in "},
  };
  const std::string good = readWholeFile(home / "config/ux.config");
  for (const auto& bad : cases) {
    SCOPED_TRACE(bad.line);
    home.configure("ux", bad.line);
    const Outcome outcome = home.control("start ux");
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.output, HasSubstr(std::string("CorvelAgent: ") + bad.complaint));
    EXPECT_EQ(std::count(outcome.output.begin(), outcome.output.end(), '\n'), 1) << outcome.output;
    std::ofstream(home / "config/ux.config") << good;
  }
}

TEST_F(AgentScript, NumbersMayBeginWithAZero) {
  home.configure("ux", "WAIT_SECONDS=08");
  succeed("start ux");
  succeed("stop ux");
}

TEST_F(AgentScript, DataProvidersComeFromAListThatNeedNotBeUtf8) {
  std::ofstream(home / "config/.ConfigData/kumenv") << "# f\xFCr\nlx8266|DATAPROVIDER|POST,\xFC|\n";
  const std::string before = readWholeFile(home / "config/um.config");
  std::ofstream(home / "config/um.config") << before.substr(0, before.size() - 1);  // no line end at its end
  ASSERT_EQ(runShell("LC_ALL=C.UTF-8 " + quoted(home / "bin/CorvelAgent") + " -h " + quoted(home.path()) + " start um")
                .exit_code,
            0);
  EXPECT_THAT(readWholeFile(home / "config/um.config"), testing::EndsWith("\nKUMA_STARTUP_DP='POST,\xFC'\n"));
}

TEST_F(AgentScript, ConfigurationIsReadAndNotExecuted) {
  home.configure("ux", "PORT=$(touch " + (home / "executed") + ")");
  EXPECT_EQ(home.control("start ux").exit_code, 1);
  EXPECT_FALSE(fs::exists(home / "executed"));
}

TEST_F(AgentScript, AgentWithoutConfigurationDoesNotExist) {
  for (const char* verb : {"start", "stop", "status"}) {
    const Outcome outcome = home.control("-o inst2 " + std::string(verb) + " ux");
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.output, HasSubstr("ux_inst2: cannot read " + (home / "config/ux_inst2.config")));
  }
}

TEST_F(AgentScript, WhatIsNotUnderstoodIsUsageAndDoesNothing) {
  struct {
    const char* arguments;
    const char* complaint;
  } const cases[] = {
      {"", "a verb and a product are needed"},
      {"start", "a verb and a product are needed"},
      {"start ux now", "a verb and a product are needed"},
      {"oh-oh-not-supported ux", "verb \"oh-oh-not-supported\" is not known"},
      {"START ux", "verb \"START\" is not known"},
      {"start lz", "product \"lz\" is not known; there are ux and um"},
      {"start UX", "product \"UX\" is not known; there are ux and um"},
      {"-x start ux", "option -x is not known or lacks its value"},
      {"-o", "option -o is not known or lacks its value"},
      {"-o ../ux start ux", "instance \"../ux\" is not a name"},
      {"-o 'a b' start ux", "instance \"a b\" is not a name"},
      {"-h home start ux", "the home must be given by its full path (-h)"},
  };
  for (const auto& bad : cases) {
    SCOPED_TRACE(bad.arguments);
    const Outcome outcome = home.control(bad.arguments);
    EXPECT_EQ(outcome.exit_code, 64);
    EXPECT_THAT(outcome.output, HasSubstr(std::string("CorvelAgent: ") + bad.complaint));
    EXPECT_THAT(outcome.output, HasSubstr("usage: CorvelAgent -h HOME"));
  }
  EXPECT_FALSE(fs::exists(home / "run"));
}

TEST_F(AgentScript, ComplaintsGoToStandardError) {
  const Outcome outcome = home.control("oh-oh-not-supported ux 2>/dev/null");
  EXPECT_EQ(outcome.exit_code, 64);
  EXPECT_EQ(outcome.output, "");
}

}  // namespace
