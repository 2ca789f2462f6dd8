#pragma once
// Where trace lines go.

#include <cstddef>
#include <string>

namespace vmqhost {

/// A log that is open but not yet in use.
class OpenedLog {
 public:
  OpenedLog() = default;
  ~OpenedLog();
  OpenedLog(const OpenedLog&) = delete;
  OpenedLog& operator=(const OpenedLog&) = delete;

  /// Opens the file for appending; an empty name stands for standard error. False, with the reason in `error`, when it
  /// cannot be opened.
  bool open(const std::string& path, std::string& error);

  /// From now on lines go here. REQUIRES: opened; one thread at a time.
  void use();

 private:
  int descriptor_ = -1;  // -1: standard error
};

/// Writes a whole line. Takes no lock and leaves errno undefined; safe between fork and exec.
void writeToLog(const char* line, size_t length);

}  // namespace vmqhost
