// What a trace line looks like and where it goes.

#include "ras1.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <ctime>

#include "bss1.h"
#include "tests/host/trace_log.h"
#include "tests/support/process_resources.h"

namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::MatchesRegex;

constinit RAS1_Unit unit{"tests/sample"};

void traceText(const std::string& text) {
  RAS1_Printf(&unit, RAS1_DETAIL, 7, "routine", "%s", text.c_str());
}

/// Standard error, sent elsewhere for a while.
class RedirectedStandardError {
 public:
  explicit RedirectedStandardError(int descriptor) : before_(dup(STDERR_FILENO)) { dup2(descriptor, STDERR_FILENO); }
  ~RedirectedStandardError() {
    dup2(before_, STDERR_FILENO);
    close(before_);
  }
  RedirectedStandardError(const RedirectedStandardError&) = delete;
  RedirectedStandardError& operator=(const RedirectedStandardError&) = delete;

 private:
  const int before_;
};

struct OpenFile {
  explicit OpenFile(const std::string& path)
      : descriptor(open(path.c_str(), O_RDWR | O_CREAT | O_APPEND | O_CLOEXEC, 0600)) {}
  ~OpenFile() { close(descriptor); }
  const int descriptor;
};

TEST(TraceLine, HasTimeThreadLevelUnitLineFunctionAndMessage) {
  const TraceLog log("all");
  RAS1_Printf(&unit, RAS1_ERROR, 120, "startstopAgent", "Unable to execute command: %s", "/bin/x");
  const std::string expected = "[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}[.][0-9]{6}Z " +
                               std::to_string(gettid()) +
                               " error tests/sample:120 startstopAgent: Unable to execute command: /bin/x";
  EXPECT_THAT(log.lines(), ElementsAre(MatchesRegex(expected)));
}

TEST(TraceLine, TellsTheTimeInUtc) {
  const ScopedVariable zone("TZ", "Asia/Tokyo");
  const TraceLog log("all");
  const int64_t before = BSS1_GetTime();
  traceText("now");
  const int64_t after = BSS1_GetTime();
  std::tm parsed{};
  ASSERT_NE(strptime(log.lines().at(0).c_str(), "%Y-%m-%dT%H:%M:%S", &parsed), nullptr);
  EXPECT_GE(timegm(&parsed), before);
  EXPECT_LE(timegm(&parsed), after);
}

TEST(TraceLine, NamesItsLevel) {
  const TraceLog log("all");
  for (const RAS1_Level level : {RAS1_ERROR, RAS1_EVENT, RAS1_DETAIL}) RAS1_Printf(&unit, level, 1, "f", "x");
  EXPECT_THAT(log.lines(), ElementsAre(EndsWith(" error tests/sample:1 f: x"), EndsWith(" event tests/sample:1 f: x"),
                                       EndsWith(" detail tests/sample:1 f: x")));
}

TEST(TraceLine, ForEntryAndExitSaysSo) {
  const TraceLog log("all");
  RAS1_Event(&unit, RAS1_ENTRY, 88, "routine");
  RAS1_Event(&unit, RAS1_EXIT, 88, "routine");
  EXPECT_THAT(log.lines(), ElementsAre(EndsWith(" event tests/sample:88 routine: entry"),
                                       EndsWith(" event tests/sample:88 routine: exit")));
}

TEST(TraceLine, IsOneLineWhateverTheMessageHolds) {
  const struct {
    std::string message, written;
  } kCases[] = {
      {"", ""},
      {"\n", ""},
      {"done\n", "done"},
      {"done\n\n", "done\\n"},
      {"\nfirst\nsecond", "\\nfirst\\nsecond"},
      {"\t_data {\n", "\\x09_data {"},
      {"a\rb", "a\\x0Db"},
      {"\x01\x1F\x7F", "\\x01\\x1F\\x7F"},
      {"\x1B[31mred", "\\x1B[31mred"},
      {"C:\\new", "C:\\new"},
      {"Gr\xC3\xBC\xC3\x9F"
       "e \xFF",
       "Gr\xC3\xBC\xC3\x9F"
       "e \xFF"},
  };
  for (const auto& each : kCases) {
    SCOPED_TRACE(each.written);
    const TraceLog log("all");
    traceText(each.message);
    EXPECT_THAT(log.messages(), ElementsAre(each.written));
  }
}

TEST(TraceLine, KeepsLongMessagesWhole) {
  for (const size_t length : {900u, 950u, 1000u, 1023u, 1024u, 2048u, 65536u, 1048576u}) {
    const TraceLog log("all");
    const std::string message(length, 'x');
    traceText(message);
    EXPECT_THAT(log.messages(), ElementsAre(message)) << length;
  }
}

