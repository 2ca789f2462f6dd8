// The daemon's own log.

#include "apps/vmqd/log.h"

#include <unistd.h>

#include <system_error>

namespace vmqd {
namespace {

void writeLine(const char* level, const std::string& text) {
  std::string line = std::string("vmqd: ") + level;
  for (const char c : text) line += static_cast<unsigned char>(c) < 0x20 || c == 0x7F ? '?' : c;
  line += '\n';
  (void)!write(STDERR_FILENO, line.data(), line.size());  // there is nowhere left to say that it failed
}

}  // namespace

void logLine(const std::string& text) {
  writeLine("", text);
}

void logWarning(const std::string& text) {
  writeLine("warning: ", text);
}

void logError(const std::string& text) {
  writeLine("error: ", text);
}

std::string withReason(const std::string& text, int error) {
  return text + ": " + std::generic_category().message(error);
}

}  // namespace vmqd
