#include "tasks/start_stop.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/tasks/installation_home.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using VMQ::String;

/// A user that no machine has, so that `su` ends at once and non-zero.
constexpr char kNobodyAtAll[] = "vmq-no-such-user";

String text(const std::string& s) {
  return String(s.c_str());
}

class StartStop : public testing::Test {
 protected:
  StartStop() { home.controlScript("exit 0"); }

  /// H in the expectations: the installation home.
  [[nodiscard]] std::string atHome(std::string command) const {
    for (size_t at = 0; (at = command.find('H', at)) != std::string::npos; at += home.path().size())
      command.replace(at, 1, home.path());
    return command;
  }
  void expectMessage(const std::string& id, const std::string& parameter) const {
    EXPECT_EQ(request.retmsgid.toNarrow(), id);
    EXPECT_EQ(request.retmsgparm.toNarrow(), parameter);
  }

  InstallationHome home;
  TaskQueueElem request;
  TEST_TraceCapture trace;
};

// ---- command lines -------------------------------------------------------------------------------------------------

struct CommandLine {
  const char* situation;
  std::string action;
  std::string instance;
  std::string run_as_file;
  std::string command;  // H stands for the home
};

void PrintTo(const CommandLine& line, std::ostream* out) {
  *out << line.situation;
}

class ControlScriptCommand : public StartStop, public testing::WithParamInterface<CommandLine> {};

TEST_P(ControlScriptCommand, IsBuilt) {
  const CommandLine& c = GetParam();
  home.runAsFile(c.run_as_file);
  startstopAgent(text(c.action), "ux", text(c.instance), &request);
  EXPECT_THAT(commandLines(trace), ElementsAre(atHome(c.command)));
  EXPECT_TRUE(
      trace.has(RAS1_DETAIL, "Attempting to [" + c.action + "] product code [ux] instance [" + c.instance + "]"));
}

const auto runAs = InstallationHome::runAs;

const CommandLine kCommandLines[] = {
    {"start", "START", "", "", "H/bin/CorvelAgent  -h H start ux"},
    {"start of an instance", "START", "inst1", "", "H/bin/CorvelAgent  -h H -o inst1 start ux"},
    {"stop", "STOP", "", "", "H/bin/CorvelAgent  -h H -c stop ux"},
    {"stop of an instance", "STOP", "inst1", "", "H/bin/CorvelAgent  -h H -c -o inst1 stop ux"},
    {"another action", "BOUNCE", "", "", "H/bin/CorvelAgent  -h H oh-oh-not-supported ux"},
    {"action in lower case is another action", "start", "", "", "H/bin/CorvelAgent  -h H oh-oh-not-supported ux"},

    {"stop as a user", "STOP", "", runAs("ux", "", kNobodyAtAll),
     "/usr/bin/su - vmq-no-such-user -c \"H/bin/CorvelAgent  -h H -c stop ux\""},
    {"start of an instance as a user", "START", "inst1", runAs("ux", "inst1", kNobodyAtAll),
     "/usr/bin/su - vmq-no-such-user -c \"H/bin/CorvelAgent  -h H -o inst1 start ux\""},
    {"product without run-as entry", "START", "inst1", runAs("or", "inst1", kNobodyAtAll),
     "H/bin/CorvelAgent  -h H -o inst1 start ux"},
    {"product code in other case", "START", "inst1", runAs("UX", "inst1", kNobodyAtAll),
     "H/bin/CorvelAgent  -h H -o inst1 start ux"},
    {"instance without run-as entry", "START", "inst1", runAs("ux", "inst2", kNobodyAtAll),
     "H/bin/CorvelAgent  -h H -o inst1 start ux"},
    {"no instance, and only named ones have users", "START", "", runAs("ux", "inst1", kNobodyAtAll),
     "H/bin/CorvelAgent  -h H start ux"},
    {"empty run-as user", "START", "inst1", runAs("ux", "inst1", ""), "H/bin/CorvelAgent  -h H -o inst1 start ux"},
    {"malformed run-as file", "START", "inst1", "<runas><agent>", "H/bin/CorvelAgent  -h H -o inst1 start ux"},
};

