// vmqctl against the real daemon, with the real component and an agent control script that does what a test wants.

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>

#include "apps/vmqctl/messages.h"
#include "tests/apps/vmqctl/vmqctl_process.h"
#include "tests/support/daemon_fixture.h"
#include "tests/support/eventually.h"
#include "tests/support/json.h"

namespace {

using testing::EndsWith;
using testing::HasSubstr;

/// A home whose agents start at once, but for "bad", which fails, and "slow", which waits while the file "hold" is
/// there.
class ScratchHome {
 public:
  ScratchHome() {
    const std::string home = directory_.path();
    directory_.writeScript("bin/CorvelAgent", "echo \"$*\" >>" + home + "/calls\n" +
                                                  "case $* in\n"
                                                  "  *' bad') exit 3 ;;\n"
                                                  "  *' slow') while [ -e " +
                                                  home +
                                                  "/hold ]; do sleep 0.05; done ;;\n"
                                                  "esac\n");
    directory_.writeScript("bin/qinfo",
                           "echo '\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"'\n"
                           "echo '\"ux\",\"Unix\",\"lx8266\",\"1\",\"2\"'\n"
                           "echo '\"ax\",\"Shared\",\"lx8266\",\"1\",\"2\"'\n");
    directory_.writeScript("zlpqor6/lx8266/bin/vmq_xa", "[ \"$1\" = -i ] && echo inst1\n");
    directory_.writeFile("calls", "");
  }
  [[nodiscard]] std::string path() const { return directory_.path(); }
  [[nodiscard]] std::string calls() const { return readWholeFile(directory_ / "calls"); }
  void hold() const { directory_.writeFile("hold", ""); }
  void release() const { std::filesystem::remove(directory_ / "hold"); }

 private:
  TemporaryDirectory directory_;
};

class DaemonTest : public testing::Test {
 protected:
  ~DaemonTest() override { home_.release(); }

  std::vector<std::string> line(std::vector<std::string> arguments) const {
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return arguments;
  }
  VmqctlResult run(std::vector<std::string> arguments) { return runVmqctl(line(std::move(arguments))); }

  /// How the control script is called, without its own name.
  std::string call(const std::string& rest) const { return "-h " + home_.path() + " " + rest + "\n"; }

