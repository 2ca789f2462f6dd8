// Starting a child: what is refused, and what the child finds.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/process/child_fixture.h"
#include "tests/process/closed_standard_descriptors.h"
#include "tests/support/system_faults.h"

namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::HasSubstr;
using VMQ::Process;
using VMQ::String;

class ProcessStart : public ChildFixture {
 protected:
  void expectRefused(const std::string& command) {
    const TEST_TraceCapture traces;
    const unsigned children = ProcessResources::now().children;
    Process process(command.c_str());
    EXPECT_FALSE(process.start()) << command;
    EXPECT_FALSE(process.running());
    EXPECT_EQ(ProcessResources::now().children, children);
    EXPECT_TRUE(traces.has(RAS1_ERROR, "Unable to execute command: " + command)) << command;
  }
  /// Started, not executed, ended with status 0.
  void expectCountsAsSuccessfulRun(const std::string& command, const std::string& reason) {
    const TEST_TraceCapture traces;
    Process process(command.c_str());
    ASSERT_TRUE(process.start()) << command;
    EXPECT_EQ(readAll(process.getStdOut()), "");
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
    EXPECT_EQ(rc, 0);
    EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAre("Unable to launch the executable, rc=-1", reason));
  }
};

TEST_F(ProcessStart, ChildRunsWithThreePipes) {
  Process process(script("read line; echo \"out $line\"; echo \"err $line\" >&2; exit 7").c_str());
  ASSERT_TRUE(process.start());
  EXPECT_TRUE(process.running());
  EXPECT_EQ(process.getStdIn()->write("hello\n", 6), 6);
  EXPECT_EQ(readAll(process.getStdOut()), "out hello\n");
  EXPECT_EQ(readAll(process.getStdErr()), "err hello\n");
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_EQ(rc, 7);
  EXPECT_FALSE(process.running());
}

TEST_F(ProcessStart, RunningOnlyBetweenStartAndTheEndOfTheChild) {
  Process process(scriptThatWaits().c_str());
  EXPECT_FALSE(process.running());
  ASSERT_TRUE(process.start());
  EXPECT_TRUE(process.running());
  letGo();
  EXPECT_TRUE(eventually([&] { return !process.running(); }));
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_FALSE(process.running());
}

TEST_F(ProcessStart, StreamsExistBeforeTheStart) {
  Process process("/bin/true");
  EXPECT_EQ(process.getStdIn()->descriptor(), -1);
  EXPECT_EQ(process.getStdOut()->descriptor(), -1);
  EXPECT_EQ(process.getStdErr()->descriptor(), -1);
}

TEST_F(ProcessStart, NameFoundOnlyThroughPathIsRefused) {
  expectRefused("sh -c true");
}

TEST_F(ProcessStart, WhatIsNotExecutableIsRefused) {
  expectRefused(directory / "missing");
  expectRefused(directory.writeFile("text", "echo\n"));
  expectRefused("");
  expectRefused(" /bin/true");       // begins with an empty word
  expectRefused("\"/bin/true\" x");  // likewise
}

TEST_F(ProcessStart, LineOfMoreThan127WordsIsRefused) {
  std::string line = "/bin/echo";
  for (int i = 1; i < 127; ++i) line += " x";
  EXPECT_EQ(outputOf(line).size(), 2 * 126u);
  for (const int count : {128, 255, 256, 257, 512}) {
    line = "/bin/echo";
    for (int i = 1; i < count; ++i) line += " x";
    expectRefused(line);
  }
}

TEST_F(ProcessStart, SecondStartIsRefused) {
  Process process("/bin/true");
  ASSERT_TRUE(process.start());
  EXPECT_FALSE(process.start());
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_FALSE(process.start());
}

TEST_F(ProcessStart, CopyStartsAChildOfItsOwn) {
  const char* env[] = {"VMQ_TEST=x", nullptr};
  Process process(script("echo $$ $VMQ_TEST").c_str(), env);
  ASSERT_TRUE(process.start());
  Process copy(process);
  EXPECT_EQ(copy.getStdOut()->descriptor(), -1);
  EXPECT_FALSE(copy.running());
  ASSERT_TRUE(copy.start());
  const std::string first = readAll(process.getStdOut());
  const std::string second = readAll(copy.getStdOut());
  EXPECT_THAT(first, HasSubstr(" x\n"));
  EXPECT_THAT(second, HasSubstr(" x\n"));
  EXPECT_NE(first, second);
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
  EXPECT_TRUE(copy.wait(&rc));
}