INSTANTIATE_TEST_SUITE_P(All, ControlScriptCommand, testing::ValuesIn(kCommandLines));

TEST_F(StartStop, ControlScriptGetsItsArguments) {
  EXPECT_EQ(startAgent("ux", "inst1", &request), TASK_OK);
  EXPECT_EQ(stopAgent("ux", "inst1", &request), TASK_OK);
  EXPECT_THAT(home.runs(), ElementsAre(atHome("-h H -o inst1 start ux"), atHome("-h H -c -o inst1 stop ux")));
}

TEST_F(StartStop, UnreadableRunAsFileMeansNoUser) {
  home.runAsFile(runAs("ux", "", kNobodyAtAll));
  // A directory in its place cannot be read by anybody, root included.
  const std::string file = home.path() + "/config";
  for (const auto& entry : std::filesystem::directory_iterator(file)) {
    std::filesystem::remove(entry);
    std::filesystem::create_directory(entry);
  }
  EXPECT_EQ(startAgent("ux", "", &request), TASK_OK);
  EXPECT_THAT(commandLines(trace), ElementsAre(atHome("H/bin/CorvelAgent  -h H start ux")));
}

TEST_F(StartStop, FailureAsAnotherUserCarriesTheWholeCommandLine) {
  home.runAsFile(runAs("ux", "inst1", kNobodyAtAll));
  EXPECT_EQ(stopAgent("ux", "inst1", &request), TASK_STARTSTOP_FAILED);
  expectMessage("VMQ1024E",
                atHome("/usr/bin/su - vmq-no-such-user -c \"H/bin/CorvelAgent  -h H -c -o inst1 stop ux\""));
  EXPECT_THAT(home.runs(), IsEmpty());
}

// ---- outcomes ------------------------------------------------------------------------------------------------------

TEST_F(StartStop, SuccessLeavesTheRequestAlone) {
  request.retmsgid = "before";
  request.retmsgparm = "before";
  EXPECT_EQ(startAgent("ux", "", &request), TASK_OK);
  expectMessage("before", "before");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Exit with return code [0]"));
}

TEST_F(StartStop, NonZeroExitIsAFailure) {
  home.controlScript("exit 3");
  const std::string command = atHome("H/bin/CorvelAgent  -h H start ux");
  EXPECT_EQ(startAgent("ux", "", &request), TASK_STARTSTOP_FAILED);
  expectMessage("VMQ1024E", command);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "VMQ1024E Bad return code from start/stop command [" + command + "]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Exit with return code [1024]"));
}

TEST_F(StartStop, ScriptEndedByASignalIsAFailure) {
  home.controlScript("kill -9 $$");
  EXPECT_EQ(stopAgent("ux", "", &request), TASK_STARTSTOP_FAILED);
  expectMessage("VMQ1024E", atHome("H/bin/CorvelAgent  -h H -c stop ux"));
}

TEST_F(StartStop, MissingScriptCannotBeStarted) {
  home.removeControlScript();
  const std::string command = atHome("H/bin/CorvelAgent  -h H -c stop ux");
  EXPECT_EQ(stopAgent("ux", "", &request), TASK_STARTSTOP_NOT_STARTED);
  expectMessage("VMQ1025E", command);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "VMQ1025E Failed to start command [" + command + "]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Exit with return code [1025]"));
}

TEST_F(StartStop, OutcomeOfAnotherActionIsReportedLikeAnyOther) {
  home.controlScript("exit 1");
  EXPECT_EQ(startstopAgent("BOUNCE", "ux", "", &request), TASK_STARTSTOP_FAILED);
  expectMessage("VMQ1024E", atHome("H/bin/CorvelAgent  -h H oh-oh-not-supported ux"));
}

