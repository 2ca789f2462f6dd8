#include "process/output_collector.h"

#include <cerrno>
#include <cstring>

#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/output_collector"};

constexpr int kReadsPerDrain = 64;  // 1 MiB, the most that an ordinary user's pipe can hold

}  // namespace

OutputCollector::OutputCollector(ProcessInputStream& stream, String& text, const char* name)
    : stream_(stream), text_(text), name_(name), buffer_(new char[kReadBytes + 1]) {
  const Trace trace(traceUnit);
  // A read that might wait for ever is worse than none.
  ended_ = !stream_.setNonBlocking();  // NOLINT(cppcoreguidelines-prefer-member-initializer): within the trace
}

bool OutputCollector::readOnce() {
  const Trace trace(traceUnit);
  if (ended_) return false;
  const ssize_t count = stream_.read(buffer_.get(), kReadBytes);
  if (count > 0) {
    append(static_cast<size_t>(count));
    return true;
  }
  const int error = errno;
  if (count < 0 && error == EAGAIN) return false;
  if (count < 0) TRACE_ERRNO(trace, error);
  ended_ = true;
  return false;
}

bool OutputCollector::drain() {
  const Trace trace(traceUnit);
  int reads = 0;
  while (reads < kReadsPerDrain && readOnce()) ++reads;
  return reads > 0;
}

void OutputCollector::append(size_t byteCount) {
  const Trace trace(traceUnit);
  char* const end = buffer_.get() + byteCount;
  *end = '\0';
  // Text ends at a NUL, so one among the output parts it into pieces; only the NUL itself is dropped.
  for (char* piece = buffer_.get(); piece < end; piece += strlen(piece) + 1) {
    if (*piece == '\0') continue;
    TRACE_DETAIL(trace, "%s: %s", name_, piece);
    text_.append(String(piece));
  }
}

}  // namespace VMQ
