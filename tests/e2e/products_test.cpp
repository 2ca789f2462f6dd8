// Installing, configuring and removing products, from what a person types to what is on the disk then.

#include <signal.h>

#include <filesystem>
#include <fstream>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

class Products : public Deployment {
 protected:
  Products() {
    startHurriedDaemon();
    sendBundles();
  }

  /// Writes an installer for product "rp", version "1.0", and returns what stands for it in a request.
  std::string stageInstaller(const std::string& body) const {
    fs::create_directories(daemon->depot() + "/rp/1.0");
    std::ofstream(daemon->depot() + "/rp/1.0/install.sh") << "#!/bin/sh\n" + body + "\n";
    fs::permissions(daemon->depot() + "/rp/1.0/install.sh", fs::perms(0770));
    return "|DEPLOYDIR|/install.sh";
  }

  static constexpr char installBundle[] =
      "install ux --version 010100000 --command '|DEPLOYDIR|/install.sh |CORVELHOME| "
      "|DEPLOYDIR|/ux_Silent_Install.txt'";
};

TEST_F(Products, InstalledAgentIsListedAndRunsFromItsOwnProgram) {
  const Outcome installed = vmqctl(installBundle);
  EXPECT_EQ(installed.exit_code, 0) << installed.output;
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010100000"));
  EXPECT_THAT(readWholeFile(home / "registry/products.tbl"),
              StartsWith("\"ux\",\"Unix host agent\",\"lx8266\",\"010100000\",\"100\"\n\"um\","));

  ASSERT_EQ(vmqctl("start ux").exit_code, 0);
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_EQ(fs::read_symlink("/proc/" + std::to_string(home.pid("ux").value()) + "/exe"),
            home / "zlpqor6/lx8266/ux/bin/prometheus-node-exporter");
}

TEST_F(Products, RemovalOfWhatTheInventoryDoesNotListNeedsACommand) {
  const Outcome outcome = vmqctl("uninstall zz");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output,
              testing::EndsWith("The inventory does not list zz; say with --command what installed it.\n"));
}

TEST_F(Products, InstallRegistersTheProductWhenToldTo) {
  EXPECT_EQ(vmqctl(installBundle).exit_code, 0);
  EXPECT_FALSE(fs::exists(home / "registry/rms.tbl"));
  EXPECT_EQ(vmqctl(installBundle + std::string(" --set-rms")).exit_code, 0);
  EXPECT_EQ(readWholeFile(home / "registry/rms.tbl"), "ux server1:1918\n");
}

// Deliberate: the exit code of this command is one character of the message.
TEST_F(Products, ProductThatCannotBeRegisteredStaysInstalled) {
  std::ofstream(home / "config/rms.config") << "";
  const Outcome outcome = vmqctl(installBundle + std::string(" --set-rms"));
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1008E"));
  EXPECT_THAT(outcome.output, HasSubstr("INSTALL,ux,\\x01," + (home / "zlpqor6/lx8266/bin/vmq_xa") + " -setRMS ux"));
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010100000"));
}

TEST_F(Products, InstallerIsToldWhereItsFilesTheHomeAndTheDepotAre) {
  const std::string command = stageInstaller("echo \"$*\" >\"$(dirname \"$0\")/told\"");
  EXPECT_EQ(
      vmqctl("install rp --version 1.0 --command '" + command + " |DEPLOYDIR| |CORVELHOME| |DEPOTDIR|'").exit_code, 0);
  EXPECT_EQ(readWholeFile(daemon->depot() + "/rp/1.0/told"),
            daemon->depot() + "/rp/1.0 " + home.path() + " " + daemon->depot() + "/\n");
}

TEST_F(Products, FailedInstallerIsNamedWithItsExitCodeAndWhatItPrintedIsInTheTrace) {
  const std::string command = stageInstaller("echo no room on this disk >&2; exit 28");
  const Outcome outcome = vmqctl("install rp --version 1.0 --command '" + command + "'");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1031E"));
  EXPECT_THAT(outcome.output, HasSubstr("(parameters: " + daemon->depot() + "/rp/1.0/install.sh,28)"));
  EXPECT_THAT(outcome.output, HasSubstr("What the command printed is in the trace of vmqd"));
  EXPECT_THAT(daemon->log(), HasSubstr("no room on this disk"));
}

TEST_F(Products, InstallerThatIsNotInTheDepotIsAnotherFailure) {
  const Outcome outcome = vmqctl("install rp --version 2.0 --command '|DEPLOYDIR|/install.sh'");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1030E"));
  EXPECT_THAT(outcome.output, HasSubstr("(parameters: " + daemon->depot() + "/rp/2.0/install.sh)"));
}

// Deliberate: a program that is there and cannot be begun counts as having succeeded. That is why a transfer takes the
// DOS line ends out of installers.
TEST_F(Products, InstallerWithDosLineEndsDoesNothingAndNobodyIsTold) {
  const std::string installer = daemon->depot() + "/ux/010100000/install.sh";
  fs::copy_file(VMQ_SOURCE_DIR "/examples/bundles/ux/010100000/install.sh", installer,
                fs::copy_options::overwrite_existing);
  EXPECT_EQ(vmqctl(installBundle).exit_code, 0);
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010000000"));
}