TEST_F(StartStop, NullRequestOnlySuppressesTheMessage) {
  home.controlScript("exit 1");
  EXPECT_EQ(startAgent("ux", "", nullptr), TASK_STARTSTOP_FAILED);
  home.removeControlScript();
  EXPECT_EQ(startAgent("ux", "", nullptr), TASK_STARTSTOP_NOT_STARTED);
}

TEST_F(StartStop, RestartStopsAndThenStarts) {
  EXPECT_EQ(restartAgent("ux", "inst1", &request), TASK_OK);
  EXPECT_THAT(commandLines(trace), ElementsAre(atHome("H/bin/CorvelAgent  -h H -c -o inst1 stop ux"),
                                               atHome("H/bin/CorvelAgent  -h H -o inst1 start ux")));
  expectMessage("", "");
}

TEST_F(StartStop, RestartWhoseStopFailsSucceedsWithTheMessageOfTheStop) {
  home.controlScript("case \"$*\" in *stop*) exit 1;; esac");
  EXPECT_EQ(restartAgent("ux", "", &request), TASK_OK);
  EXPECT_EQ(home.runs().size(), 2u);
  expectMessage("VMQ1024E", atHome("H/bin/CorvelAgent  -h H -c stop ux"));
}

TEST_F(StartStop, RestartWhoseStartFailsReportsTheStart) {
  home.controlScript("case \"$*\" in *start*) exit 1;; esac");
  EXPECT_EQ(restartAgent("ux", "", &request), TASK_STARTSTOP_FAILED);
  expectMessage("VMQ1024E", atHome("H/bin/CorvelAgent  -h H start ux"));
}

TEST_F(StartStop, LeavesNothingBehind) {
  startAgent("ux", "", &request);
  const ProcessResources before = ProcessResources::now();
  for (int i = 0; i < 20; ++i) restartAgent("ux", "inst1", &request);
  EXPECT_EQ(ProcessResources::now(), before);
}

// ---- environment ---------------------------------------------------------------------------------------------------

TEST_F(StartStop, StartedAgentHasNoTraceLogAndNoHostName) {
  setenv("BXIRA_HOSTNAME", "somewhere", 1);
  setenv("KBB_RAS1_LOG", "/somewhere/else.log", 1);
  startAgent("ux", "", &request);
  const auto environment = home.environment();
  EXPECT_EQ(environment.count("BXIRA_HOSTNAME"), 0u);
  ASSERT_EQ(environment.count("KBB_RAS1_LOG"), 1u);
  EXPECT_EQ(environment.at("KBB_RAS1_LOG"), "");
  EXPECT_EQ(getenv("BXIRA_HOSTNAME"), nullptr);  // gone for good, here too
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "about to invoke unsetenv()"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "found a match for env variable [BXIRA_HOSTNAME=somewhere] "));
  unsetenv("KBB_RAS1_LOG");
}

TEST_F(StartStop, StoppedAgentKeepsTheEnvironment) {
  setenv("BXIRA_HOSTNAME", "somewhere", 1);
  setenv("KBB_RAS1_LOG", "/somewhere/else.log", 1);
  stopAgent("ux", "", &request);
  const auto environment = home.environment();
  ASSERT_EQ(environment.count("BXIRA_HOSTNAME"), 1u);
  EXPECT_EQ(environment.at("BXIRA_HOSTNAME"), "somewhere");
  ASSERT_EQ(environment.count("KBB_RAS1_LOG"), 1u);
  EXPECT_EQ(environment.at("KBB_RAS1_LOG"), "/somewhere/else.log");
  unsetenv("BXIRA_HOSTNAME");
  unsetenv("KBB_RAS1_LOG");
}

/// Runs the rest of a test with an environment of its own.
class OwnEnvironment {
 public:
  explicit OwnEnvironment(std::vector<std::string> entries) : entries_(std::move(entries)) {
    for (std::string& entry : entries_) pointers_.push_back(entry.data());
    pointers_.push_back(nullptr);
    before_ = environ;
    environ = pointers_.data();
  }
  ~OwnEnvironment() { environ = before_; }

