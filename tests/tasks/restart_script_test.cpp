#include "tasks/restart_script.h"

#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cstdlib>
#include <filesystem>
#include <string>

#include "tests/support/temporary_directory.h"

namespace {

namespace fs = std::filesystem;

using VMQ::String;

// What both forms remove, for the product "oq".
const std::string kRemovals =
    "rm -rf /d/ui >/dev/null 2>&1\n"
    "rm -rf /d/ci >/dev/null 2>&1\n"
    "rm -rf /d/jr >/dev/null 2>&1\n"
    "rm -rf /d/gs >/dev/null 2>&1\n"
    "rm -rf /d/dd >/dev/null 2>&1\n"
    "rm -rf /d/ax >/dev/null 2>&1\n"
    "rm -rf /d/la >/dev/null 2>&1\n"
    "rm -rf /d/uf >/dev/null 2>&1\n"
    "rm -rf /d/ux >/dev/null 2>&1\n"
    "rm -rf /d/oq >/dev/null 2>&1\n";

TEST(RestartScript, InstallsOnly) {
  EXPECT_EQ(restartScript("/d/", "oq", "").toNarrow(),
            "#!/bin/sh\n"
            "trap \"true\" 13 15\n"
            "rm -f rc.txt >/dev/null 2>&1\n"
            "$* 2>/d/stderr.txt 1>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "export RETCODE\n" +
                kRemovals +
                "echo $RETCODE > /d/rc.txt\n"
                "exit $RETCODE\n");
}

TEST(RestartScript, InstallsAndRegisters) {
  EXPECT_EQ(restartScript("/d/", "oq", "/x/vmq_xa -setRMS oq").toNarrow(),
            "#!/bin/sh\n"
            "trap \"true\" 13 15\n"
            "rm -f rc.txt >/dev/null 2>&1\n"
            "$* 2>/d/stderr.txt 1>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "if [ \"$RETCODE\" -eq \"0\" ]; then\n"
            "/x/vmq_xa -setRMS oq 2>>/d/stderr.txt 1>>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "fi\n" +
                kRemovals +
                "export RETCODE\n"
                "echo $RETCODE > /d/rc.txt\n"
                "exit $RETCODE\n");
}

TEST(RestartScript, RemovesTheDirectoryOfProductUxTwice) {
  const std::string script = restartScript("/d/", "ux", "").toNarrow();
  const std::string line = "rm -rf /d/ux >/dev/null 2>&1\n";
  EXPECT_NE(script.find(line + line), std::string::npos);
}

// ---- run by a shell ------------------------------------------------------------------------------------------------

/// A depot in which bundles are staged, with an installer and a translator of the test's own.
class RunningRestartScript : public testing::Test {
 protected:
  RunningRestartScript() {
    for (const char* staged : {"ui", "ux", "oq", "kept"}) fs::create_directories(depot / staged);
  }

  /// Runs the script as the install command does: "/bin/sh runcmd.sh INSTALLER its words". Returns its exit code.
  int run(const std::string& installer, const std::string& translator = "") {
    const std::string program = depot.writeScript("oq/installer", installer);
    const std::string registration =
        translator.empty() ? "" : depot.writeScript("translator", translator) + " -setRMS oq";
    const std::string script = restartScript((depot / "").c_str(), "oq", registration.c_str()).toNarrow();
    const int status = std::system(  // in a folder of its own: the script removes a rc.txt there
        ("cd " + (depot / "kept") + " && /bin/sh " + depot.writeFile("runcmd.sh", script) + " " + program + " one two")
            .c_str());
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  }

  std::string contents(const std::string& name) const { return readWholeFile(depot / name); }

  TemporaryDirectory depot;
};

TEST_F(RunningRestartScript, KeepsTheExitCodeAndOutputOfTheInstallerAndCleansTheDepot) {
  EXPECT_EQ(run("echo installing $*; echo careful >&2; exit 7"), 7);
  EXPECT_EQ(contents("rc.txt"), "7\n");
  EXPECT_EQ(contents("stdout.txt"), "installing one two\n");
  EXPECT_EQ(contents("stderr.txt"), "careful\n");
  for (const char* staged : {"ui", "ux", "oq"}) EXPECT_FALSE(fs::exists(depot / staged)) << staged;
  EXPECT_TRUE(fs::exists(depot / "kept"));
}

TEST_F(RunningRestartScript, SuccessOfTheInstallerIsKeptAsZero) {
  EXPECT_EQ(run("exit 0"), 0);
  EXPECT_EQ(contents("rc.txt"), "0\n");
}

TEST_F(RunningRestartScript, RegistersWhatIsInstalledAndAppendsWhatThatPrints) {
  EXPECT_EQ(run("echo installed", "echo registered $*; echo slowly >&2"), 0);
  EXPECT_EQ(contents("rc.txt"), "0\n");
  EXPECT_EQ(contents("stdout.txt"), "installed\nregistered -setRMS oq\n");
  EXPECT_EQ(contents("stderr.txt"), "slowly\n");
  EXPECT_FALSE(fs::exists(depot / "oq"));
}

TEST_F(RunningRestartScript, FailedInstallerIsNotRegistered) {
  EXPECT_EQ(run("exit 3", "echo registered"), 3);
  EXPECT_EQ(contents("rc.txt"), "3\n");
  EXPECT_EQ(contents("stdout.txt"), "");
}

TEST_F(RunningRestartScript, FailedRegistrationTakesThePlaceOfTheInstallersSuccess) {
  EXPECT_EQ(run("echo installed", "exit 5"), 5);
  EXPECT_EQ(contents("rc.txt"), "5\n");
  EXPECT_EQ(contents("stdout.txt"), "installed\n");
}

TEST_F(RunningRestartScript, SurvivesTheSignalsThatTheEndOfItsDaemonMayBring) {
  EXPECT_EQ(run("kill -TERM $PPID; kill -PIPE $PPID; exit 2"), 2);
  EXPECT_EQ(contents("rc.txt"), "2\n");
}

// Deliberate: the old code in the depot is overwritten, not removed; what is removed is one where the script runs.
TEST_F(RunningRestartScript, RemovesACodeInTheFolderWhereItRuns) {
  depot.writeFile("rc.txt", "9\n");
  depot.writeFile("kept/rc.txt", "9\n");
  EXPECT_EQ(run("cat " + (depot / "rc.txt")), 0);
  EXPECT_EQ(contents("stdout.txt"), "9\n");
  EXPECT_EQ(contents("rc.txt"), "0\n");
  EXPECT_FALSE(fs::exists(depot / "kept/rc.txt"));
}

}  // namespace
