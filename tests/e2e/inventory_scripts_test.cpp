// The other tools of the sample home: the inventory, the architecture probe and the two-way translator.

#include <gmock/gmock.h>
#include <signal.h>

#include <filesystem>
#include <fstream>

#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::StartsWith;

constexpr char header[] = "\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"\n";

class SampleTools : public testing::Test {
 protected:
  Outcome inventory(const std::string& arguments) { return runShell(quoted(home / "bin/qinfo") + " " + arguments); }
  Outcome translator(const std::string& arguments) {
    return runShell(quoted(home / "zlpqor6/lx8266/bin/vmq_xa") + " " + arguments);
  }

  SampleHome home;
};

TEST_F(SampleTools, InventoryListsTheAgentAndTheSharedLibraries) {
  const Outcome outcome = inventory("-d");
  EXPECT_EQ(outcome.exit_code, 0);
  EXPECT_THAT(outcome.output, StartsWith(header));
  EXPECT_THAT(outcome.output, HasSubstr("\n\"ux\",\"Unix host agent\",\"lx8266\","));
  EXPECT_THAT(outcome.output, HasSubstr("\n\"ax\","));
}

TEST_F(SampleTools, InventoryOfWhatRunsFollowsTheAgents) {
  EXPECT_EQ(inventory("-r").output, header);
  ASSERT_EQ(home.control("-o inst1 start ux").exit_code, 0);
  EXPECT_THAT(inventory("-r").output, HasSubstr("\n\"ux\","));
  ASSERT_EQ(home.control("-o inst1 stop ux").exit_code, 0);
  EXPECT_EQ(inventory("-r").output, header);
}

TEST_F(SampleTools, PlatformListingNamesTheArchitectureOfTheProduct) {
  EXPECT_EQ(inventory("-p ux").output, "Platform codes:\nlx8266 Product (ux)\n");
  EXPECT_EQ(inventory("-p zz").output, "Platform codes:\n");
}

TEST_F(SampleTools, InventoryOfOthersIsWhatRegisteredItself) {
  EXPECT_EQ(inventory("-x").output, header);
  const std::string line = "\"rp\",\"Report\",\"lx8266\",\"010000000\",\"100\"\n";
  std::ofstream(home / "registry/others.tbl") << line;
  EXPECT_EQ(inventory("-x").output, header + line);
  EXPECT_THAT(inventory("-d").output, testing::Not(HasSubstr("rp")));
}

TEST_F(SampleTools, LinesThatAreNotUtf8AreLines) {
  const std::string line = "\"zz\",\"\xFCnix \\n\",\"lx8266\",\"1\",\"1\"\n";
  std::ofstream(home / "registry/products.tbl", std::ios::app) << line;
  const std::string utf8 = "LC_ALL=C.UTF-8 ";
  const std::string qinfo = utf8 + quoted(home / "bin/qinfo");
  EXPECT_EQ(runShell(qinfo + " -p zz").output, "Platform codes:\nlx8266 Product (zz)\n");
  fs::copy_file(home / "config/ux_inst1.config", home / "config/zz.config");
  (void)home.writeProgram("bin/CorvelAgent", "case $* in *' status zz') ;; *' status '*) exit 3 ;; esac");
  EXPECT_EQ(runShell(qinfo + " -r").output, header + line);

  EXPECT_EQ(runShell(utf8 + quoted(home / "bin/uninstall.sh") + " -i ux lx8266").exit_code, 0);
  const std::string left = readWholeFile(home / "registry/products.tbl");
  EXPECT_THAT(left, testing::Not(HasSubstr("\"ux\"")));
  EXPECT_THAT(left, testing::EndsWith(line));
}

TEST_F(SampleTools, ConfigurationsThatAreNotUtf8AreTranslatedWhole) {
  const std::string settings = "PORT=1\n# f\xFCr alle\nWAIT_SECONDS=7\nPROGRAM=/opt/\xFC/program\n";
  const std::string file = home / "new.cfg";
  std::ofstream(file) << "INSTANCE=inst2\n" + settings;
  const std::string tool = "LC_ALL=C.UTF-8 " + quoted(home / "zlpqor6/lx8266/bin/vmq_xa");
  const Outcome put = runShell(tool + " -p inst2 -pc ux <" + quoted(file));
  EXPECT_EQ(put.exit_code, 0) << put.output;
  EXPECT_EQ(readWholeFile(home / "config/ux_inst2.config"), settings);
  EXPECT_EQ(runShell(tool + " -g inst2 -pc ux").output,
            "INSTANCE=inst2\nPORT=1\nWAIT_SECONDS=7\nPROGRAM=/opt/\xFC/program\n");
}

// As it is called when it is looked up where the libraries are.
TEST_F(SampleTools, InventoryTakesAnEmptyLastArgument) {
  EXPECT_EQ(inventory("-d ''").output, inventory("-d").output);
}

TEST_F(SampleTools, InventoryRefusesWhatItDoesNotUnderstand) {
  for (const char* arguments : {"", "-z", "-d ux", "-p"}) EXPECT_EQ(inventory(arguments).exit_code, 64) << arguments;
}

