// Deployments on file systems that are full or may only be read: each ends with its code, and what was there stays.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "mgmt/initialize.h"
#include "test_seam.h"
#include "tests/mgmt/deployment_case.h"
#include "tests/mgmt/fresh_process.h"
#include "tests/support/scratch_file_system.h"

namespace {

using testing::AnyOf;
using testing::ElementsAre;
using testing::SizeIs;

/// The component of a fresh process that may mount.
struct Machine {
  Machine() {
    useOwnMountTable();
    vmqhost::setOriginNode(kNode);
    Initialize_Mgmt_Functions();
    home.tool("bin/qinfo", R"(case $1 in
-p) echo 'Platform codes:'; echo 'lx8266 Product (um)' ;;
*) cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END
esac)");
    home.tool("zlpqor6/lx8266/bin/vmq_xa", "exit 0");
    home.tool("bin/um_console", "case $4 in getdptype*) echo snmp ;; esac");
    home.controlScript("exit 0");
    home.file("config/um.config", "KUMP_META_PATH=" + home.path() + "/meta\nKUM_WORK_PATH=" + home.path() +
                                      "/work/um\nKUMP_RB_PATH=rb\nKUMA_STARTUP_DP=asfs\n");
    home.file("meta/.keep", "");
    home.file("work/scripts/.keep", "");
    home.tool("install.sh", "echo ran >> '" + home.path() + "/ran'");
  }
  void install(const std::string& optional) const {
    ask(asked("INSTALL", {equal("PRODUCT", "ux"), equal("VERSION", "1"), equal("CONTEXT", "|CORVELHOME|/install.sh"),
                          equal("OPTIONAL", optional)}));
  }
  static void configure(const std::string& model, const std::string& scripts) {
    auto request = asked("SETCONFIG", {equal("PRODUCT", "um")});
    if (!model.empty()) request.push_back(equal("DACONFIG", model));
    if (!scripts.empty()) request.push_back(equal("DASCRIPT", scripts));
    ask(request);
  }
  [[nodiscard]] std::string at(const std::string& name) const { return home.path() + "/" + name; }
  [[nodiscard]] bool has(const std::string& name) const { return std::filesystem::exists(at(name)); }

  const InstallationHome home;
  const TEST_RecordedSleeps sleeps;
  const TEST_TraceCapture trace;
};

std::string ended(const std::string& command, int retval = 0, const std::string& parameter = "") {
  return StatusEvent{.originnode = kNode,
                     .transid = "t1",
                     .command = command,
                     .retval = retval,
                     .retmsgid = retval == 0 ? "" : "VMQ" + std::to_string(retval) + "E",
                     .retmsgparm = parameter}
      .bytes();
}

class Depot : public testing::Test {
 protected:
  void SetUp() override {
    if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  }
};

using Scripts = Depot;
using Models = Depot;
using StartupList = Depot;

/// Matches the event of a restart install whose script is not there: shells differ in what they say of that.
auto endedWithoutItsScript(const Machine& machine) {
  const std::string command = "/bin/sh " + machine.home.depot() + "runcmd.sh " + machine.at("install.sh");
  return AnyOf(ended("INSTALL", 1031, command + ",127"), ended("INSTALL", 1031, command + ",2"));
}

void restartInstallOnFullDepot() {
  const Machine machine;
  StatusEvents events;
  const ScratchFileSystem depot(machine.at("depot"));
  depot.fill();
  machine.install("REQUIRES_RESTART");
  EXPECT_EQ(events.next(), ended("INSTALL"));
  EXPECT_THAT(events.next(), endedWithoutItsScript(machine));
  EXPECT_FALSE(machine.has("ran"));
  EXPECT_FALSE(machine.has("depot/runcmd.sh"));
  EXPECT_TRUE(machine.trace.has(RAS1_ERROR, "Failed to close stream for file " + machine.home.depot() + "runcmd.sh"));
}

TEST_F(Depot, ThatIsFullEndsARestartInstallWithoutRunningHalfAScript) {
  IN_FRESH_PROCESS(restartInstallOnFullDepot());
}

