#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/stat.h>

#include <ctime>
#include <filesystem>
#include <optional>
#include <string>

#include "bss1.h"
#include "process/spawn.h"
#include "test_seam.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"
#include "util/util.h"

namespace {

namespace fs = std::filesystem;

/// An installation with a logs directory, and a host that traces.
class ChildTrace : public testing::Test {
 protected:
  ChildTrace() {
    fs::create_directory(home / "logs");
    VMQ::Util::TEST_forgetDirectories();
  }
  ~ChildTrace() override { VMQ::Util::TEST_forgetDirectories(); }

  /// Older logs of children, the first the oldest.
  void writeLogs(int count) {
    for (int i = 0; i < count; ++i) {
      const std::string log = home.writeFile("logs/vmqproc_ras1_" + std::to_string(1000 + i) + ".log", "");
      const timespec times[2] = {{1000 + i, 0}, {1000 + i, 0}};
      ASSERT_EQ(utimensat(AT_FDCWD, log.c_str(), times, 0), 0);
    }
  }
  int logCount() {
    int count = 0;
    for ([[maybe_unused]] const auto& entry : fs::directory_iterator(home / "logs")) ++count;
    return count;
  }

  const TemporaryDirectory home;
  const ScopedVariable homeVariable{"CORVELHOME", home.path().string()};
  const ScopedVariable levels{"KBB_RAS1", "error"};
};

TEST_F(ChildTrace, GoesToALogNamedByTheSecondInTheLogsDirectory) {
  const TEST_TraceCapture traces;
  const int64_t before = BSS1_GetTime();
  const std::string setting = VMQ::childTraceSetting();
  const int64_t after = BSS1_GetTime();

  const std::string beginning = "KBB_RAS1_LOG=" + home.path().string() + "/logs/vmqproc_ras1_";
  const std::string end = ".log";
  ASSERT_THAT(setting, testing::StartsWith(beginning));
  ASSERT_THAT(setting, testing::EndsWith(end));
  const std::string digits = setting.substr(beginning.size(), setting.size() - beginning.size() - end.size());
  EXPECT_THAT(digits, testing::MatchesRegex("[0-9]+"));
  EXPECT_GE(std::stoll(digits), before);
  EXPECT_LE(std::stoll(digits), after);
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Sending child process RAS1 tracing to " + setting.substr(13)));
}

TEST_F(ChildTrace, OldestOfTenLogsIsDeleted) {
  writeLogs(10);
  VMQ::childTraceSetting();
  EXPECT_EQ(logCount(), 9);
  EXPECT_FALSE(fs::exists(home / "logs/vmqproc_ras1_1000.log"));
}

TEST_F(ChildTrace, NineLogsAreKept) {
  writeLogs(9);
  VMQ::childTraceSetting();
  EXPECT_EQ(logCount(), 9);
}

TEST_F(ChildTrace, MissingLogsDirectoryIsNotInTheWay) {
  fs::remove(home / "logs");
  EXPECT_THAT(VMQ::childTraceSetting(), testing::StartsWith("KBB_RAS1_LOG=/"));
}

TEST_F(ChildTrace, UnknownInstallationDisablesIt) {
  const TEST_TraceCapture traces;
  homeVariable.put(std::nullopt);
  EXPECT_EQ(VMQ::childTraceSetting(), "KBB_RAS1_LOG=");
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "Disabling RAS1 for child process"));
}

TEST_F(ChildTrace, HostThatDoesNotTraceSetsNothing) {
  for (const std::optional<std::string>& value : {std::optional<std::string>(), std::optional<std::string>("")}) {
    levels.put(value);
    writeLogs(10);
    EXPECT_EQ(VMQ::childTraceSetting(), "");
    EXPECT_EQ(logCount(), 10);
  }
}

}  // namespace
