#include "tests/e2e/shell.h"

#include <gtest/gtest.h>
#include <sys/wait.h>

#include <array>
#include <cstdio>

Outcome runShell(const std::string& command) {
  // The braces make one command of it, so that the redirection holds for all of a list.
  FILE* pipe = popen(("{ " + command + "\n} 2>&1").c_str(), "re");
  if (pipe == nullptr) {
    ADD_FAILURE() << "no shell for: " << command;
    return {};
  }
  Outcome outcome;
  std::array<char, 4096> buffer{};
  for (size_t count; (count = fread(buffer.data(), 1, buffer.size(), pipe)) > 0;)
    outcome.output.append(buffer.data(), count);
  const int status = pclose(pipe);
  outcome.exit_code = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  return outcome;
}

std::string quoted(const std::string& text) {
  std::string result = "'";
  for (const char c : text) result += c == '\'' ? std::string("'\\''") : std::string(1, c);
  return result + "'";
}