TEST_F(SampleTools, UninstallEndsTheAgentsAndTakesTheProductOutOfTheInventory) {
  ASSERT_EQ(home.control("start ux").exit_code, 0);
  ASSERT_EQ(home.control("-o inst1 start ux").exit_code, 0);
  const Outcome outcome = runShell(quoted(home / "bin/uninstall.sh") + " -i ux lx8266");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_EQ(home.control("status ux").exit_code, 3);
  EXPECT_EQ(home.control("-o inst1 status ux").exit_code, 3);
  EXPECT_THAT(inventory("-d").output, testing::Not(HasSubstr("\"ux\"")));
}

TEST_F(SampleTools, UninstallKeepsAProductWhoseAgentCannotBeStopped) {
  ASSERT_EQ(home.control("start ux").exit_code, 0);
  home.configure("ux", "WAIT_SECONDS=1");
  ASSERT_EQ(kill(home.pid("ux").value(), SIGSTOP), 0);
  const Outcome outcome = runShell(quoted(home / "bin/uninstall.sh") + " -i ux lx8266");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("ux is still running"));
  EXPECT_THAT(inventory("-d").output, HasSubstr("\"ux\""));
}

TEST_F(SampleTools, UninstallRefusesWhatIsNotInstalledAndWhatItDoesNotUnderstand) {
  for (const char* arguments : {"-i ux aix433", "-i ax lx8266", "-i lz lx8266", "-i ../ux lx8266", "-i '' lx8266"})
    EXPECT_EQ(runShell(quoted(home / "bin/uninstall.sh") + " " + arguments).exit_code, 1) << arguments;
  for (const char* arguments : {"", "-i ux", "-x ux lx8266", "-i ux lx8266 now"})
    EXPECT_EQ(runShell(quoted(home / "bin/uninstall.sh") + " " + arguments).exit_code, 64) << arguments;
}

TEST_F(SampleTools, ArchitectureProbeSetsBothVariables) {
  const Outcome outcome = runShell("/bin/ksh -c '. " + (home / "bin/dynarch.shl") + " " +
                                   (home / "registry/archdsc.tbl") + "; echo $os; echo $cArch'");
  EXPECT_EQ(outcome.exit_code, 0);
  EXPECT_THAT(outcome.output, testing::MatchesRegex("Linux\n(lx8266|lar64)\n"));
}

TEST_F(SampleTools, TranslatorFindsTheInstanceOfAManagedSystemName) {
  EXPECT_EQ(translator("-i inst1:node7:UX -pc ux").output, "inst1\n");
  EXPECT_EQ(translator("-i inst1 -pc ux").output, "inst1\n");
  EXPECT_EQ(translator("-i node7:UX -pc ux").output, "\n");
  EXPECT_EQ(translator("-i inst2:node7:UX -pc ux").exit_code, 1);
}

TEST_F(SampleTools, TranslatorPutsBackWhatItGot) {
  const std::string before = translator("-g inst1 -pc ux").output;
  EXPECT_THAT(before, StartsWith("INSTANCE=inst1\nPORT="));
  EXPECT_EQ(
      translator("-g inst1 -pc ux | " + quoted(home / "zlpqor6/lx8266/bin/vmq_xa") + " -p inst1 -pc ux").exit_code, 0);
  EXPECT_EQ(translator("-g inst1 -pc ux").output, before);
}

TEST_F(SampleTools, TranslatorMakesAndRemovesAnInstance) {
  const Outcome put = translator("-p inst2 -pc ux <<'END'\nINSTANCE=inst2\nPORT=19102\nPROGRAM=/bin/true\nEND");
  EXPECT_EQ(put.exit_code, 0) << put.output;
  EXPECT_EQ(readWholeFile(home / "config/ux_inst2.config"), "PORT=19102\nPROGRAM=/bin/true\n");
  EXPECT_EQ(translator("-r inst2 -pc ux </dev/null").exit_code, 0);
  EXPECT_FALSE(fs::exists(home / "config/ux_inst2.config"));
}

TEST_F(SampleTools, TranslatorWithoutANameMeansTheAgentItself) {
  EXPECT_THAT(translator("-g  -pc ux").output, StartsWith("INSTANCE=\nPORT="));
}

TEST_F(SampleTools, TranslatorRefusesSettingsItDoesNotKnowAndKeepsTheOldOnes) {
  const std::string before = readWholeFile(home / "config/ux_inst1.config");
  for (const char* text : {"", "FOO=1", "PORT=", "PORT=1\nFOO=1", "PORT=1\nPROGRAM=relative", "PORT=x", "PORT=0",
                           "PORT=65536", "PORT=99999999999999999999"}) {
    const Outcome outcome = translator("-p inst1 -pc ux <<'END'\n" + std::string(text) + "\nEND");
    EXPECT_EQ(outcome.exit_code, 1) << text;
    EXPECT_EQ(readWholeFile(home / "config/ux_inst1.config"), before) << text;
  }
  EXPECT_EQ(runShell("ls " + quoted(home / "config")).output, "rms.config\num.config\nux.config\nux_inst1.config\n")
      << "work files left";
}

