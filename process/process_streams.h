#pragma once
// The caller's ends of a child's standard input, output and error.

#include <sys/types.h>

#include <cstddef>

namespace VMQ {

/// What both kinds of stream share: one pipe end, not buffered. The destructor does not close it; close() does.
/// Belongs to one thread at a time.
class ProcessStream {
 public:
  ProcessStream(const ProcessStream&) = delete;
  ProcessStream& operator=(const ProcessStream&) = delete;

  /// The pipe end, or -1 before the child was started and after close().
  [[nodiscard]] int descriptor() const { return descriptor_; }
  /// Takes a pipe end. REQUIRES: none is open here.
  void attach(int descriptor) { descriptor_ = descriptor; }
  /// Makes every later read or write return at once (EAGAIN instead of waiting). The child's end is not affected.
  /// False, with a trace, when the descriptor does not allow it.
  bool setNonBlocking();  // NOLINT(readability-make-member-function-const): the stream is another one then
  /// Closes the pipe end; a second call does nothing.
  void close();

 protected:
  ProcessStream() = default;
  ~ProcessStream() = default;

 private:
  int descriptor_ = -1;
};

/// Reads what the child writes.
class ProcessInputStream : public ProcessStream {
 public:
  /// Up to `length` bytes. Returns how many, 0 at the end, or -1 with `errno`. Repeated when a signal interrupts it.
  ssize_t read(void* buffer, size_t length);
  /// One byte (0 to 255), or -1 at the end or on failure.
  int read();
};

/// Writes what the child reads.
class ProcessOutputStream : public ProcessStream {
 public:
  /// Up to `length` bytes. Returns how many, or -1 with `errno`; EPIPE when nobody reads any more, without the signal
  /// SIGPIPE ever reaching the process. Repeated when a signal interrupts it.
  ssize_t write(const void* buffer, size_t length);
};

}  // namespace VMQ
