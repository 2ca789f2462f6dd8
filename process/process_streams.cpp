#include "process/process_streams.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <utility>

#include "process/signal_guards.h"
#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/process_streams"};

}  // namespace

bool ProcessStream::setNonBlocking() {  // NOLINT(readability-make-member-function-const): see its declaration
  const Trace trace(traceUnit);
  const int flags = fcntl(descriptor_, F_GETFL);
  if (flags >= 0 && fcntl(descriptor_, F_SETFL, flags | O_NONBLOCK) == 0) return true;
  const int error = errno;
  TRACE_ERRNO(trace, error);
  return false;
}

void ProcessStream::close() {
  const Trace trace(traceUnit);
  const int descriptor = std::exchange(descriptor_, -1);
  // A pipe end has nothing left to write back, and its number is free whatever close says.
  if (descriptor >= 0) (void)::close(descriptor);
}

ssize_t ProcessInputStream::read(void* buffer, size_t length) {
  const Trace trace(traceUnit);
  ssize_t count;
  do {
    count = ::read(descriptor(), buffer, length);
  } while (count < 0 && errno == EINTR);
  return count;
}

int ProcessInputStream::read() {
  const Trace trace(traceUnit);
  unsigned char byte;
  return read(&byte, 1) == 1 ? byte : -1;
}

ssize_t ProcessOutputStream::write(const void* buffer, size_t length) {
  const Trace trace(traceUnit);
  const SigpipeSuppressed suppressed;
  ssize_t count;
  do {
    count = ::write(descriptor(), buffer, length);
  } while (count < 0 && errno == EINTR);
  return count;
}

}  // namespace VMQ
