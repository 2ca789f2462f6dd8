// The data agent: a model and its script go from the depot to where the agent shows what the script printed.

#include <filesystem>
#include <fstream>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::Not;

class DataAgent : public Deployment {
 protected:
  DataAgent() {
    startHurriedDaemon();
    sendBundles();
  }

  [[nodiscard]] std::string shown(const std::string& agent = "um") const {
    return runShell("curl --silent --noproxy '*' http://127.0.0.1:" + std::to_string(home.port(agent)) + "/metrics")
        .output;
  }

  [[nodiscard]] std::string folder(const std::string& name) const { return home / ("zlpqor6/lx8266/um/" + name); }
};

TEST_F(DataAgent, ShowsWhatAModelFromTheDepotReads) {
  ASSERT_EQ(vmqctl("start um").exit_code, 0);
  EXPECT_THAT(shown(), Not(HasSubstr("sample_load")));
  const Outcome configured = vmqctl("set-da-config --model load.mdl --script read_load.sh");
  EXPECT_EQ(configured.exit_code, 0) << configured.output << daemon->log();
  EXPECT_THAT(shown(), HasSubstr("\nsample_load{minutes=\"5\"} "));
  EXPECT_TRUE(fs::exists(folder("metafiles/load.mdl")));
  EXPECT_EQ(fs::status(folder("scripts/read_load.sh")).permissions(), fs::perms(0770));
}

TEST_F(DataAgent, IsRestartedWhenTheModelNeedsAnotherDataProviderAndOnlyThen) {
  ASSERT_EQ(vmqctl("start um").exit_code, 0);
  const pid_t first = home.pid("um").value();
  ASSERT_EQ(vmqctl("set-da-config --model load.mdl --script read_load.sh").exit_code, 0);
  const pid_t second = home.pid("um").value();
  EXPECT_NE(second, first);
  EXPECT_THAT(readWholeFile(home / "config/.ConfigData/kumenv"), HasSubstr("\nlx8266|DATAPROVIDER|POST,SCRP|\n"));
  EXPECT_THAT(readWholeFile(home / "config/um.config"), HasSubstr("\nKUMA_STARTUP_DP='POST,SCRP'\n"));
  EXPECT_FALSE(fs::exists(home / "config/.ConfigData/kumenv.copy"));

  EXPECT_EQ(vmqctl("set-da-config --model load.mdl").exit_code, 0);
  EXPECT_EQ(home.pid("um"), second);
  EXPECT_THAT(shown(), HasSubstr("\nsample_load{"));
}

TEST_F(DataAgent, InstanceHasModelsAndDataProvidersOfItsOwn) {
  std::string configuration = readWholeFile(home / "config/um.config");
  for (size_t place; (place = configuration.find("/um/")) != std::string::npos;)
    configuration.replace(place, 4, "/um_inst1/");
  std::ofstream(home / "config/um_inst1.config") << configuration;
  home.configure("um_inst1", "PORT=" + std::to_string(freePort()));
  fs::create_directories(home / "zlpqor6/lx8266/um_inst1/metafiles");
  fs::create_directories(home / "zlpqor6/lx8266/um_inst1/scripts");
  std::ofstream(home / "config/.ConfigData/kumenv", std::ios::app) << "inst1|DATAPROVIDER|ASFS|\n";
  ASSERT_EQ(vmqctl("start um --instance inst1").exit_code, 0);
  const pid_t agent = home.pid("um_inst1").value();

  const Outcome configured =
      vmqctl("set-da-config --target INST1:node1:DA --model load.mdl --script read_load.sh --port " +
             std::to_string(home.port("um_inst1")));
  EXPECT_EQ(configured.exit_code, 0) << configured.output << daemon->log();
  EXPECT_EQ(home.pid("um_inst1"), agent) << "ASFS serves the type of the model";
  EXPECT_THAT(readWholeFile(home / "config/.ConfigData/kumenv"), HasSubstr("\ninst1|DATAPROVIDER|ASFS|\n"));
  EXPECT_THAT(shown("um_inst1"), HasSubstr("\nsample_load{"));
  EXPECT_FALSE(answers(home.port("um")));
}

TEST_F(DataAgent, ScriptsAloneAreCopiedAndNothingElseHappens) {
  const Outcome configured = vmqctl("set-da-config --script read_load.sh");
  EXPECT_EQ(configured.exit_code, 0) << configured.output;
  EXPECT_TRUE(fs::exists(folder("scripts/read_load.sh")));
  EXPECT_FALSE(answers(home.port("um")));
}

TEST_F(DataAgent, ModelWhoseScriptIsMissingIsNotImported) {
  const Outcome configured = vmqctl("set-da-config --model load.mdl");
  EXPECT_EQ(configured.exit_code, 1);
  EXPECT_THAT(configured.output, HasSubstr("VMQ1016E"));
  EXPECT_THAT(configured.output, HasSubstr("(parameters: load.mdl)"));
  EXPECT_THAT(daemon->log(), HasSubstr("um_console: there is no script " + folder("scripts/read_load.sh")));
}

// The old model is deleted before the new one is imported.
TEST_F(DataAgent, ModelThatCannotBeImportedAgainIsNotShownAnyMore) {
  ASSERT_EQ(vmqctl("set-da-config --model load.mdl --script read_load.sh").exit_code, 0);
  ASSERT_THAT(shown(), HasSubstr("\nsample_load{"));
  fs::remove(folder("scripts/read_load.sh"));
  EXPECT_EQ(vmqctl("set-da-config --model load.mdl").exit_code, 1);
  EXPECT_THAT(shown(), AllOf(HasSubstr("\nnode_"), Not(HasSubstr("sample_load"))));
}

TEST_F(DataAgent, WhatIsMissingIsNamed) {
  const struct {
    const char* typed;
    const char* id;
    std::string parameters;
  } cases[] = {
      {"--model gone.mdl", "VMQ1014E", "gone.mdl," + folder("metafiles")},
      {"--script gone.sh", "VMQ1015E", "gone.sh," + folder("scripts")},
      {"--model ../vmqd.conf", "VMQ1014E", "../vmqd.conf," + folder("metafiles")},
      {"--target inst9:node1:DA --model load.mdl", "VMQ1020E", (home / "config/um_inst9.config") + ",inst9"},
      {"--model read_load.sh", "VMQ1023E", "read_load.sh"},
  };
  for (const auto& missing : cases) {
    SCOPED_TRACE(missing.typed);
    const Outcome outcome = vmqctl("set-da-config " + std::string(missing.typed));
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.output, HasSubstr(missing.id));
    EXPECT_THAT(outcome.output, HasSubstr("(parameters: " + missing.parameters + ")"));
  }
}

}  // namespace
