#pragma once
// The trace of this process, sent to a file of the test's own.

#include <optional>
#include <string>
#include <vector>

#include "ras1.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"

class TraceLog {
 public:
  /// Configures the trace with these levels and a log in a folder of its own.
  explicit TraceLog(const std::string& levels);
  /// Back to what the environment says.
  ~TraceLog();
  TraceLog(const TraceLog&) = delete;
  TraceLog& operator=(const TraceLog&) = delete;

  [[nodiscard]] std::string path() const { return folder_ / "trace.log"; }
  /// The lines written so far, without their line feeds. Fails the test when the last one has none.
  [[nodiscard]] std::vector<std::string> lines() const;
  /// What follows "function: " in each line.
  [[nodiscard]] std::vector<std::string> messages() const;

 private:
  const TemporaryDirectory folder_;
  const ScopedVariable levels_;
  const ScopedVariable log_;
};

/// Calls RAS1_Configure. Returns its message, or nothing when it succeeded.
std::optional<std::string> configureTrace();

/// Splits a text after each line feed. Fails the test when the last line has none.
std::vector<std::string> splitLines(const std::string& text);
