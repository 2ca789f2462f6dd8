// The text for a command's standard input.
#include <gmock/gmock.h>
#include <signal.h>

#include <clocale>
#include <string>

#include "test_seam.h"
#include "tests/process/command_fixture.h"
#include "tests/support/system_faults.h"

namespace {

using CommandInput = CommandFixture;

const std::string& megabyte = *new std::string([] {
  std::string text;
  for (int i = 0; text.size() < (1 << 20); ++i) text += std::to_string(i) + "\n";
  return text;
}());

TEST_F(CommandInput, EmptyTextIsTheEndOfInputAtOnce) {
  EXPECT_EQ(run("/bin/cat"), success(""));
}

TEST_F(CommandInput, TextArrivesExactly) {
  for (const std::string text : {"a", "a\n", " a b \n\n", "a\tb\r\n"}) {
    EXPECT_EQ(run("/bin/cat", text), success(text));
  }
}

TEST_F(CommandInput, LongTextGoesInWhileItComesOut) {
  EXPECT_EQ(run("/bin/cat", megabyte), success(megabyte));
}

TEST_F(CommandInput, CharactersOfSeveralBytesArriveWhole) {
  const std::string before = setlocale(LC_CTYPE, nullptr);
  ASSERT_NE(setlocale(LC_CTYPE, "C.UTF-8"), nullptr);
  ASSERT_TRUE(VMQ::String::initialize());
  std::string text;
  for (int i = 0; i < 1000; ++i) text += "\xC3\xA9\xE2\x82\xAC";
  EXPECT_EQ(run("/bin/cat", text), success(text));
  setlocale(LC_CTYPE, before.c_str());
  VMQ::String::initialize();
}

TEST_F(CommandInput, ChildThatDoesNotReadIsNoFailure) {
  struct sigaction byDefault {
  }, before, after;
  byDefault.sa_handler = SIG_DFL;  // a SIGPIPE would end the test
  sigaction(SIGPIPE, &byDefault, &before);
  EXPECT_EQ(run(script("echo out; exit 3"), megabyte), (Result{true, 3, "out\n", ""}));
  EXPECT_EQ(run(script("exec <&-; sleep 0.1; echo out; exit 3"), megabyte), (Result{true, 3, "out\n", ""}));
  sigaction(SIGPIPE, &before, &after);
  EXPECT_EQ(after.sa_handler, SIG_DFL);
}

TEST_F(CommandInput, ChildThatReadsOnlyABitIsNoFailure) {
  EXPECT_EQ(run(script("read line; echo $line"), megabyte), success("0\n"));
}

TEST_F(CommandInput, ChildThatClosesItsOutputsStillGetsItsInput) {
  EXPECT_EQ(run(script("exec >copy 2>&1; sleep 0.1; cat"), megabyte), success(""));
  EXPECT_EQ(readWholeFile(directory / "copy"), megabyte);
}

TEST_F(CommandInput, BackgroundProcessThatHoldsTheInputDoesNotHoldTheRun) {
  const std::string command = script("while [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done <&0 &\necho started");
  EXPECT_EQ(run(command, megabyte), success("started\n"));
  letGo();
}

TEST_F(CommandInput, AgentCommandGetsItsInputToo) {
  EXPECT_EQ(run(agentScript("cat >copy; echo done"), megabyte), success("done\n"));
  EXPECT_EQ(readWholeFile(directory / "copy"), megabyte);
}

TEST_F(CommandInput, AgentCommandThatDoesNotReadIsNoFailure) {
  EXPECT_EQ(run(agentScript("echo out; exit 3"), megabyte), (Result{true, 3, "out\n", ""}));
}

TEST_F(CommandInput, FailedWriteIsTracedAndEndsTheWriting) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kWrite, EIO);
  EXPECT_EQ(run("/bin/cat", "text"), success(""));
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:5 Input/output error"));
}

TEST_F(CommandInput, InputThatMightBlockIsNotWritten) {
  const SystemFault fault(SystemCall::kFcntl, EBADF);  // of the stream that is set up first
  EXPECT_EQ(run("/bin/cat", "text"), success(""));
}

}  // namespace
