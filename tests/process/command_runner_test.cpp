// What the runner gives its caller: status, output, traces.
#include <gmock/gmock.h>
#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "test_seam.h"
#include "tests/process/command_fixture.h"
#include "tests/support/system_faults.h"

namespace {

using VMQ::String;
using VMQ::Util;

using CommandRunner = CommandFixture;

TEST_F(CommandRunner, GivesStatusAndBothOutputs) {
  const Result result = run(script("echo out; echo err >&2; exit 3"));
  EXPECT_EQ(result, (Result{true, 3, "out\n", "err\n"}));
}

TEST_F(CommandRunner, ReplacesWhatTheTextsHeld) {
  EXPECT_EQ(run("/bin/true"), success(""));
}

TEST_F(CommandRunner, EveryFormRunsTheSame) {
  const std::string command = script("cat; echo $VMQ_TEST");
  char variable[] = "VMQ_TEST=x";
  char* env[] = {variable, nullptr};
  int rc = -1;
  String out, err;
  EXPECT_TRUE(Util::runCommand(command.c_str(), rc, out, err, false));
  EXPECT_EQ(out, "\n");
  EXPECT_TRUE(Util::runCommand(command.c_str(), rc, out, err, String("in"), true));
  EXPECT_EQ(out, "in\n");
  EXPECT_TRUE(Util::runCommandEnv(command.c_str(), env, rc, out, err, false));
  EXPECT_EQ(out, "x\n");
  EXPECT_TRUE(Util::runCommandEnv(command.c_str(), env, rc, out, err, String("in"), true));
  EXPECT_EQ(out, "inx\n");
  EXPECT_EQ(getenv("VMQ_TEST"), nullptr);
}

TEST_F(CommandRunner, CommandThatCannotStartIsAFailureAndChangesNothing) {
  const TEST_TraceCapture traces;
  const std::string command = directory / "missing";
  EXPECT_EQ(run(command), (Result{false, -1, "old", "old"}));
  EXPECT_THAT(traces.texts(RAS1_ERROR), testing::ElementsAre("Unable to execute command: " + command,
                                                             "Failed to start process for cmd " + command));
}

TEST_F(CommandRunner, BadReturnCodeIsTracedAsAnError) {
  const TEST_TraceCapture traces;
  const std::string command = script("echo out; echo error >&2; exit 3");
  EXPECT_EQ(run(command).rc, 3);
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Command to run is \"" + command + "\""));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "outbuf: out\n"));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "errbuf: error\n"));
  EXPECT_THAT(traces.texts(RAS1_ERROR),
              testing::ElementsAre("Bad return code (3) from command \"" + command + "\"",
                                   "STDOUT [4 characters] is: out\n", "STDERR [6 characters] is: error\n"));
}

TEST_F(CommandRunner, ReturnCodeZeroIsTracedAsADetail) {
  const TEST_TraceCapture traces;
  EXPECT_EQ(run("/bin/echo hello"), success("hello\n"));
  EXPECT_TRUE(traces.texts(RAS1_ERROR).empty());
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Return code (0) from command \"/bin/echo hello\""));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "STDOUT [6 characters] is: hello\n"));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "STDERR [0 characters] is: "));
}

TEST_F(CommandRunner, ChildEndedByASignalGives128AndTheSignal) {
  EXPECT_EQ(run(script("kill -TERM $$")).rc, 143);
}

TEST_F(CommandRunner, ProgramThatCannotBeExecutedGivesStatus0) {
  const TEST_TraceCapture traces;
  EXPECT_EQ(run(directory.path().string()), success(""));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Unable to launch the executable, rc=-1"));
}

