#include "tests/host/trace_log.h"

#include <gtest/gtest.h>

#include <sstream>

std::optional<std::string> configureTrace() {
  char error[512] = "";
  if (RAS1_Configure(error, sizeof error)) return std::nullopt;
  return error;
}

std::vector<std::string> splitLines(const std::string& text) {
  EXPECT_TRUE(text.empty() || text.back() == '\n') << "the last line has no end";
  std::vector<std::string> lines;
  std::istringstream stream(text);
  for (std::string line; std::getline(stream, line);) lines.push_back(line);
  return lines;
}

TraceLog::TraceLog(const std::string& levels) : levels_("KBB_RAS1", levels), log_("KBB_RAS1_LOG", path()) {
  EXPECT_EQ(configureTrace(), std::nullopt);
}

TraceLog::~TraceLog() {
  levels_.put(std::nullopt);
  log_.put(std::nullopt);
  EXPECT_EQ(configureTrace(), std::nullopt);
}

std::vector<std::string> TraceLog::lines() const {
  return splitLines(readWholeFile(path()));
}

std::vector<std::string> TraceLog::messages() const {
  std::vector<std::string> messages;
  for (const std::string& line : lines()) messages.push_back(line.substr(line.find(": ") + 2));
  return messages;
}
