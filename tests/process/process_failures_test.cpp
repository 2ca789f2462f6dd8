// A start that the system refuses: told, and nothing left behind.
#include <gmock/gmock.h>

#include <cerrno>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/process/child_fixture.h"
#include "tests/support/system_faults.h"

namespace {

using testing::ElementsAreArray;
using VMQ::Process;

using ProcessFailures = ChildFixture;

struct Case {
  const char* situation;
  SystemCall call;
  int error;
  int nth;
  std::vector<std::string> lines;  ///< traced before the line that every refused start ends with
};

TEST_F(ProcessFailures, RefusedStartIsToldAndLeavesNothingBehind) {
  const std::string noDescriptor = "Error occurred. ERRNO:24 Too many open files";
  const std::string noMemory = "Error occurred. ERRNO:12 Cannot allocate memory";
  const std::string tryAgain = "Error occurred. ERRNO:11 Resource temporarily unavailable";
  const Case cases[] = {
      {"mutex", SystemCall::kPthreadMutexInit, ENOMEM, 1, {"Error initializing mutex: 12"}},
      {"condition", SystemCall::kPthreadCondInit, ENOMEM, 1, {"Error initializing condition: 12"}},
      {"completion", SystemCall::kEventfd, EMFILE, 1, {"failed to create completion event", noDescriptor}},
      {"stdout", SystemCall::kPipe2, EMFILE, 1, {"failed to create stdout pipe", noDescriptor}},
      {"stderr", SystemCall::kPipe2, EMFILE, 2, {"failed to create stderr pipe", noDescriptor}},
      {"stdin", SystemCall::kPipe2, EMFILE, 3, {"failed to create stdin pipe", noDescriptor}},
      {"stack", SystemCall::kMmap, ENOMEM, 1, {"failed to fork child process", noMemory}},
      {"child", SystemCall::kClone, EAGAIN, 1, {"failed to fork child process", tryAgain}},
      {"waiter", SystemCall::kPthreadCreate, EAGAIN, 1, {"Error creating thread to wait on process", tryAgain}},
  };
  const std::string command = scriptThatWaits();
  for (const Case& c : cases) {
    SCOPED_TRACE(c.situation);
    const NothingLeftBehind nothing;
    const TEST_TraceCapture traces;
    const SystemFault fault(c.call, c.error, c.nth);
    Process process(command.c_str());
    EXPECT_FALSE(process.start());
    EXPECT_TRUE(fault.happened());
    EXPECT_FALSE(process.running());
    EXPECT_EQ(process.getStdOut()->descriptor(), -1);
    std::vector<std::string> expected = c.lines;
    expected.push_back("Unable to execute command: " + command);
    EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAreArray(expected));
  }
}

TEST_F(ProcessFailures, ChildThatNothingCouldWaitForIsReapedInSpiteOfAnInterruption) {
  const SystemFault noWaiter(SystemCall::kPthreadCreate, EAGAIN);
  const SystemFault interrupted(SystemCall::kWaitpid, EINTR);
  Process process(scriptThatWaits().c_str());
  EXPECT_FALSE(process.start());
  EXPECT_TRUE(interrupted.happened());
  EXPECT_EQ(ProcessResources::now().children, 0u);
}

TEST_F(ProcessFailures, RefusedStartCanBeTriedAgain) {
  Process process("/bin/true");
  {
    const SystemFault fault(SystemCall::kClone, EAGAIN);
    EXPECT_FALSE(process.start());
  }
  EXPECT_TRUE(process.start());
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_EQ(rc, 0);
}

TEST_F(ProcessFailures, StandardDescriptorThatCannotBeSetIsToldAndTheProgramRuns) {
  const std::pair<int, const char*> cases[] = {
      {1, "error on dup2 for stdout"}, {2, "error on dup2 for stderr"}, {3, "error on dup2 for stdin"}};
  for (const auto& [nth, line] : cases) {
    const TEST_TraceCapture traces;
    const SystemFault fault(SystemCall::kDup3, EBADF, nth);
    Process process(script("exit 3").c_str());
    ASSERT_TRUE(process.start());
    process.getStdIn()->close();
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
    EXPECT_EQ(rc, 3);
    EXPECT_TRUE(traces.has(RAS1_ERROR, line)) << line;
  }
}

TEST_F(ProcessFailures, InterruptedDuplicationIsRepeated) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kDup3, EINTR, 1, 2);
  EXPECT_EQ(outputOf("/bin/echo hello"), "hello\n");
  EXPECT_TRUE(traces.texts(RAS1_ERROR).empty());
}

}  // namespace
