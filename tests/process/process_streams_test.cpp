#include "process/process_streams.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <signal.h>
#include <unistd.h>

#include <cerrno>

#include "process/pipes.h"
#include "test_seam.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/system_faults.h"

namespace {

using VMQ::Pipe;
using VMQ::ProcessInputStream;
using VMQ::ProcessOutputStream;

/// A pipe with a stream at each end.
class ProcessStreams : public testing::Test {
 protected:
  ProcessStreams() {
    Pipe other, another;
    Pipe pipe;
    EXPECT_TRUE(VMQ::createPipes(other, pipe, another));
    in.attach(pipe.readEnd.release());
    out.attach(pipe.writeEnd.release());
  }
  ~ProcessStreams() override {
    in.close();
    out.close();
  }

  const NothingLeftBehind check;
  ProcessInputStream in;
  ProcessOutputStream out;
};

TEST_F(ProcessStreams, ReadWhatWasWritten) {
  EXPECT_EQ(out.write("abc", 3), 3);
  char buffer[10] = {};
  EXPECT_EQ(in.read(buffer, 2), 2);
  EXPECT_STREQ(buffer, "ab");
  EXPECT_EQ(in.read(), 'c');
}

TEST_F(ProcessStreams, SingleBytesAreNotSignExtended) {
  EXPECT_EQ(out.write("\xFF", 1), 1);
  EXPECT_EQ(in.read(), 0xFF);
}

TEST_F(ProcessStreams, EndAfterTheWriterHasClosed) {
  out.close();
  char buffer[10];
  EXPECT_EQ(in.read(buffer, sizeof buffer), 0);
  EXPECT_EQ(in.read(), -1);
}

TEST_F(ProcessStreams, NonBlockingReadOfAnEmptyPipeReturnsAtOnce) {
  ASSERT_TRUE(in.setNonBlocking());
  char buffer[10];
  EXPECT_EQ(in.read(buffer, sizeof buffer), -1);
  EXPECT_EQ(errno, EAGAIN);
}

TEST_F(ProcessStreams, ErrnoSurvivesTracing) {
  const TEST_TraceCapture traces;
  ASSERT_TRUE(in.setNonBlocking());
  char buffer[10];
  errno = 0;
  EXPECT_EQ(in.read(buffer, sizeof buffer), -1);
  EXPECT_EQ(errno, EAGAIN);
}

TEST_F(ProcessStreams, NonBlockingIsTracedWhenItFails) {
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kFcntl, EBADF);
  EXPECT_FALSE(in.setNonBlocking());
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:9 Bad file descriptor"));
}

TEST_F(ProcessStreams, ReadAndWriteAreRepeatedAfterASignal) {
  const SystemFault interruptedWrite(SystemCall::kWrite, EINTR);
  EXPECT_EQ(out.write("a", 1), 1);
  EXPECT_TRUE(interruptedWrite.happened());
  const SystemFault interruptedRead(SystemCall::kRead, EINTR);
  EXPECT_EQ(in.read(), 'a');
  EXPECT_TRUE(interruptedRead.happened());
}

TEST_F(ProcessStreams, ClosingTwiceClosesOnce) {
  const int descriptor = in.descriptor();
  in.close();
  EXPECT_EQ(in.descriptor(), -1);
  const int reused = dup(out.descriptor());
  EXPECT_EQ(reused, descriptor);
  in.close();
  EXPECT_EQ(fcntl(reused, F_GETFD), 0) << "the second close hit somebody else's descriptor";
  close(reused);
}

TEST_F(ProcessStreams, DestroyingAStreamDoesNotCloseIt) {
  int descriptor = -1;
  {
    ProcessInputStream temporary;
    descriptor = dup(in.descriptor());
    temporary.attach(descriptor);
  }
  EXPECT_EQ(close(descriptor), 0);
}

TEST(UnattachedStreams, HaveNoDescriptor) {
  EXPECT_EQ(ProcessInputStream().descriptor(), -1);
  EXPECT_EQ(ProcessOutputStream().descriptor(), -1);
}

/// The handling of SIGPIPE as it is by default, which ends the process, and the pending and blocked signals.
class WriteWithoutReader : public ProcessStreams {
 protected:
  WriteWithoutReader() {
    struct sigaction byDefault {};
    byDefault.sa_handler = SIG_DFL;
    sigaction(SIGPIPE, &byDefault, &before_);
    in.close();
  }
  ~WriteWithoutReader() override { sigaction(SIGPIPE, &before_, nullptr); }

  static bool isPending() {
    sigset_t pending;
    sigpending(&pending);
    return sigismember(&pending, SIGPIPE) == 1;
  }
  static bool isBlocked() {
    sigset_t blocked;
    pthread_sigmask(SIG_BLOCK, nullptr, &blocked);
    return sigismember(&blocked, SIGPIPE) == 1;
  }

 private:
  struct sigaction before_;
};

TEST_F(WriteWithoutReader, FailsWithoutASignal) {
  EXPECT_EQ(out.write("a", 1), -1);
  EXPECT_EQ(errno, EPIPE);
  EXPECT_FALSE(isPending());
  EXPECT_FALSE(isBlocked());
  struct sigaction now;
  sigaction(SIGPIPE, nullptr, &now);
  EXPECT_EQ(now.sa_handler, SIG_DFL);
}

TEST_F(WriteWithoutReader, LeavesASignalThatWasPendingBefore) {
  sigset_t pipe;
  sigemptyset(&pipe);
  sigaddset(&pipe, SIGPIPE);
  pthread_sigmask(SIG_BLOCK, &pipe, nullptr);
  raise(SIGPIPE);
  EXPECT_EQ(out.write("a", 1), -1);
  EXPECT_EQ(errno, EPIPE);
  EXPECT_TRUE(isPending());
  EXPECT_TRUE(isBlocked());
  const timespec atOnce{};
  EXPECT_EQ(sigtimedwait(&pipe, nullptr, &atOnce), SIGPIPE);
  pthread_sigmask(SIG_UNBLOCK, &pipe, nullptr);
}

}  // namespace
