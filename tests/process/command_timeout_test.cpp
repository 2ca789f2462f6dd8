// How long a command may take.
#include <gmock/gmock.h>
#include <signal.h>

#include <string>
#include <thread>

#include "bss1.h"
#include "test_seam.h"
#include "tests/process/command_fixture.h"
#include "tests/support/system_faults.h"

namespace {

class CommandTimeout : public CommandFixture {
 protected:
  void expectKilled(const Result& result) const {
    EXPECT_TRUE(result.started);
    EXPECT_EQ(result.rc, 137);
    EXPECT_TRUE(traces.has(RAS1_ERROR, "Failed to wait on process"));
    ASSERT_EQ(record.kills().size(), 2u);
    EXPECT_EQ(record.kills()[1].second, SIGKILL);
  }

  const TEST_RecordedSleeps sleeps;
  const TEST_RecordedWaits waits;
  const TEST_TraceCapture traces;
  const KillRecord record;
};

TEST_F(CommandTimeout, UnsetTimeoutLetsAnInstallerRunForHours) {
  const std::string command = scriptThatWaits("echo begun", "echo done");
  std::thread hours([this] {
    EXPECT_TRUE(eventually([this] { return traces.has(RAS1_DETAIL, "outbuf: begun\n"); }));
    BSS1_Sleep(10'000);
    letGo();
  });
  EXPECT_EQ(run(command), success("begun\ndone\n"));
  hours.join();
  EXPECT_TRUE(record.kills().empty());
}

TEST_F(CommandTimeout, EmptyTimeoutIsUnset) {
  const ScopedVariable timeout("TIMEOUT", "");
  EXPECT_EQ(run(script("sleep 0.2; echo done")), success("done\n"));
}

TEST_F(CommandTimeout, SetTimeoutBoundsASilentCommand) {
  const ScopedVariable timeout("TIMEOUT", "2");
  const Result result = run(scriptThatWaits("echo begun"));
  expectKilled(result);
  EXPECT_EQ(result.out, "begun\n");
  EXPECT_EQ(waits.milliseconds().size(), 1u) << "the time spent reading counts";
  letGo();
}

TEST_F(CommandTimeout, SetTimeoutBoundsACommandThatPrintsForEver) {
  const ScopedVariable timeout("TIMEOUT", "1");
  const Result result = run(script("while :; do echo again; done"));
  expectKilled(result);
  EXPECT_THAT(result.out, testing::StartsWith("again\nagain\n"));
}

TEST_F(CommandTimeout, SetTimeoutDoesNotHurryACommandInTime) {
  const ScopedVariable timeout("TIMEOUT", "60");
  EXPECT_EQ(run(script("sleep 0.2; echo done")), success("done\n"));
  EXPECT_TRUE(record.kills().empty());
}

TEST_F(CommandTimeout, SetTimeoutIsBoundedFromTheStartNotFromTheWait) {
  const ScopedVariable timeout("TIMEOUT", "30");
  std::thread time([this] {
    EXPECT_TRUE(eventually([this] { return traces.has(RAS1_DETAIL, "outbuf: begun\n"); }));
    BSS1_Sleep(25);
    directory.writeFile("closing", "");
  });
  // Closes its outputs after 25 seconds, so the runner goes to wait with 5 left: one slice.
  const Result result =
      run(script("echo begun; while [ ! -e closing ] && [ -e $0 ]; do sleep 0.01; done; exec >&- 2>&-; "
                 "while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done"));
  time.join();
  expectKilled(result);
  EXPECT_EQ(waits.milliseconds().size(), 1u);
  letGo();
}

TEST_F(CommandTimeout, CommandThatClosesItsOutputsHasTheUsualTimeFromThenOn) {
  const Result result = run(script("exec >&- 2>&-; while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done"));
  expectKilled(result);
  EXPECT_EQ(waits.milliseconds().size(), 30u);
  letGo();
}

TEST_F(CommandTimeout, AgentCommandHasTheUsualTime) {
  const Result result = run(agentScript("while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done"));
  expectKilled(result);
  EXPECT_EQ(waits.milliseconds().size(), 30u);
  letGo();
}

TEST_F(CommandTimeout, AgentCommandThatNeitherReadsNorEndsIsKilled) {
  const ScopedVariable timeout("TIMEOUT", "1");
  const Result result =
      run(agentScript("while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done"), std::string(size_t{1} << 20, 'x'));
  expectKilled(result);
  EXPECT_EQ(waits.milliseconds().size(), 1u);
  letGo();
}

TEST_F(CommandTimeout, WaitWithoutAStatusIsNoSuccess) {
  const SystemFault fault(SystemCall::kKill, EPERM, 1, 2);
  const ScopedVariable timeout("TIMEOUT", "1");
  const Result result = run(scriptThatWaits());
  EXPECT_TRUE(result.started);
  EXPECT_EQ(result.rc, 255);
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Failed to wait on process"));
  letGo();
}

}  // namespace
