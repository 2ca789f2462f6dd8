#pragma once
// The daemon's own log: lines on standard error for the operator and the journal. What the component does is traced,
// not logged.

#include <string>

namespace vmqd {

/// Writes "vmqd: TEXT" as one line in one write, so lines of several threads never mix; control characters in the text
/// become "?". Any thread.
void logLine(const std::string& text);
void logWarning(const std::string& text);  ///< "vmqd: warning: TEXT"
void logError(const std::string& text);    ///< "vmqd: error: TEXT"

/// "TEXT: reason", with the system's reason for an errno value.
std::string withReason(const std::string& text, int error);

}  // namespace vmqd