TEST(TraceLine, OfEveryLengthAroundTheEndOfItsStackMemoryIsWhole) {
  for (size_t length = 900; length < 1100; ++length) {
    const TraceLog log("all");
    const std::string plain(length, 'x');
    traceText(plain);
    traceText(plain + "\t");
    ASSERT_THAT(log.messages(), ElementsAre(plain, plain + "\\x09")) << length;
  }
}

TEST(TraceLine, KeepsLongMessagesOfControlBytesWhole) {
  const TraceLog log("all");
  traceText(std::string(70000, '\n') + "end");
  std::string expected;
  for (int i = 0; i < 70000; ++i) expected += "\\n";
  EXPECT_THAT(log.messages(), ElementsAre(expected + "end"));
}

TEST(TraceLine, StandsInForAMessageThatCannotBeFormatted) {
  const TraceLog log("all");
  const wchar_t unencodable[] = {0x20AC, 0};  // in the C locale
  RAS1_Printf(&unit, RAS1_DETAIL, 1, "f", "%ls", unencodable);
  EXPECT_THAT(log.messages(), ElementsAre("%ls"));
}

TEST(TraceLine, LeavesErrnoAlone) {
  const TraceLog log("all");
  errno = ENOTDIR;
  traceText(std::string(100000, 'x'));
  EXPECT_EQ(errno, ENOTDIR);
}

TEST(TraceLine, IsWrittenWhateverTheLevelsAre) {
  const TraceLog log("none");
  traceText("asked for");
  EXPECT_THAT(log.messages(), ElementsAre("asked for"));
}

TEST(TraceLog, IsAppendedToAndReadableForItsGroupOnly) {
  const TemporaryDirectory folder;
  const ScopedVariable name("KBB_RAS1_LOG", folder.writeFile("kept.log", "from yesterday\n"));
  const ScopedVariable levels("KBB_RAS1", "all");
  ASSERT_EQ(configureTrace(), std::nullopt);
  traceText("today");
  EXPECT_THAT(splitLines(readWholeFile(folder / "kept.log")), ElementsAre("from yesterday", EndsWith(": today")));
  const ScopedVariable fresh("KBB_RAS1_LOG", folder / "new.log");
  ASSERT_EQ(configureTrace(), std::nullopt);
  struct stat attributes {};
  ASSERT_EQ(stat((folder / "new.log").c_str(), &attributes), 0);
  EXPECT_EQ(attributes.st_mode & 0137, 0u);
  const TraceLog restores("error");
}

TEST(TraceLog, IsStandardErrorUnlessNamed) {
  const TraceLog restores("all");
  const TemporaryDirectory folder;
  const OpenFile file(folder / "stderr");
  const ScopedVariable levels("KBB_RAS1", "all");
  for (const auto& unnamed : {std::optional<std::string>(), std::optional<std::string>("")}) {
    const ScopedVariable name("KBB_RAS1_LOG", unnamed);
    ASSERT_EQ(configureTrace(), std::nullopt);
    const RedirectedStandardError redirected(file.descriptor);
    traceText("here");
  }
  EXPECT_THAT(splitLines(readWholeFile(folder / "stderr")), ElementsAre(EndsWith(": here"), EndsWith(": here")));
}

TEST(TraceLog, StaysAsItWasWhenTheNewOneCannotBeOpened) {
  const TraceLog log("all");
  {
    const ScopedVariable name("KBB_RAS1_LOG", "/nowhere/at/all.log");
    const ScopedVariable levels("KBB_RAS1", "none");
    EXPECT_EQ(configureTrace(), "KBB_RAS1_LOG: \"/nowhere/at/all.log\" cannot be opened: No such file or directory");
  }
  EXPECT_TRUE(RAS1_Enabled(unit, RAS1_DETAIL));
  traceText("still here");
  EXPECT_THAT(log.messages(), ElementsAre("still here"));
}

TEST(TraceLog, MayNotBeAPipeThatNobodyReads) {
  const TraceLog log("all");
  ASSERT_EQ(mkfifo((log.path() + ".pipe").c_str(), 0600), 0);
  const ScopedVariable name("KBB_RAS1_LOG", log.path() + ".pipe");
  EXPECT_EQ(configureTrace(), "KBB_RAS1_LOG: \"" + log.path() + ".pipe\" cannot be opened: No such device or address");
}

