// The end of a child: its status, its time-out, and what may go wrong while it is waited for.
#include <gmock/gmock.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <climits>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "test_seam.h"
#include "tests/process/child_fixture.h"
#include "tests/support/system_faults.h"

namespace {

using testing::ElementsAre;
using testing::Pair;
using VMQ::Process;

class ProcessWait : public ChildFixture {
 protected:
  /// The first line that the child prints.
  static std::string readLine(Process& process) {
    std::string line;
    for (int byte; (byte = process.getStdOut()->read()) >= 0 && byte != '\n';) line += static_cast<char>(byte);
    return line;
  }
  /// The first line, a process id.
  static pid_t readPid(Process& process) { return std::stoi(readLine(process)); }

  static char stateOf(pid_t pid) {
    std::string stat = readWholeFile("/proc/" + std::to_string(pid) + "/stat");
    return stat[stat.rfind(')') + 2];
  }
  static bool exists(pid_t pid) { return kill(pid, 0) == 0; }
  static int statusOf(const std::string& command) {
    Process process(command.c_str());
    EXPECT_TRUE(process.start());
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
    return rc;
  }
};

TEST_F(ProcessWait, StatusIsTheExitCode) {
  EXPECT_EQ(statusOf("/bin/true"), 0);
  EXPECT_EQ(statusOf("/bin/false"), 1);
  EXPECT_EQ(statusOf(script("exit 3")), 3);
  EXPECT_EQ(statusOf(script("exit 255")), 255);
}

TEST_F(ProcessWait, StatusOfAChildThatASignalEndedIs128AndTheSignal) {
  EXPECT_EQ(statusOf(script("kill -TERM $$")), 143);
  EXPECT_EQ(statusOf(script("kill -KILL $$")), 137);
}

TEST_F(ProcessWait, TracesWhatTheWaiterAndTheCallerDo) {
  const TEST_TraceCapture traces;
  Process process(scriptThatWaits("echo $$", "exit 3").c_str());
  ASSERT_TRUE(process.start());
  const pid_t pid = readPid(process);
  letGo();
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  const std::string status = std::to_string(3 << 8);
  for (const std::string& line :
       {"Waiting for process id: " + std::to_string(pid),
        "waitpid returned rc=" + std::to_string(pid) + ",waitstat=" + status,
        std::string("WEXITSTATUS(waitstat)=3,WIFEXITED(waitstat)=1"), std::string("Signaling pd->wait_cond"),
        std::string("Exiting function with pthread_exit(NULL)"), std::string("calling pthread_cond_timedwait"),
        std::string("pthread_cond_timedwait rc=0, pd->completed=1"), std::string("Setting retCode=3")}) {
    EXPECT_TRUE(traces.has(RAS1_DETAIL, line)) << line;
  }
}

TEST_F(ProcessWait, NothingToWaitForIsAFailure) {
  int rc = 42;
  Process process("/bin/true");
  EXPECT_FALSE(process.wait(&rc));
  EXPECT_EQ(rc, 42);
  ASSERT_TRUE(process.start());
  EXPECT_TRUE(process.wait(&rc));
  rc = 42;
  EXPECT_FALSE(process.wait(&rc)) << "the child has been waited for";
  EXPECT_EQ(rc, 42);
}

TEST_F(ProcessWait, ChildThatOutlivesItsTimeoutIsKilled) {
  const TEST_RecordedWaits waits;
  const TEST_TraceCapture traces;
  const KillRecord record;
  Process process(scriptThatWaits("echo $$").c_str());
  ASSERT_TRUE(process.start());
  const pid_t pid = readPid(process);
  int rc = 0;
  EXPECT_FALSE(process.wait(&rc));
  EXPECT_EQ(rc, 137);
  EXPECT_THAT(record.kills(), ElementsAre(Pair(-pid, SIGKILL), Pair(pid, SIGKILL)));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Terminating process group -" + std::to_string(pid)));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Terminating process " + std::to_string(pid)));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:3 No such process"));  // it leads no group
  EXPECT_EQ(waits.milliseconds(), std::vector<int64_t>(30, 10'000));
  EXPECT_FALSE(process.running());
  letGo();
}

TEST_F(ProcessWait, TimeoutIsRoundedUpToTheNextSlice) {
  const std::string command = scriptThatWaits();
  for (const auto& [value, slices] : {std::pair("60", 6), std::pair("25", 3), std::pair("10", 1), std::pair("1", 1),
                                      std::pair("0", 1), std::pair("-5", 1)}) {
    const ScopedVariable timeout("TIMEOUT", value);
    const TEST_RecordedWaits waits;
    Process process(command.c_str());
    ASSERT_TRUE(process.start());
    int rc = 0;
    EXPECT_FALSE(process.wait(&rc));
    EXPECT_EQ(rc, 137);
    EXPECT_EQ(waits.milliseconds().size(), static_cast<size_t>(slices)) << value;
  }
  letGo();
}

TEST_F(ProcessWait, ChildThatLeadsAGroupIsKilledWithIt) {
  const TEST_RecordedWaits waits;
  // setsid keeps the process id: the child leads the group that the waiting one is in, which ends with the directory.
  const std::string leader =
      directory.writeScript("leader", "while [ -e \"$0\" ]; do sleep 0.01; done &\necho $!\necho $$\nwait\n");
  Process process(("/usr/bin/setsid " + leader).c_str());
  ASSERT_TRUE(process.start());
  const pid_t member = readPid(process);
  const pid_t pid = readPid(process);
  EXPECT_EQ(getpgid(pid), pid);
  int rc = 0;
  EXPECT_FALSE(process.wait(&rc));
  // Gone, or a zombie that waits for whoever inherits orphans here.
  EXPECT_TRUE(eventually([&] { return !exists(member) || stateOf(member) == 'Z'; }));
}

TEST_F(ProcessWait, ChildThatEndsByItselfAtTheKillIsNeitherMissedNorASuccess) {
  const TEST_RecordedWaits waits;
  const KillRecord record;
  // Keeps the waiter from noticing the end of the child until the kill has been sent.
  std::optional<SystemFault> stalled(std::in_place, SystemCall::kWaitid, EINTR, 1, INT_MAX - 1);
  Process process(script("echo $$").c_str());
  ASSERT_TRUE(process.start());
  const pid_t pid = readPid(process);
  ASSERT_TRUE(eventually([&] { return stateOf(pid) == 'Z'; }));
  std::thread release([&] {
    EXPECT_TRUE(eventually([&] { return record.kills().size() == 2; }));
    stalled.reset();
  });
  int rc = 0;
  EXPECT_FALSE(process.wait(&rc));
  release.join();
  EXPECT_EQ(rc, 137);
  EXPECT_THAT(record.kills(), ElementsAre(Pair(-pid, SIGKILL), Pair(pid, SIGKILL)));
}

TEST_F(ProcessWait, ReapedChildIsNeverKilled) {
  const TEST_RecordedWaits waits;
  const KillRecord record;
  const ScopedVariable timeout("TIMEOUT", "0");
  Process process("/bin/true");
  ASSERT_TRUE(process.start());
  ASSERT_TRUE(eventually([&] { return !process.running(); }));
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_EQ(rc, 0);
  EXPECT_TRUE(record.kills().empty());
  EXPECT_TRUE(waits.milliseconds().empty());
}

TEST_F(ProcessWait, ChildThatCannotBeKilledDoesNotHoldTheCaller) {
  const TEST_RecordedWaits waits;
  const TEST_TraceCapture traces;
  pid_t pid = -1;
  {
    Process process(scriptThatWaits("echo $$").c_str());
    ASSERT_TRUE(process.start());
    pid = readPid(process);
    const SystemFault fault(SystemCall::kKill, EPERM, 1, 2);
    int rc = 42;
    EXPECT_FALSE(process.wait(&rc));
    EXPECT_EQ(rc, 42);
    EXPECT_TRUE(process.running());
  }
  const std::string line = "Error occurred. ERRNO:1 Operation not permitted";
  EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAre(line, line));
  EXPECT_TRUE(exists(pid));
  letGo();
}

