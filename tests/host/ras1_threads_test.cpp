// Tracing from many threads, across fork and while the configuration changes.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <thread>

#include "bss1.h"
#include "ras1.h"
#include "tests/host/trace_log.h"

namespace {

using testing::Each;
using testing::ElementsAre;

constinit RAS1_Unit unit{"tests/threads"};

void traceText(const std::string& text) {
  RAS1_Printf(&unit, RAS1_DETAIL, 7, "routine", "%s", text.c_str());
}

/// Runs `work(0)`, `work(1)`, ... at the same time and waits for their end.
template <class Work>
void inThreads(unsigned count, Work work) {
  std::vector<std::thread> threads;
  for (unsigned i = 0; i < count; ++i) threads.emplace_back(work, i);
  for (std::thread& thread : threads) thread.join();
}

TEST(TraceThreads, WriteWholeLines) {
  constexpr unsigned kThreads = 4;
  constexpr unsigned kLines = 200;
  const TraceLog log("all");
  const auto text = [](unsigned thread) { return std::string(3000 + 700 * thread, static_cast<char>('a' + thread)); };
  inThreads(kThreads, [&](unsigned thread) {
    for (unsigned i = 0; i < kLines; ++i) traceText(text(thread));
  });
  const std::vector<std::string> messages = log.messages();
  EXPECT_EQ(messages.size(), kThreads * kLines);
  for (unsigned thread = 0; thread < kThreads; ++thread) {
    EXPECT_EQ(std::count(messages.begin(), messages.end(), text(thread)), kLines);
  }
}

TEST(TraceThreads, LoseNoLineWhileTheLogChanges) {
  constexpr unsigned kThreads = 3;
  constexpr unsigned kLines = 1000;
  const TraceLog log("all");
  std::atomic<bool> done = false;
  std::thread operator_thread([&] {
    for (unsigned i = 0; !done; ++i) {
      const ScopedVariable name("KBB_RAS1_LOG", log.path() + "." + std::to_string(i % 2));
      EXPECT_EQ(configureTrace(), std::nullopt);
    }
  });
  inThreads(kThreads, [&](unsigned) {
    for (unsigned i = 0; i < kLines; ++i) traceText("line");
  });
  done = true;
  operator_thread.join();
  size_t written = 0;
  for (const char* suffix : {"", ".0", ".1"}) {
    if (!std::filesystem::exists(log.path() + suffix)) continue;
    const std::vector<std::string> lines = splitLines(readWholeFile(log.path() + suffix));
    EXPECT_THAT(lines, Each(testing::EndsWith(" detail tests/threads:7 routine: line")));
    written += lines.size();
  }
  EXPECT_EQ(written, kThreads * kLines);
}

TEST(TraceThreads, MakeNewUnitsKnownAtTheSameTime) {
  constexpr unsigned kUnits = 64;
  static RAS1_Unit units[kUnits];
  for (RAS1_Unit& each : units) each.name = "tests/many";
  const TraceLog log("none");
  inThreads(4, [&](unsigned) {
    for (RAS1_Unit& each : units) EXPECT_FALSE(RAS1_Enabled(each, RAS1_ERROR));
  });
  const ScopedVariable louder("KBB_RAS1", "tests/many=event");
  ASSERT_EQ(configureTrace(), std::nullopt);
  for (RAS1_Unit& each : units) EXPECT_EQ(each.levels.load(), uint32_t{RAS1_EVENT});
}

TEST(TraceThreads, MayTraceWhileTheyHoldTheEnvironmentLock) {
  const TraceLog log("all");
  std::atomic<bool> done = false;
  std::thread configuring([&] {
    while (!done) EXPECT_EQ(configureTrace(), std::nullopt);
  });
  static RAS1_Unit units[200];
  for (RAS1_Unit& each : units) {
    each.name = "tests/environment";
    BSS1_GetLock(BSS1_EnvironmentLock());
    (void)RAS1_Enabled(each, RAS1_ERROR);
    BSS1_ReleaseLock(BSS1_EnvironmentLock());
  }
  done = true;
  configuring.join();
}

TEST(TraceThreads, DoNotStandInTheWayOfAForkedChild) {
  constexpr unsigned kChildren = 100;
  constexpr unsigned kLongestSeconds = 30;
  static constinit RAS1_Unit childsOwn{"tests/child"};
  static RAS1_Unit units[5000];
  for (RAS1_Unit& each : units) each.name = "tests/parent";
  const TraceLog log("detail");
  std::atomic<bool> done = false;
  std::vector<std::thread> threads;
  threads.emplace_back([&] {
    while (!done) traceText("parent");
  });
  threads.emplace_back([&] {
    for (size_t i = 0; !done; i = (i + 1) % std::size(units)) (void)RAS1_Sync(&units[i]);
  });
  threads.emplace_back([&] {
    while (!done) (void)BSS1_PutEnv("VMQ_TEST_CHURN=1");
  });
  for (unsigned i = 0; i < kChildren; ++i) {
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
      alarm(kLongestSeconds);  // a child that hangs is killed and seen below
      if (BSS1_PutEnv("VMQ_TEST_CHILD=1") != 0) _exit(1);
      if (!RAS1_Enabled(childsOwn, RAS1_DETAIL)) _exit(2);
      RAS1_Printf(&childsOwn, RAS1_DETAIL, 1, "child", "Entering child process to launch command. PID: %d", getpid());
      _exit(0);
    }
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
  }
  done = true;
  for (std::thread& thread : threads) thread.join();
  unsigned from_children = 0;
  for (const std::string& line : log.lines()) {
    from_children += line.find(" detail tests/child:1 child: Entering child process") != std::string::npos;
  }
  EXPECT_EQ(from_children, kChildren);
}

TEST(TraceThreads, GetLongLinesWholeThroughANonBlockingPipe) {
  const TraceLog restores("all");
  const ScopedVariable name("KBB_RAS1_LOG", std::nullopt);
  ASSERT_EQ(configureTrace(), std::nullopt);
  int pipes[2];
  ASSERT_EQ(pipe2(pipes, O_CLOEXEC), 0);
  ASSERT_EQ(fcntl(pipes[1], F_SETFL, O_NONBLOCK), 0);
  std::string read_text;
  std::thread reader([&] {
    char buffer[4096];
    for (ssize_t count; (count = read(pipes[0], buffer, sizeof buffer)) > 0;) {
      read_text.append(buffer, static_cast<size_t>(count));
    }
  });
  const int before = dup(STDERR_FILENO);
  dup2(pipes[1], STDERR_FILENO);
  const std::string message(300000, 'x');
  traceText(message);
  dup2(before, STDERR_FILENO);
  close(before);
  close(pipes[1]);
  reader.join();
  close(pipes[0]);
  EXPECT_THAT(splitLines(read_text), ElementsAre(testing::EndsWith(": " + message)));
}

}  // namespace