TEST_F(ProcessStart, ChildOfADestroyedProcessIsStillReaped) {
  Process process(scriptThatWaits().c_str());
  {
    Process temporary(process);
    ASSERT_TRUE(temporary.start());
  }
  EXPECT_EQ(ProcessResources::now().children, 1u);
  letGo();
  EXPECT_TRUE(eventually([] { return ProcessResources::now().children == 0; }));
}

TEST_F(ProcessStart, ProgramThatCannotBeExecutedCountsAsASuccessfulRun) {
  expectCountsAsSuccessfulRun(directory.path().string(), "Error occurred. ERRNO:13 Permission denied");
  const std::string orphan = directory.writeScript("orphan", "");
  directory.writeFile("orphan", "#!/no/such/interpreter\n");
  expectCountsAsSuccessfulRun(orphan, "Error occurred. ERRNO:2 No such file or directory");
}

TEST_F(ProcessStart, FileThatNamesNoInterpreterIsRunByTheShell) {
  const std::string plain = directory.writeScript("plain", "");
  directory.writeFile("plain", "echo \"ran with $1\"\n");
  EXPECT_EQ(outputOf(plain + " one"), "ran with one\n");
}

/// A program named without a path passes the check when the current directory has one, and is then looked up in PATH.
class BareName : public ProcessStart {
 protected:
  BareName() {
    directory.writeScript("tool", "echo here\n");
    elsewhere_ = fs::path(directory.writeScript("bin/tool", "echo elsewhere\n")).parent_path().string();
    fs::current_path(directory.path());
  }
  ~BareName() override { fs::current_path(before_); }
  std::string outputWithPath(const std::string& path) {
    const std::string setting = "PATH=" + path;
    const char* env[] = {setting.c_str(), nullptr};
    return outputOf("tool", env);
  }

  const fs::path before_ = fs::current_path();
  std::string elsewhere_;
};

TEST_F(BareName, IsLookedUpInThePathOfTheChild) {
  EXPECT_EQ(outputWithPath("/no/such:" + elsewhere_), "elsewhere\n");
  EXPECT_EQ(outputWithPath(":" + elsewhere_), "here\n");  // an empty entry is the current directory
  EXPECT_EQ(outputWithPath(elsewhere_ + ":"), "elsewhere\n");
  EXPECT_EQ(outputWithPath("/no/such"), "");
}

TEST_F(BareName, IsLookedUpInTheUsualDirectoriesWithoutAPath) {
  const char* env[] = {"PATH", nullptr};
  EXPECT_EQ(outputOf("tool", env), "");
  directory.writeScript("true", "echo here\n");
  EXPECT_EQ(outputOf("true", env), "");
  directory.writeScript("echo", "echo here\n");
  EXPECT_EQ(outputOf("echo found", env), "found\n");
}

TEST_F(BareName, DirectoryThatMayNotBeSearchedIsToldOverMissingOnes) {
  fs::create_directory(directory / "denied");
  fs::create_directory(directory / "denied/tool");  // a directory cannot be executed: permission denied
  const std::string setting = "PATH=" + (directory / "denied") + ":/no/such";
  const char* env[] = {setting.c_str(), nullptr};
  const TEST_TraceCapture traces;
  EXPECT_EQ(outputOf("tool", env), "");
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:13 Permission denied"));
}

TEST_F(BareName, ProgramThatIsThereButCannotBeExecutedEndsTheSearch) {
  directory.writeScript("first/tool", "echo first\n");
  const std::string setting = "PATH=" + (directory / "first") + ":" + elsewhere_;
  const char* env[] = {setting.c_str(), nullptr};
  const TEST_TraceCapture traces;
  const SystemFault fault(SystemCall::kExecve, E2BIG);
  EXPECT_EQ(outputOf("tool", env), "");
  EXPECT_TRUE(traces.has(RAS1_ERROR, "Error occurred. ERRNO:7 Argument list too long"));
}

