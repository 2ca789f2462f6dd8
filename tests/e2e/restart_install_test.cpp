// Installers that end the daemon which runs them: the outcome is asked of the daemon that comes after it.

#include <filesystem>
#include <fstream>

#include "tests/e2e/restarting_installer.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::Not;

class RestartInstall : public Deployment {
 protected:
  RestartInstall() {
    startHurriedDaemon();
    sendBundles();
  }

  [[nodiscard]] std::string inDepot(const std::string& name) const { return daemon->depot() + "/" + name; }

  /// Asks for the install, which is told to have gone well before it begins, and waits until the first daemon has ended
  /// and the script that outlives it has kept its exit code.
  void installAndAwaitTheCode() {
    const Outcome asked = vmqctl(
        "install ux --version 010100000 --restart --command '|DEPLOYDIR|/restart.sh |CORVELHOME| "
        "|DEPLOYDIR|/ux_Silent_Install.txt'");
    EXPECT_EQ(asked.exit_code, 0) << asked.output;
    EXPECT_THAT(asked.output, HasSubstr("Ask for its outcome with: vmqctl complete-install."));
    EXPECT_EQ(daemon->process().wait(), 0) << daemon->log();
    ASSERT_TRUE(exitCodeIsKept(*daemon));
  }
};

TEST_F(RestartInstall, CompletionIsToldByTheNextDaemon) {
  const std::string pid_file = stageRestartingInstaller(*daemon, home);
  installAndAwaitTheCode();
  SuccessorDaemon successor(pid_file);
  EXPECT_NE(successor.pid(), daemon->process().pid());

  const Outcome completed = vmqctl("complete-install");
  EXPECT_EQ(completed.exit_code, 0) << completed.output;
  EXPECT_EQ(readWholeFile(inDepot("rc.txt")), "0\n");
  EXPECT_EQ(readWholeFile(inDepot("stdout.txt")),
            "ux 010100000 installed for lx8266\nvmqd restarted\nux registered with server1:1918\n");
  EXPECT_EQ(readWholeFile(inDepot("stderr.txt")), "");
  EXPECT_FALSE(fs::exists(inDepot("ux"))) << "what was staged is not needed any more";
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010100000"));
  EXPECT_EQ(readWholeFile(home / "registry/rms.tbl"), "ux server1:1918\n");
  EXPECT_TRUE(successor.stop());
}

TEST_F(RestartInstall, FailureOfTheInstallerIsToldByTheNextDaemon) {
  const std::string pid_file = stageRestartingInstaller(*daemon, home, "echo database not converted >&2; exit 28");
  installAndAwaitTheCode();
  SuccessorDaemon successor(pid_file);

  const Outcome completed = vmqctl("complete-install");
  EXPECT_EQ(completed.exit_code, 1);
  EXPECT_THAT(completed.output, HasSubstr("VMQ1031E"));
  EXPECT_THAT(completed.output, HasSubstr("(parameters: " + inDepot("rc.txt") + ",28)"));
  EXPECT_THAT(completed.output, HasSubstr("look at stdout.txt, stderr.txt and rc.txt in the depot"));
  EXPECT_THAT(completed.output, Not(HasSubstr("trace of vmqd"))) << "the daemon before this one began it";
  EXPECT_EQ(readWholeFile(inDepot("stderr.txt")), "database not converted\n");
  EXPECT_FALSE(fs::exists(home / "registry/rms.tbl")) << "what is not installed must not be registered";
  EXPECT_TRUE(successor.stop());
}

TEST_F(RestartInstall, FailureOfTheRegistrationTakesThePlaceOfTheInstallersSuccess) {
  std::ofstream(home / "config/rms.config") << "";
  const std::string pid_file = stageRestartingInstaller(*daemon, home);
  installAndAwaitTheCode();
  SuccessorDaemon successor(pid_file);

  EXPECT_THAT(vmqctl("complete-install").output, HasSubstr("(parameters: " + inDepot("rc.txt") + ",1)"));
  EXPECT_EQ(readWholeFile(inDepot("stderr.txt")), "vmq_xa: config/rms.config names no SERVER\n");
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010100000"));
  EXPECT_TRUE(successor.stop());
}

// The daemon survives: it sends a second event when the script has ended.
TEST_F(RestartInstall, InstallerThatLeavesTheDaemonAloneIsToldTwice) {
  Watcher watcher(daemon->socket(), "TRANSID=t1");
  ASSERT_THAT(ask({{"COMMAND", "INSTALL"},
                   {"TRANSID", "t1"},
                   {"PRODUCT", "ux"},
                   {"VERSION", "010100000"},
                   {"OPTIONAL", "REQUIRES_RESTART"},
                   {"CONTEXT", "|DEPLOYDIR|/install.sh |CORVELHOME| no-such-file"}}),
              Succeeded());
  EXPECT_THAT(watcher.next(), Succeeded());
  EXPECT_THAT(watcher.next(), Failed(1031, "/bin/sh " + inDepot("runcmd.sh") + " " +
                                               inDepot("ux/010100000/install.sh ") + home.path() + " no-such-file,64"));
  EXPECT_THAT(vmqctl("complete-install").output, HasSubstr("(parameters: " + inDepot("rc.txt") + ",64)"));
  EXPECT_THAT(readWholeFile(inDepot("stderr.txt")), HasSubstr("usage: install.sh HOME [RESPONSES]"));
}

// The script around the installer removes the earlier outcome by a name without a folder.
TEST_F(RestartInstall, OutcomeOfAnEarlierOneIsNotTakenForThatOfOneThatStillRuns) {
  std::ofstream(inDepot("rc.txt")) << "0\n";
  std::ofstream(inDepot("ux/010100000/wait.sh")) << "#!/bin/sh\necho >" + (home / "begun") + "\nuntil [ -e " +
                                                        (home / "may-end") + " ]; do sleep 0.1; done\nexit 7\n";
  fs::permissions(inDepot("ux/010100000/wait.sh"), fs::perms(0770));
  ASSERT_EQ(vmqctl("install ux --version 010100000 --restart --command '|DEPLOYDIR|/wait.sh'").exit_code, 0);
  ASSERT_TRUE(soon([this] { return fs::exists(home / "begun"); }));
  const Outcome early = vmqctl("complete-install");
  std::ofstream(home / "may-end") << "";
  EXPECT_EQ(early.exit_code, 1);
  EXPECT_THAT(early.output, HasSubstr("(parameters: " + inDepot("rc.txt") + ",NOTFOUND)"));
  ASSERT_TRUE(exitCodeIsKept(*daemon));
  EXPECT_THAT(vmqctl("complete-install").output, HasSubstr("(parameters: " + inDepot("rc.txt") + ",7)"));
}

TEST_F(RestartInstall, WithoutATranslatorNothingIsRun) {
  fs::remove(home / "zlpqor6/lx8266/bin/vmq_xa");
  const Outcome refused = vmqctl("install ux --version 010100000 --restart --command '|DEPLOYDIR|/install.sh'");
  EXPECT_EQ(refused.exit_code, 1);
  EXPECT_THAT(refused.output, HasSubstr("VMQ1030E"));
  EXPECT_THAT(refused.output, HasSubstr("(parameters: " + inDepot("ux/010100000/install.sh)")));
  EXPECT_FALSE(fs::exists(inDepot("runcmd.sh")));
}

}  // namespace