void restartInstallOnReadOnlyDepot() {
  const Machine machine;
  StatusEvents events;
  const ScratchFileSystem depot(machine.at("depot"));
  depot.makeReadOnly();
  machine.install("REQUIRES_RESTART");
  EXPECT_EQ(events.next(), ended("INSTALL"));
  EXPECT_THAT(events.next(), endedWithoutItsScript(machine));
  EXPECT_FALSE(machine.has("ran"));
  EXPECT_TRUE(machine.trace.has(
      RAS1_ERROR, "Failed to open file " + machine.home.depot() + "runcmd.sh using mode \"rb\", check permissions"));
}

TEST_F(Depot, ThatMayOnlyBeReadEndsARestartInstallWithAnError) {
  IN_FRESH_PROCESS(restartInstallOnReadOnlyDepot());
}

void ordinaryInstallOnReadOnlyDepot() {
  const Machine machine;
  StatusEvents events;
  const ScratchFileSystem depot(machine.at("depot"));
  machine.home.file("depot/rc.txt", "4\n");
  depot.makeReadOnly();
  machine.install("INSTANCE");
  EXPECT_EQ(events.next(), ended("INSTALL"));
  EXPECT_TRUE(machine.has("ran"));
  EXPECT_THAT(ask(asked("COMPLETE_INSTALL", {})), ElementsAre(AnswerRow{.originnode = kNode,
                                                                        .transid = "t1",
                                                                        .command = "COMPLETE_INSTALL",
                                                                        .retval = 1031,
                                                                        .retmsgid = "VMQ1031E",
                                                                        .retmsgparm = machine.at("depot/rc.txt") + ",4"}
                                                                  .bytes()));
}

TEST_F(Depot, ThatMayOnlyBeReadDoesForInstallersThatNeedNoScript) {
  IN_FRESH_PROCESS(ordinaryInstallOnReadOnlyDepot());
}

void modelOnFullFileSystem() {
  const Machine machine;
  machine.home.file("depot/m.mdl", std::string(100000, 'm'));
  StatusEvents events;
  const ScratchFileSystem models(machine.at("meta"));
  Machine::configure("m.mdl", "");
  EXPECT_EQ(events.next(), ended("SETCONFIG", 1014, "m.mdl," + machine.at("meta")));
  EXPECT_THAT(commandLines(machine.trace), SizeIs(1));  // the inventory tool: the console is not asked
  EXPECT_EQ(readWholeFile(machine.at("depot/m.mdl")), std::string(100000, 'm'));
}

TEST_F(Models, ThatDoNotFitAreNotImported) {
  IN_FRESH_PROCESS(modelOnFullFileSystem());
}

void scriptsOnReadOnlyFileSystem() {
  const Machine machine;
  machine.home.file("depot/s.sh", "script");
  StatusEvents events;
  const ScratchFileSystem scripts(machine.at("work/scripts"));
  scripts.makeReadOnly();
  Machine::configure("", "s.sh");
  EXPECT_EQ(events.next(), ended("SETCONFIG", 1015, "s.sh," + machine.at("work/scripts")));
}

TEST_F(Scripts, WhereNothingMayBeWrittenAreReported) {
  IN_FRESH_PROCESS(scriptsOnReadOnlyFileSystem());
}

const std::string kList = "lx8266|DATAPROVIDER|asfs|\n";

void listOn(bool full) {
  const Machine machine;
  machine.home.file("depot/m.mdl", "model");
  machine.home.file("config/.ConfigData/.keep", "");
  StatusEvents events;
  const ScratchFileSystem list(machine.at("config/.ConfigData"));
  const std::string file = machine.at("config/.ConfigData/kumenv");
  machine.home.file("config/.ConfigData/kumenv", kList);
  if (full) list.fill();
  if (!full) list.makeReadOnly();
  Machine::configure("m.mdl", "");
  EXPECT_EQ(events.next(), ended("SETCONFIG", 1028, file + ",asfs,SNMP"));
  EXPECT_EQ(readWholeFile(file), kList);
  EXPECT_TRUE(machine.trace.has(RAS1_ERROR, "Failed to write to file " + file));
}

TEST_F(StartupList, OnAFullFileSystemIsKept) {
  IN_FRESH_PROCESS(listOn(/*full=*/true));
}

TEST_F(StartupList, ThatMayOnlyBeReadIsReported) {
  IN_FRESH_PROCESS(listOn(/*full=*/false));
}

}  // namespace