TEST_F(CommandRunner, OutputOfManyPiecesArrivesWhole) {
  const TEST_TraceCapture traces;
  const std::string text(100'000, 'x');
  EXPECT_EQ(run("/bin/cat " + directory.writeFile("text", text)), success(text));
  size_t longest = 0, pieces = 0;
  for (const std::string& line : traces.texts(RAS1_DETAIL)) {
    if (line.rfind("outbuf: ", 0) != 0) continue;
    longest = std::max(longest, line.size() - 8);
    ++pieces;
  }
  EXPECT_GE(pieces, 100'000u / 16384 + 1);
  EXPECT_LE(longest, 16384u);
}

TEST_F(CommandRunner, SixtyFourMebibytesArriveWhole) {
  const size_t size = size_t{64} << 20;
  const Result result = run(script("yes 0123456789abcde | head -c 67108864"));
  EXPECT_EQ(result.rc, 0);
  ASSERT_EQ(result.out.size(), size);
  const std::string line = "0123456789abcde\n";
  for (size_t i = 0; i < size; i += line.size()) ASSERT_EQ(result.out.compare(i, line.size(), line), 0) << i;
}

TEST_F(CommandRunner, MuchOnStandardErrorDoesNotBlockASilentStandardOutput) {
  const Result result = run(script("yes error | head -c 1048576 >&2"));
  EXPECT_EQ(result.rc, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err.size(), 1048576u);
}

TEST_F(CommandRunner, InterleavedOutputsAreToldApart) {
  const Result result =
      run(script("i=0\nwhile [ $i -lt 3000 ]; do\n"
                 "  echo out line $i .....................................\n"
                 "  echo err line $i ..................................... >&2\n"
                 "  i=$((i + 1))\ndone"));
  std::string out, err;
  for (int i = 0; i < 3000; ++i) {
    out += "out line " + std::to_string(i) + " .....................................\n";
    err += "err line " + std::to_string(i) + " .....................................\n";
  }
  EXPECT_EQ(result, success(out, err));
}

TEST_F(CommandRunner, LastWordsOfAChildAreNotLost) {
  const std::string text(60'000, 'x');  // less than a pipe holds: the child ends while all of it is still in there
  const std::string command = "/bin/cat " + directory.writeFile("text", text);
  for (int i = 0; i < 50; ++i) ASSERT_EQ(run(command), success(text));
}

TEST_F(CommandRunner, NulBytesPartTheOutputButLoseNothingElse) {
  EXPECT_EQ(run(script("printf 'a\\0b\\0\\0c\\0'")), success("abc"));
}

TEST_F(CommandRunner, BytesThatAreNoTextComeBackAsTheyWere) {
  EXPECT_EQ(run(script("printf '\\377\\200\\351'")), success("\xFF\x80\xE9"));
}

TEST_F(CommandRunner, BackgroundProcessThatKeepsThePipesDoesNotHoldTheRun) {
  for (const bool nonBlocking : {false, true}) {
    const auto before = std::chrono::steady_clock::now();
    const std::string command = script("while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done &\necho started; exit 4");
    EXPECT_EQ(run(command, "", nullptr, nonBlocking), (Result{true, 4, "started\n", ""}));
    EXPECT_LT(std::chrono::steady_clock::now() - before, std::chrono::seconds(30));
  }
  letGo();
}

TEST_F(CommandRunner, BackgroundProcessThatPrintsForEverDoesNotHoldTheRun) {
  // It ends with SIGPIPE, once the runner has closed its ends.
  const Result result = run(script("yes &\nyes error >&2 &\necho started >&2; exit 4"));
  EXPECT_EQ(result.rc, 4);
  EXPECT_THAT(result.err, testing::HasSubstr("started\n"));
}

double processorSeconds() {
  rusage usage;
  getrusage(RUSAGE_THREAD, &usage);
  return static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) +
         static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
}

TEST_F(CommandRunner, WaitingCostsNoProcessorTime) {
  for (const char* body : {"sleep 1", "exec >&- 2>&-; sleep 1", "exec >&-; sleep 1", "exec 2>&-; sleep 1",
                           "while [ ! -e go ] && [ -e $0 ]; do sleep 0.1; done & exec >&- 2>&-; sleep 1"}) {
    const double before = processorSeconds();
    EXPECT_EQ(run(script(body)), success("")) << body;
    EXPECT_LT(processorSeconds() - before, 0.3) << body;
  }
  letGo();
}

TEST_F(CommandRunner, RunsInSeveralThreadsAtOnce) {
  const std::string command = script("read line; echo \"out $line\"; echo \"err $line\" >&2; exit 5");
  run(command);  // the first conversion of text belongs to one thread
  std::vector<std::thread> threads;
  for (int thread = 0; thread < 8; ++thread) {
    threads.emplace_back([&command, thread] {
      for (int i = 0; i < 20; ++i) {
        const std::string text = std::to_string(thread) + "." + std::to_string(i);
        EXPECT_EQ(run(command, text + "\n"), (Result{true, 5, "out " + text + "\n", "err " + text + "\n"}));
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
}

// An agent's control script leaves an agent behind, so it is not read while it runs.

TEST_F(CommandRunner, AgentCommandGivesOnlyWhatIsLeftInThePipes) {
  const Result result = run(agentScript("yes out | head -c 40000; yes error | head -c 30000 >&2; exit 6"));
  EXPECT_EQ(result.rc, 6);
  EXPECT_EQ(result.out.size(), 16384u);
  EXPECT_EQ(result.err.size(), 16384u);
}

TEST_F(CommandRunner, AgentCommandIsOneWhoseTextContainsTheNameAnywhere) {
  const std::string command = script("yes | head -c 20000");
  EXPECT_EQ(run(command).out.size(), 20'000u);
  EXPECT_EQ(run(command + " xCorvelAgentx").out.size(), 16384u);
  EXPECT_EQ(run(command + " corvelagent").out.size(), 20'000u);
}

TEST_F(CommandRunner, AgentLeftBehindDoesNotHoldTheRun) {
  EXPECT_EQ(run(agentScript("while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done &\necho started")),
            success("started\n"));
  letGo();
}

// Failures of the system while a command runs.

TEST_F(CommandRunner, FailedPollEndsTheReadingButNotTheRun) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kPoll, ENOMEM);
  const Result result = run(script("sleep 0.1; echo late; exit 3"));
  EXPECT_EQ(result, (Result{true, 3, "late\n", ""}));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:12 Cannot allocate memory"));
}

TEST_F(CommandRunner, InterruptedPollIsRepeated) {
  const SystemFault fault(SystemCall::kPoll, EINTR, 1, 2);
  EXPECT_EQ(run(script("sleep 0.1; echo late")), success("late\n"));
  EXPECT_TRUE(fault.happened());
}

TEST_F(CommandRunner, FailedReadIsTheEndOfThatStream) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kRead, EIO);
  const Result result = run(script("echo out; echo err >&2; exit 3"));
  EXPECT_EQ(result, (Result{true, 3, "", "err\n"}));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:5 Input/output error"));
}

TEST_F(CommandRunner, StreamThatMightBlockIsNotRead) {
  const SystemFault fault(SystemCall::kFcntl, EBADF);
  EXPECT_EQ(run(script("echo out; echo err >&2; exit 3")), (Result{true, 3, "", "err\n"}));
}

}  // namespace