TEST_F(SampleTools, TranslatorRegistersAProductOnce) {
  EXPECT_EQ(translator("-setRMS ux").output, "ux registered with server1:1918\n");
  EXPECT_EQ(translator("-setRMS um").exit_code, 0);
  EXPECT_EQ(translator("-setRMS ux").exit_code, 0);
  EXPECT_EQ(readWholeFile(home / "registry/rms.tbl"), "um server1:1918\nux server1:1918\n");
}

TEST_F(SampleTools, TranslatorRegistersNothingThatIsNotInstalledAndNotWithoutAServer) {
  EXPECT_EQ(translator("-setRMS lz").output, "vmq_xa: product \"lz\" is not installed\n");
  EXPECT_EQ(translator("-setRMS '.*'").exit_code, 1);
  std::ofstream(home / "config/rms.config") << "# no server\n";
  const Outcome outcome = translator("-setRMS ux");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_EQ(outcome.output, "vmq_xa: config/rms.config names no SERVER\n");
  EXPECT_FALSE(fs::exists(home / "registry/rms.tbl"));
}

TEST_F(SampleTools, TranslatorStopsTheInstanceThatItRemoves) {
  ASSERT_EQ(home.control("-o inst1 start ux").exit_code, 0);
  const pid_t agent = home.pid("ux_inst1").value();
  EXPECT_EQ(translator("-r inst1 -pc ux").exit_code, 0);
  EXPECT_FALSE(isRunning(agent));
}

TEST_F(SampleTools, JavaIsFoundWhereTheSearchPathLeads) {
  fs::create_directories(home / "jdk/bin");
  fs::create_directories(home / "links");
  (void)home.writeProgram("jdk/bin/java", "exit 0");
  fs::create_symlink(home / "jdk/bin/java", home / "links/java");
  const std::string script = quoted(home / "bin/CorvelGetJavaHome");
  const Outcome found = runShell("PATH=" + quoted(home / "links") + ":/usr/bin:/bin " + script);
  EXPECT_EQ(found.exit_code, 0);
  EXPECT_EQ(found.output, fs::canonical(home / "jdk").string() + "\n");
  fs::create_directories(home / "empty");
  const Outcome none = runShell("PATH=" + quoted(home / "empty") + " /bin/sh " + script);
  EXPECT_EQ(none.exit_code, 1);
  EXPECT_EQ(none.output, "CorvelGetJavaHome: there is no java in PATH\n");
}

TEST_F(SampleTools, ConsoleKnowsTheTypeOfAModel) {
  std::ofstream(home / "load.mdl") << "* comment\r\nNAME=load\r\nTYPE=SCRP\r\n";
  const std::string console = quoted(home / "bin/um_console") + " -h " + quoted(home.path()) + " -c ";
  EXPECT_EQ(runShell(console + quoted("getdptype " + (home / "load.mdl"))).output, "SCRP\n");
  EXPECT_EQ(runShell(console + quoted("getdptype " + (home / "gone.mdl"))).output,
            "um_console: cannot read the model \"" + (home / "gone.mdl") + "\"\n");
  EXPECT_EQ(runShell(console + "'getdptype'").exit_code, 64);
  EXPECT_EQ(runShell(console + quoted("LIST " + (home / "load.mdl"))).exit_code, 64);
}

TEST_F(SampleTools, ConsoleNeedsTheAgentOfThisFolderAndThatItRuns) {
  const std::string models = home / "zlpqor6/lx8266/um/metafiles";
  std::ofstream(models + "/load.mdl") << "NAME=load\nTYPE=POST\nSCRIPT=read.sh\n";
  const std::string console = quoted(home / "bin/um_console") + " -h " + quoted(home.path()) + " -c " +
                              quoted("IMPORT " + models + "/load.mdl");
  EXPECT_EQ(runShell("KUM_PRODSPEC_PATH=/elsewhere/ " + console).output,
            "um_console: no data agent has its models in \"/elsewhere/\" (KUM_PRODSPEC_PATH)\n");
  EXPECT_EQ(runShell("KUM_PRODSPEC_PATH=" + models + "/ " + console).output,
            "um_console: no data agent answers on port " + std::to_string(home.port("um")) + "\n");
}

TEST_F(SampleTools, TranslatorRefusesWhatItDoesNotUnderstand) {
  for (const char* arguments : {"", "-g", "-g inst1", "-z inst1 -pc ux", "-g inst1 -pc"})
    EXPECT_EQ(translator(arguments).exit_code, 64) << arguments;
  for (const char* arguments : {"-g inst1 -pc lz", "-g ../ux -pc ux", "-g inst2 -pc ux", "-r inst2 -pc ux"})
    EXPECT_EQ(translator(arguments).exit_code, 1) << arguments;
}

}  // namespace
