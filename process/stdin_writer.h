#pragma once
// The text for a child's standard input, written as the child takes it.

#include <cstddef>
#include <string>

#include "process/process_streams.h"

namespace VMQ {

/// Writes a text to a child without ever waiting for it, and closes the stream behind it. Belongs to one thread.
class StdinWriter {
 public:
  /// An empty text closes the stream at once. The stream outlives this object.
  StdinWriter(ProcessOutputStream& stream, std::string text);

  /// Writes what fits into the pipe now. Closes the stream when all is written, or when the child does not read any
  /// more.
  void write();
  /// Gives up what is left.
  void close();

  /// True while text remains.
  [[nodiscard]] bool pending() const { return stream_.descriptor() >= 0; }
  [[nodiscard]] int descriptor() const { return stream_.descriptor(); }

 private:
  ProcessOutputStream& stream_;
  const std::string text_;
  size_t written_ = 0;
};

}  // namespace VMQ
