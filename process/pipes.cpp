#include "process/pipes.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>

#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/pipes"};

/// Four times the usual: a child that prints much stops less often to be read.
constexpr int kStdoutPipeBytes = 1 << 18;

bool createPipe(Pipe& pipe) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) return false;
  Pipe raw{Descriptor(ends[0]), Descriptor(ends[1])};
  pipe.readEnd = moveAboveStandard(std::move(raw.readEnd));
  if (!pipe.readEnd.isOpen()) return false;
  pipe.writeEnd = moveAboveStandard(std::move(raw.writeEnd));
  return pipe.writeEnd.isOpen();
}

}  // namespace

Descriptor moveAboveStandard(Descriptor descriptor) {
  if (!descriptor.isOpen() || descriptor.get() > STDERR_FILENO) return descriptor;
  Descriptor moved(fcntl(descriptor.get(), F_DUPFD_CLOEXEC, STDERR_FILENO + 1));
  const int error = errno;
  descriptor.reset();
  errno = error;
  return moved;
}

bool createPipes(Pipe& stdinPipe, Pipe& stdoutPipe, Pipe& stderrPipe) {
  const Trace trace(traceUnit);
  const struct {
    Pipe& pipe;
    const char* name;
  } wanted[] = {{stdoutPipe, "stdout"}, {stderrPipe, "stderr"}, {stdinPipe, "stdin"}};
  for (const auto& [pipe, name] : wanted) {
    if (createPipe(pipe)) continue;
    const int error = errno;
    TRACE_ERROR(trace, "failed to create %s pipe", name);
    TRACE_ERRNO(trace, error);
    return false;
  }
  (void)fcntl(stdoutPipe.readEnd.get(), F_SETPIPE_SZ, kStdoutPipeBytes);  // refused to those who have too many
  return true;
}

}  // namespace VMQ