  static std::vector<std::string> entries() {
    std::vector<std::string> now;
    for (char** entry = environ; *entry != nullptr; ++entry) now.emplace_back(*entry);
    return now;
  }

 private:
  std::vector<std::string> entries_;
  std::vector<char*> pointers_;
  char** before_;
};

void removeVariable(std::string name) {
  unsetEnv(name.data());
}

TEST(RemovedVariable, IsTheOnlyOneThatGoes) {
  TEST_TraceCapture trace;
  const OwnEnvironment own({"A=1", "B=2", "C=3"});
  removeVariable("B");
  EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("A=1", "C=3"));
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("found a match for env variable [B=2] "));
}

TEST(RemovedVariable, IsNotMissedWhereThereIsNoEnvironmentAtAll) {
  TEST_TraceCapture trace;
  char** const before = std::exchange(environ, nullptr);  // as clearenv leaves it
  removeVariable("B");
  EXPECT_EQ(environ, nullptr);
  environ = before;
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
}

TEST(RemovedVariable, MayBeTheFirstTheLastOrTheOnlyOne) {
  {
    const OwnEnvironment own({"A=1", "B=2"});
    removeVariable("A");
    EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("B=2"));
  }
  {
    const OwnEnvironment own({"A=1", "B=2"});
    removeVariable("B");
    EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("A=1"));
  }
  {
    const OwnEnvironment own({"A=1"});
    removeVariable("A");
    EXPECT_THAT(OwnEnvironment::entries(), IsEmpty());
  }
}

TEST(RemovedVariable, ThatIsNotThereChangesNothing) {
  TEST_TraceCapture trace;
  const OwnEnvironment own({"A=1"});
  removeVariable("B");
  EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("A=1"));
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
}

TEST(RemovedVariable, PrefixOfAnotherRemovesNothing) {
  const OwnEnvironment own({"BXIRA_HOSTNAME=x"});
  removeVariable("BXIRA");
  EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("BXIRA_HOSTNAME=x"));
}

TEST(RemovedVariable, MayHaveAnEmptyValueOrNone) {
  const OwnEnvironment own({"BXIRA_HOSTNAME=", "A"});
  removeVariable("BXIRA_HOSTNAME");
  removeVariable("A");
  EXPECT_THAT(OwnEnvironment::entries(), IsEmpty());
}

TEST(RemovedVariable, GoesOnlyOnceWhenItIsThereTwice) {
  const OwnEnvironment own({"A=1", "B=2", "A=3"});
  removeVariable("A");
  EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("B=2", "A=3"));
}

TEST(RemovedVariable, StaysWhenTheEnvironmentCannotBeLocked) {
  TEST_TraceCapture trace;
  const OwnEnvironment own({"A=1"});
  const TEST_FailCall failing("BSS1_GetLock", 1, 35);
  removeVariable("A");
  EXPECT_THAT(OwnEnvironment::entries(), ElementsAre("A=1"));
  EXPECT_THAT(trace.texts(RAS1_ERROR),
              ElementsAre("Env variable [A] stays, the environment lock could not be taken, return code 35"));
}

// ---- removed characters --------------------------------------------------------------------------------------------

std::string without(char character, const char* before) {
  String changed(before);
  removeChar(changed, character);
  return changed.toNarrow();
}

TEST(RemovedCharacter, IsGoneWhereverItWas) {
  EXPECT_EQ(without('\'', "'a''b'c'"), "abc");
}

TEST(RemovedCharacter, ThatIsNotThereChangesNothing) {
  EXPECT_EQ(without('\'', "abc"), "abc");
}

TEST(RemovedCharacter, OfATextOfNothingElseLeavesItEmpty) {
  EXPECT_EQ(without('x', "xxx"), "");
}

TEST(RemovedCharacter, OfAnEmptyTextLeavesItEmpty) {
  EXPECT_EQ(without('x', ""), "");
}

}  // namespace