TEST(TraceLog, IsOpenedAgainAfterItHasBeenMovedAway) {
  const TraceLog log("all");
  traceText("one");
  ASSERT_EQ(rename(log.path().c_str(), (log.path() + ".1").c_str()), 0);
  traceText("two");
  ASSERT_EQ(configureTrace(), std::nullopt);
  traceText("three");
  EXPECT_THAT(splitLines(readWholeFile(log.path() + ".1")), ElementsAre(EndsWith(": one"), EndsWith(": two")));
  EXPECT_THAT(log.messages(), ElementsAre("three"));
}

TEST(TraceLog, TakesOneDescriptorHoweverOftenItIsConfigured) {
  const TraceLog log("all");
  const unsigned before = ProcessResources::now().descriptors;
  for (int i = 0; i < 20; ++i) {
    const ScopedVariable name("KBB_RAS1_LOG", i % 2 == 0 ? std::optional(log.path() + "x") : std::nullopt);
    ASSERT_EQ(configureTrace(), std::nullopt);
  }
  EXPECT_EQ(ProcessResources::now().descriptors, before);
}

TEST(TraceLog, DoesNotPassToPrograms) {
  const TraceLog log("all");
  for (int descriptor = 3; descriptor < 64; ++descriptor) {
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    char target[4096];
    const ssize_t length = readlink(link.c_str(), target, sizeof target);
    if (length < 0 || std::string(target, static_cast<size_t>(length)) != log.path()) continue;
    EXPECT_NE(fcntl(descriptor, F_GETFD) & FD_CLOEXEC, 0);
    EXPECT_NE(fcntl(descriptor, F_GETFL) & O_APPEND, 0);
    return;
  }
  FAIL() << "the log is not open";
}

TEST(TraceLog, DoesNotTakeThePlaceOfAClosedStandardStream) {
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    close(STDIN_FILENO);
    bool closed = false;
    {
      const TraceLog log("all");
      closed = fcntl(STDIN_FILENO, F_GETFD) < 0 && errno == EBADF;
    }
    _exit(closed ? 0 : 1);
  }
  int status = -1;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(status, 0);
}

TEST(TraceLog, WhoseReaderWentAwayDoesNotEndTheProcess) {
  const TraceLog restores("all");
  const ScopedVariable name("KBB_RAS1_LOG", std::nullopt);
  ASSERT_EQ(configureTrace(), std::nullopt);
  int pipes[2];
  ASSERT_EQ(pipe2(pipes, O_CLOEXEC), 0);
  close(pipes[0]);
  {
    const RedirectedStandardError redirected(pipes[1]);
    traceText("into the void");
  }
  close(pipes[1]);
  sigset_t pending;
  sigpending(&pending);
  EXPECT_EQ(sigismember(&pending, SIGPIPE), 0);
}

// ---- a process that never configures its trace ------------------------------------------------------------------

/// Runs the little traced program with these variables. Returns its standard error.
std::vector<std::string> runTracedProgram(const std::string& variables) {
  const TemporaryDirectory folder;
  const std::string error = folder / "stderr";
  EXPECT_EQ(
      std::system(("env -u KBB_RAS1 -u KBB_RAS1_LOG " + variables + " " VMQ_TRACED_PROGRAM " 2>" + error).c_str()), 0);
  return splitLines(readWholeFile(error));
}

TEST(UnconfiguredProcess, TracesErrorsToStandardError) {
  EXPECT_THAT(runTracedProgram(""), ElementsAre(EndsWith(" error tests/traced_program:1 main: an error")));
}

TEST(UnconfiguredProcess, FollowsItsEnvironment) {
  const TemporaryDirectory folder;
  const std::string log = folder / "log";
  EXPECT_THAT(runTracedProgram("KBB_RAS1=error+detail KBB_RAS1_LOG=" + log), ElementsAre());
  EXPECT_THAT(splitLines(readWholeFile(log)), ElementsAre(EndsWith(": an error"), EndsWith(": a detail")));
}

TEST(UnconfiguredProcess, TellsOfAMistakenSettingAndTracesErrors) {
  EXPECT_THAT(runTracedProgram("KBB_RAS1=loud"),
              ElementsAre(EndsWith(R"(: KBB_RAS1: "loud" is no trace level (none, error, event, detail or all))"),
                          EndsWith(": an error")));
}

TEST(UnconfiguredProcess, TellsOfALogThatCannotBeOpenedAndUsesStandardError) {
  EXPECT_THAT(runTracedProgram("KBB_RAS1=detail KBB_RAS1_LOG=/nowhere/log"),
              ElementsAre(EndsWith(R"(: KBB_RAS1_LOG: "/nowhere/log" cannot be opened: No such file or directory)"),
                          EndsWith(": a detail")));
}

}  // namespace