TEST_F(ProcessWait, InterruptedWaitsAreRepeated) {
  const SystemFault interruptedWait(SystemCall::kWaitid, EINTR, 1, 3);
  const SystemFault interruptedReap(SystemCall::kWaitpid, EINTR, 1, 3);
  EXPECT_EQ(statusOf(script("exit 3")), 3);
  EXPECT_TRUE(interruptedReap.happened());
}

TEST_F(ProcessWait, ChildThatCannotBeReapedGives255) {
  const TEST_TraceCapture traces;
  {
    const SystemFault fault(SystemCall::kWaitpid, ECHILD);
    EXPECT_EQ(statusOf("/bin/true"), 255);
  }
  EXPECT_TRUE(traces.hasPrefix(RAS1_DETAIL, "waitpid returned rc=-1,waitstat="));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:10 No child processes"));
}

TEST_F(ProcessWait, MutexThatCannotBeTakenMeansNoWaiting) {
  const TEST_TraceCapture traces;
  Process process(scriptThatWaits().c_str());
  ASSERT_TRUE(process.start());
  {
    const SystemFault fault(SystemCall::kPthreadMutexLock, EINVAL);
    int rc = 42;
    EXPECT_FALSE(process.wait(&rc));
    EXPECT_EQ(rc, 42);
  }
  EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAre("Error locking mutex: 22"));
  letGo();
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
}