TEST_F(ProcessStart, ListIsAddedToTheHostsEnvironment) {
  const ScopedVariable host("VMQ_HOST", "kept");
  const ScopedVariable replaced("VMQ_REPLACED", "old");
  const ScopedVariable removed("VMQ_REMOVED", "there");
  const char* env[] = {"VMQ_REPLACED=new", "VMQ_ADDED=a=b c", "VMQ_REMOVED", nullptr};
  EXPECT_EQ(outputOf(script("echo $VMQ_HOST,$VMQ_REPLACED,$VMQ_ADDED,${VMQ_REMOVED-unset}"), env),
            "kept,new,a=b c,unset\n");
  EXPECT_STREQ(getenv("VMQ_REPLACED"), "old");
  EXPECT_STREQ(getenv("VMQ_REMOVED"), "there");
  EXPECT_EQ(getenv("VMQ_ADDED"), nullptr);
}

TEST_F(ProcessStart, ChildTracesToALogOfItsOwnUnlessTheListSaysOtherwise) {
  const ScopedVariable levels("KBB_RAS1", "error");
  const ScopedVariable log("KBB_RAS1_LOG", "/host/log");
  const ScopedVariable noHome("CORVELHOME", std::nullopt);
  const std::string command = script("echo log=$KBB_RAS1_LOG");
  EXPECT_EQ(outputOf(command), "log=\n");
  const char* env[] = {"KBB_RAS1_LOG=/own/log", nullptr};
  EXPECT_EQ(outputOf(command, env), "log=/own/log\n");
  EXPECT_STREQ(getenv("KBB_RAS1_LOG"), "/host/log");
}

TEST_F(ProcessStart, ChildHoldsNoDescriptorOfTheHost) {
  std::vector<int> held;
  for (int i = 0; i < 50; ++i) held.push_back(open("/dev/null", O_RDONLY));  // not close-on-exec
  const std::string expected = "0\n1\n2\n3\n";                               // the last is the listing's own
  EXPECT_EQ(outputOf("/bin/ls /proc/self/fd"), expected);
  {
    // Where the kernel cannot close a range.
    const SystemFault fault(SystemCall::kCloseRange, ENOSYS);
    EXPECT_EQ(outputOf("/bin/ls /proc/self/fd"), expected);
    EXPECT_TRUE(fault.happened());
  }
  for (const int descriptor : held) close(descriptor);
}

TEST_F(ProcessStart, HostWithoutStandardDescriptorsStillGivesThemToTheChild) {
  const std::string command = script("read line; echo \"out $line\"; echo \"err $line\" >&2");
  std::string out, err;
  {
    const ClosedStandardDescriptors closed;
    Process process(command.c_str());
    EXPECT_TRUE(process.start());
    EXPECT_EQ(process.getStdIn()->write("x\n", 2), 2);
    out = readAll(process.getStdOut());
    err = readAll(process.getStdErr());
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
  }
  EXPECT_EQ(out, "out x\n");
  EXPECT_EQ(err, "err x\n");
}

/// A line of /proc/self/status as a set of signals.
uint64_t signalSet(const std::string& status, const std::string& name) {
  std::istringstream lines(status);
  for (std::string line; std::getline(lines, line);) {
    if (line.rfind(name + ":", 0) == 0) return std::stoull(line.substr(name.size() + 1), nullptr, 16);
  }
  ADD_FAILURE() << "no " << name;
  return 0;
}
constexpr uint64_t bit(int signal) {
  return uint64_t{1} << (signal - 1);
}