TEST_F(Products, UninstallEndsTheAgentsAndRemovesTheProduct) {
  ASSERT_EQ(vmqctl(installBundle).exit_code, 0);
  ASSERT_EQ(vmqctl("start ux").exit_code, 0);
  ASSERT_EQ(vmqctl("start ux --instance inst1").exit_code, 0);
  const Outcome removed = vmqctl("uninstall ux");
  EXPECT_EQ(removed.exit_code, 0) << removed.output;
  EXPECT_FALSE(answers(home.port("ux")));
  EXPECT_FALSE(answers(home.port("ux_inst1")));
  EXPECT_FALSE(fs::exists(home / "zlpqor6/lx8266/ux"));
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("no products"));
}

// Deliberate: the exit code of this command is one character of the message.
TEST_F(Products, UninstallThatFailsNamesItsCommandAndRemovesNothing) {
  ASSERT_EQ(vmqctl("start ux").exit_code, 0);
  home.configure("ux", "WAIT_SECONDS=1");
  ASSERT_EQ(kill(home.pid("ux").value(), SIGSTOP), 0);
  const Outcome outcome = vmqctl("uninstall ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1032E"));
  EXPECT_THAT(outcome.output, HasSubstr("(parameters: " + (home / "bin/uninstall.sh") + " -i ux lx8266,\\x01)"));
  EXPECT_THAT(daemon->log(), HasSubstr("uninstall.sh: ux is still running"));
  EXPECT_THAT(vmqctl("inventory ux").output, HasSubstr("010000000"));
}

TEST_F(Products, ProductThatTheInventoryDoesNotKnowIsRemovedByWhatInstalledIt) {
  ASSERT_EQ(vmqctl(installBundle).exit_code, 0);
  ASSERT_EQ(runShell("sed -i '/^\"ux\"/d' " + quoted(home / "registry/products.tbl")).exit_code, 0);
  ASSERT_TRUE(fs::exists(home / "zlpqor6/lx8266/ux"));
  const Outcome removed = vmqctl("un" + std::string(installBundle));
  EXPECT_EQ(removed.exit_code, 0) << removed.output;
  EXPECT_FALSE(fs::exists(home / "zlpqor6/lx8266/ux")) << "the response file for uninstalling was not taken";
}

TEST_F(Products, ConfigurationIsShownAsItIsAndWrittenBackChanged) {
  const Outcome shown = vmqctl("get-config ux --target inst1 2>/dev/null");
  EXPECT_EQ(shown.exit_code, 0);
  EXPECT_THAT(shown.output, StartsWith("INSTANCE=inst1\nPORT="));

  const std::string port = std::to_string(freePort());
  const Outcome written =
      runShell("printf '%s\\nPORT=" + port + "\\n' " + quoted(shown.output) + " >" + quoted(home / "new.cfg"));
  ASSERT_EQ(written.exit_code, 0);
  const Outcome set = vmqctl("set-config ux --target inst1 " + quoted(home / "new.cfg"));
  EXPECT_EQ(set.exit_code, 0) << set.output;
  ASSERT_EQ(vmqctl("start ux --target inst1").exit_code, 0);
  EXPECT_TRUE(answers(static_cast<uint16_t>(std::stoi(port))));
}

TEST_F(Products, ConfigurationThatTheTranslatorRefusesIsExplainedInItsWords) {
  std::ofstream(home / "new.cfg") << "PORT=ten\n";
  const std::string before = readWholeFile(home / "config/ux.config");
  const Outcome outcome = vmqctl("set-config ux " + quoted(home / "new.cfg"));
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1008E"));
  EXPECT_THAT(outcome.output, HasSubstr("(parameters: SETCONFIG,ux,1," + (home / "zlpqor6/lx8266/bin/vmq_xa") +
                                        " -p  -pc ux,vmq_xa: the configuration has no PORT that is a number"));
  EXPECT_EQ(readWholeFile(home / "config/ux.config"), before);
}

TEST_F(Products, RemovedInstanceIsStoppedAndGone) {
  ASSERT_EQ(vmqctl("start ux --instance inst1").exit_code, 0);
  const uint16_t port = home.port("ux_inst1");
  const Outcome removed = vmqctl("remove-instance ux inst1");
  EXPECT_EQ(removed.exit_code, 0) << removed.output;
  EXPECT_FALSE(answers(port));
  EXPECT_FALSE(fs::exists(home / "config/ux_inst1.config"));
  EXPECT_THAT(
      vmqctl("remove-instance ux inst1").output,
      HasSubstr("(parameters: REMOVEINSTANCE,ux,1," + (home / "zlpqor6/lx8266/bin/vmq_xa") + " -r inst1 -pc ux)"));
}

TEST_F(Products, CompletionWithoutAnInstallFindsNoCode) {
  const Outcome outcome = vmqctl("complete-install");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1031E"));
  EXPECT_THAT(outcome.output, HasSubstr("(parameters: " + daemon->depot() + "/rc.txt,NOTFOUND)"));
}

}  // namespace