  ScratchHome home_;
  DaemonFixture daemon_{{home_.path(), "", {}, true}};
};

TEST_F(DaemonTest, StartRunsTheControlScriptAndReportsItsEnd) {
  const VmqctlResult result = run({"start", "ux", "--transid", "t1"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT  RETVAL  RETMSGID\n"
            "START    ux                  t1       done         0\n");
  EXPECT_EQ(result.err,
            "asking vmqd for START of ux, transaction t1\n"
            "accepted, waiting for its status event, 600 s at most\n");
  EXPECT_EQ(home_.calls(), call("start ux"));
}

TEST_F(DaemonTest, InstanceIsStartedByItsName) {
  EXPECT_EQ(run({"start", "ux", "--instance", "blue"}).code, 0);
  EXPECT_EQ(home_.calls(), call("-o blue start ux"));
}

TEST_F(DaemonTest, TargetIsLookedUpForEachVerb) {
  EXPECT_EQ(run({"start", "ux", "--target", "inst1:node1:UX"}).code, 0);
  EXPECT_EQ(run({"stop", "ux", "--target", "inst1:node1:UX"}).code, 0);
  EXPECT_EQ(run({"restart", "ux", "--target", "inst1:node1:UX"}).code, 0);
  EXPECT_EQ(home_.calls(), call("-o inst1 start ux") + call("-c -o inst1 stop ux") + call("-c -o inst1 stop ux") +
                               call("-o inst1 start ux"));
}

TEST_F(DaemonTest, FailureOfTheControlScriptIsExplained) {
  const VmqctlResult result = run({"stop", "bad"});
  const std::string command = home_.path() + "/bin/CorvelAgent  -h " + home_.path() + " -c stop bad";
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.out, HasSubstr("  failed    1024  VMQ1024E\n"));
  EXPECT_THAT(result.err,
              EndsWith("vmqctl: STOP of bad failed: VMQ1024E " + std::string(vmqctl::findMessage("VMQ1024E")->text) +
                       " (parameters: " + command +
                       ") What the command printed is in the trace of vmqd, in the lines STDOUT and STDERR.\n"));
}

TEST_F(DaemonTest, ControlScriptThatIsMissingIsExplained) {
  std::filesystem::remove(home_.path() + "/bin/CorvelAgent");
  const VmqctlResult result = run({"start", "ux"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("vmqctl: START of ux failed: VMQ1025E "));
}

TEST_F(DaemonTest, WatcherSeesTheEventOfARequestThatNobodyWaitsFor) {
  VmqctlProcess watcher(line({"watch", "t1", "--count", "1"}));
  watcher.awaitErrors("watching for status events of t1");
  EXPECT_EQ(run({"start", "ux", "--transid", "t1", "--no-wait"}).code, 0);
  EXPECT_EQ(run({"start", "ux", "--transid", "t2"}).code, 0);
  const VmqctlResult result = watcher.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "t1: START on testnode done\n");
}

TEST_F(DaemonTest, RequestThatWasInterruptedGoesOnAndCanBeWatched) {
  home_.hold();
  VmqctlProcess starting(line({"start", "slow", "--transid", "t1"}));
  starting.awaitErrors("accepted");
  starting.signal(SIGINT);
  const VmqctlResult interrupted = starting.finish();
  EXPECT_EQ(interrupted.code, 130);
  EXPECT_THAT(interrupted.err, HasSubstr("vmqctl watch --socket " + daemon_.socket() + " t1 ("));

  VmqctlProcess watcher(line({"watch", "t1", "--count", "1"}));
  watcher.awaitErrors("watching");
  home_.release();
  EXPECT_EQ(watcher.finish().out, "t1: START on testnode done\n");
}

TEST_F(DaemonTest, SlowAgentRunsIntoTheTimeOut) {
  home_.hold();
  const VmqctlResult result = run({"start", "slow", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_THAT(result.err, HasSubstr("vmqctl: No status event of START of slow came within 1 second"));
}

TEST_F(DaemonTest, DaemonThatGoesAwayIsTold) {
  home_.hold();
  VmqctlProcess starting(line({"start", "slow"}));
  starting.awaitErrors("accepted");
  daemon_.kill();
  const VmqctlResult result = starting.finish();
  EXPECT_EQ(result.code, 7);
  EXPECT_THAT(result.err, HasSubstr("vmqctl: The daemon ended its event stream before the status event"));
  EXPECT_EQ(run({"status"}).code, 7);  // only its socket is left
}

TEST_F(DaemonTest, QueryShowsTheAnswerRow) {
  const VmqctlResult result = run({"query", "KAGREQT", "COMMAND=PAUSE", "TRANSID=t1", "RETVAL>=1000", "-o", "json"});
  EXPECT_EQ(result.code, 0);
  const auto rows = parsedJson(result.out);
  ASSERT_EQ(rows.size(), 1U);
  EXPECT_EQ(rows[0]["ORIGINNODE"], "testnode");
  EXPECT_EQ(rows[0]["TRANSID"], "t1");
  EXPECT_EQ(rows[0]["RETVAL"], 1006);
  EXPECT_EQ(rows[0]["RETMSGID"], "VMQ1006E");
  EXPECT_EQ(rows[0]["RETMSGPARM"], "PAUSE");

  EXPECT_EQ(run({"query", "KAGREQT", "COMMAND=PAUSE", "TRANSID=t1", "RETVAL=0"}).err, "no rows\n");
  EXPECT_EQ(run({"query", "KAGDYST"}).err, "no rows\n");
}

TEST_F(DaemonTest, RefusalsOfTheDaemonAreShownWithTheNextStep) {
  VmqctlResult result = run({"query", "NOSUCH"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, testing::AllOf(HasSubstr("vmqctl: "), HasSubstr("NOSUCH"),
                                         EndsWith(". The command \"vmqctl status\" lists the tables.\n")));
  result = run({"query", "KAGREQT", "NOSUCH=1"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, EndsWith("lists the columns of each table.\n"));
}

TEST_F(DaemonTest, StatusShowsTheDaemon) {
  const VmqctlResult result = run({"status"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(result.out, HasSubstr("socket    " + daemon_.socket() +
                                    "\nversion   " VMQ_VERSION "\nnode      testnode\nhome      " + home_.path() +
                                    "\ndepot     " + daemon_.depot()));
  EXPECT_THAT(result.out, HasSubstr("health    ok\n"));
  EXPECT_THAT(result.out, HasSubstr("tables    KAGREQT KINAGT KAGDYST\n"));
}

TEST_F(DaemonTest, StatusInJsonListsTheColumns) {
  const auto status = parsedJson(run({"status", "-o", "json"}).out);
  EXPECT_EQ(status["node"], "testnode");
  EXPECT_EQ(status["health"]["status"], "ok");
  ASSERT_EQ(status["tables"].size(), 3U);
  EXPECT_EQ(status["tables"][2]["table"], "KAGDYST");
  EXPECT_EQ(status["tables"][2]["columns"].size(), 7U);
}

TEST_F(DaemonTest, UserWhomTheDaemonDoesNotAdmitIsTold) {
  if (geteuid() != 0) GTEST_SKIP() << "needs root, to become somebody else";
  VmqctlOptions options;
  options.program = copyOfVmqctl(daemon_.directory());
  options.asNobody = true;
  const std::vector<std::string> start = line({"start", "ux"});

  VmqctlResult result = runVmqctl(start, options);  // by the mode of the socket
  EXPECT_EQ(result.code, 4);
  EXPECT_THAT(result.err, HasSubstr("vmqctl: The socket " + daemon_.socket() + " may not be used by this user."));

  ASSERT_EQ(chmod(daemon_.socket().c_str(), 0666), 0);
  result = runVmqctl(start, options);  // by the daemon itself
  EXPECT_EQ(result.code, 4);
  EXPECT_THAT(result.err, EndsWith(" Run vmqctl as root or as a user in the daemon's allowed_uids.\n"));
  EXPECT_EQ(home_.calls(), "");
}

}  // namespace