TEST_F(ProcessWait, MutexThatCannotBeGivenBackIsTraced) {
  const TEST_TraceCapture traces;
  Process process("/bin/true");
  ASSERT_TRUE(process.start());
  ASSERT_TRUE(eventually([&] { return !process.running(); }));
  const SystemFault fault(SystemCall::kPthreadMutexUnlock, EPERM);
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_EQ(rc, 0);
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error unlocking mutex: 1"));
}

TEST_F(ProcessWait, WaiterTracesWhatItCannotLockSignalOrUnlock) {
  const std::pair<SystemCall, const char*> cases[] = {
      {SystemCall::kPthreadMutexLock, "pthread_mutex_lock error=22"},
      {SystemCall::kPthreadCondSignal, "pthread_cond_signal error=22"},
      {SystemCall::kPthreadMutexUnlock, "pthread_mutex_unlock error=22"},
  };
  for (const auto& [call, line] : cases) {
    const TEST_TraceCapture traces;
    Process process(script("read line; exit 3").c_str());
    ASSERT_TRUE(process.start());
    {
      const SystemFault fault(call, EINVAL);
      process.getStdIn()->close();
      EXPECT_TRUE(eventually([&] { return traces.has(RAS1_DETAIL, "Exiting function with pthread_exit(NULL)"); }));
    }
    EXPECT_TRUE(traces.has(RAS1_ERROR, line)) << line;
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
    EXPECT_EQ(rc, 3);
  }
}

TEST_F(ProcessWait, CompletionThatCannotBeAnnouncedIsTracedAndWaitedFor) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kWrite, EIO);
  EXPECT_EQ(statusOf(script("exit 3")), 3);
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:5 Input/output error"));
}

TEST_F(ProcessWait, WaitThatCannotBeTimedGoesOnWithoutTime) {
  const TEST_TraceCapture traces;
  Process process(script("sleep 0.1; exit 3").c_str());
  ASSERT_TRUE(process.start());
  const SystemFault fault(SystemCall::kTimedWait, EINVAL);
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_EQ(rc, 3);
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "pthread_cond_timedwait rc=22, pd->completed=0"));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:22 Invalid argument"));
}

TEST(Neg, NegatesEveryValue) {
  EXPECT_EQ(VMQ::neg(17), -17);
  EXPECT_EQ(VMQ::neg(-17), 17);
  EXPECT_EQ(VMQ::neg(0), 0);
  EXPECT_EQ(VMQ::neg(INT_MIN), INT_MIN);
}

}  // namespace
