#pragma once
// What a child prints on one of its streams, gathered into a text.

#include <cstddef>
#include <memory>

#include "process/process_streams.h"
#include "util/string.h"

namespace VMQ {

/// Reads one stream of a child and never waits for it. Belongs to one thread.
class OutputCollector {
 public:
  /// One read takes at most this many bytes.
  static constexpr size_t kReadBytes = 16384;

  /// Appends to `text`; `name` begins the trace line of each piece ("outbuf"). All three outlive this object.
  OutputCollector(ProcessInputStream& stream, String& text, const char* name);

  /// Takes one piece. False when there was nothing to take.
  bool readOnce();
  /// Takes pieces until there is nothing to take for now, but not for ever: a child that prints without a pause must
  /// not keep the other stream and the time-out waiting. True when there was something.
  bool drain();

  /// True once the child, and whoever else had the stream open, has closed it.
  [[nodiscard]] bool ended() const { return ended_; }
  [[nodiscard]] int descriptor() const { return stream_.descriptor(); }

 private:
  void append(size_t byteCount);

  ProcessInputStream& stream_;
  String& text_;
  const char* const name_;
  std::unique_ptr<char[]> buffer_;
  bool ended_ = false;
};

}  // namespace VMQ
