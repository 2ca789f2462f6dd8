#include "process/stdin_writer.h"

#include <cerrno>
#include <utility>

#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/stdin_writer"};

}  // namespace

StdinWriter::StdinWriter(ProcessOutputStream& stream, std::string text) : stream_(stream), text_(std::move(text)) {
  const Trace trace(traceUnit);
  if (text_.empty() || !stream_.setNonBlocking()) stream_.close();
}

void StdinWriter::write() {
  const Trace trace(traceUnit);
  if (!pending()) return;
  const ssize_t count = stream_.write(text_.data() + written_, text_.size() - written_);
  if (count >= 0) {
    written_ += static_cast<size_t>(count);
    if (written_ == text_.size()) stream_.close();
    return;
  }
  const int error = errno;
  if (error == EAGAIN) return;
  if (error != EPIPE) TRACE_ERRNO(trace, error);  // a child need not read what it is given
  stream_.close();
}

void StdinWriter::close() {
  const Trace trace(traceUnit);
  stream_.close();
}

}  // namespace VMQ