TEST_F(ProcessStart, ChildBlocksNothingAndTakesSigpipeByDefault) {
  struct sigaction ignore {
  }, handle{}, beforePipe, beforeHangup, beforeUser;
  ignore.sa_handler = SIG_IGN;
  handle.sa_handler = [](int) {};
  sigaction(SIGPIPE, &ignore, &beforePipe);
  sigaction(SIGHUP, &ignore, &beforeHangup);
  sigaction(SIGUSR1, &handle, &beforeUser);
  sigset_t blocked, before, after;
  sigemptyset(&blocked);
  sigaddset(&blocked, SIGTERM);
  sigaddset(&blocked, SIGRTMIN);
  pthread_sigmask(SIG_BLOCK, &blocked, &before);

  const std::string status = outputOf("/bin/cat /proc/self/status");

  pthread_sigmask(SIG_SETMASK, &before, &after);
  EXPECT_EQ(sigismember(&after, SIGTERM), 1) << "the host's own mask was changed";
  struct sigaction now;
  sigaction(SIGPIPE, &beforePipe, &now);
  EXPECT_EQ(now.sa_handler, SIG_IGN) << "the host's own handling was changed";
  sigaction(SIGUSR1, &beforeUser, &now);
  EXPECT_EQ(now.sa_handler, handle.sa_handler);
  sigaction(SIGHUP, &beforeHangup, nullptr);

  EXPECT_EQ(signalSet(status, "SigBlk"), 0u);
  EXPECT_EQ(signalSet(status, "SigCgt") & bit(SIGUSR1), 0u);
  EXPECT_EQ(signalSet(status, "SigIgn") & bit(SIGPIPE), 0u);
  EXPECT_EQ(signalSet(status, "SigIgn") & bit(SIGHUP), bit(SIGHUP)) << "only SIGPIPE is reset";
}

TEST_F(ProcessStart, ChildStaysInTheHostsGroupAndDirectory) {
  std::istringstream stat(outputOf("/bin/cat /proc/self/stat"));
  std::string pid, name, state;
  pid_t parent = 0, group = 0, session = 0;
  stat >> pid >> name >> state >> parent >> group >> session;
  EXPECT_EQ(parent, getpid());
  EXPECT_EQ(group, getpgrp());
  EXPECT_EQ(session, getsid(0));
  EXPECT_EQ(outputOf("/bin/readlink /proc/self/cwd"), fs::current_path().string() + "\n");
}

TEST_F(ProcessStart, UserAndGroupOfTheLongListsDoNotChangeTheChild) {
  const char* user[] = {"nobody", nullptr};
  const char* group[] = {"daemon", nullptr};
  const TEST_TraceCapture traces;
  Process process("/usr/bin/id -u", nullptr, user, group);
  EXPECT_TRUE(traces.hasPrefix(RAS1_DETAIL, "User: nobody UID: 65534 Group: daemon GID: 1"));
  ASSERT_TRUE(process.start());
  EXPECT_EQ(readAll(process.getStdOut()), std::to_string(getuid()) + "\n");
  int rc = -1;
  EXPECT_TRUE(process.wait(&rc));
}

TEST_F(ProcessStart, ParentWritesTheChildsLinesInTheirOrder) {
  const std::string command = script("echo $$");
  const TEST_TraceCapture traces;
  const std::string pid = outputOf(command);
  std::vector<std::string> lines;
  for (const std::string& line : traces.texts(RAS1_DETAIL)) {
    if (line == "creating argument array" || line == "Calling execvp" || line.find("PID: ") != std::string::npos) {
      lines.push_back(line + "\n");
    }
  }
  EXPECT_THAT(lines, ElementsAre("creating argument array\n", "Entering child process to launch command. PID: " + pid,
                                 "Calling execvp\n"));
}

TEST_F(ProcessStart, TimeoutComesFromTheEnvironment) {
  struct Case {
    std::optional<std::string> value;
    int seconds;
    bool isSet;
  };
  const Case cases[] = {{std::nullopt, 300, false}, {"", 300, false}, {"abc", 300, false},
                        {"60", 60, true},           {"0", 0, true},   {"12 ", 300, false}};
  for (const Case& c : cases) {
    const ScopedVariable timeout("TIMEOUT", c.value);
    const TEST_TraceCapture traces;
    const Process process("/bin/true");
    EXPECT_EQ(process.timeoutSeconds(), c.seconds) << c.value.value_or("unset");
    EXPECT_EQ(process.timeoutIsSet(), c.isSet) << c.value.value_or("unset");
    EXPECT_EQ(traces.has(RAS1_DETAIL, "Set timeout to " + std::to_string(c.seconds) + " seconds"), c.isSet);
  }
}

}  // namespace
