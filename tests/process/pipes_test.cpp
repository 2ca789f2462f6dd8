#include "process/pipes.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <unistd.h>

#include <cerrno>
#include <string>

#include "test_seam.h"
#include "tests/process/closed_standard_descriptors.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/system_faults.h"

namespace {

using testing::ElementsAre;
using VMQ::Pipe;

struct ThreePipes {
  Pipe in, out, err;
  bool create() { return VMQ::createPipes(in, out, err); }
};

void expectInheritedByNobodyAndAboveTwo(const ThreePipes& pipes) {
  for (const Pipe* pipe : {&pipes.in, &pipes.out, &pipes.err}) {
    for (const int end : {pipe->readEnd.get(), pipe->writeEnd.get()}) {
      EXPECT_GT(end, STDERR_FILENO);
      EXPECT_EQ(fcntl(end, F_GETFD), FD_CLOEXEC);
    }
  }
}

TEST(CreatePipes, WhatIsWrittenComesOutAtTheOtherEnd) {
  const NothingLeftBehind check;
  ThreePipes pipes;
  ASSERT_TRUE(pipes.create());
  for (const Pipe* pipe : {&pipes.in, &pipes.out, &pipes.err}) {
    char byte = 0;
    EXPECT_EQ(write(pipe->writeEnd.get(), "x", 1), 1);
    EXPECT_EQ(read(pipe->readEnd.get(), &byte, 1), 1);
    EXPECT_EQ(byte, 'x');
  }
}

TEST(CreatePipes, EndsAreCloseOnExecAndAboveTheStandardDescriptors) {
  const NothingLeftBehind check;
  ThreePipes pipes;
  ASSERT_TRUE(pipes.create());
  expectInheritedByNobodyAndAboveTwo(pipes);
}

TEST(CreatePipes, EndsAreAboveTheStandardDescriptorsOfAHostThatHasNone) {
  const NothingLeftBehind check;
  ThreePipes pipes;
  {
    const ClosedStandardDescriptors closed;
    ASSERT_TRUE(pipes.create());
  }
  expectInheritedByNobodyAndAboveTwo(pipes);
}

TEST(CreatePipes, FailureIsNamedAndLeavesNothingOpen) {
  const std::pair<int, const char*> cases[] = {
      {1, "failed to create stdout pipe"}, {2, "failed to create stderr pipe"}, {3, "failed to create stdin pipe"}};
  for (const auto& [nth, text] : cases) {
    const NothingLeftBehind check;
    const TEST_TraceCapture traces;
    const SystemFault fault(SystemCall::kPipe2, EMFILE, nth);
    ThreePipes pipes;
    EXPECT_FALSE(pipes.create());
    EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAre(text, "Error occurred. ERRNO:24 Too many open files"));
  }
}

TEST(CreatePipes, EndThatCannotBeMovedAboveTheStandardDescriptorsIsAFailure) {
  for (const int nth : {1, 2}) {
    const NothingLeftBehind check;
    const TEST_TraceCapture traces;
    ThreePipes pipes;
    bool created = true;
    {
      const ClosedStandardDescriptors closed;
      const SystemFault fault(SystemCall::kFcntl, EMFILE, nth);
      created = pipes.create();
    }
    EXPECT_FALSE(created);
    EXPECT_TRUE(traces.has(RAS1_ERROR, "failed to create stdout pipe"));
  }
}

}  // namespace
