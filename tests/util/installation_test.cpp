// The directories of an installation.
#include <gtest/gtest.h>

#include <filesystem>
#include <thread>
#include <vector>

#include "test_seam.h"
#include "tests/support/scoped_locale.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"
#include "util/util.h"

namespace fs = std::filesystem;
using VMQ::String;
using VMQ::Util;

namespace {

class InstallationTest : public testing::Test {
 protected:
  InstallationTest() { Util::TEST_forgetDirectories(); }
  ~InstallationTest() override { Util::TEST_forgetDirectories(); }

  TemporaryDirectory directory_;
  const std::string path_ = directory_.path().string();
  ScopedVariable home_{"CORVELHOME", std::nullopt};
  ScopedVariable depot_{"QORDEPLOY_AGENTDEPOT", std::nullopt};
  String result_{"before"};
  TEST_TraceCapture trace_;
};

// ---- home ----------------------------------------------------------------------------------------------------------

TEST_F(InstallationTest, HomeEndsWithASlash) {
  home_.put(path_);
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
}

TEST_F(InstallationTest, HomeThatEndsWithASlashStaysAsItIs) {
  home_.put(path_ + "/");
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
}

TEST_F(InstallationTest, HomeIsTrimmed) {
  home_.put("  " + path_ + "\t ");
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
}

TEST_F(InstallationTest, RootAsHomeBecomesTwoSlashes) {
  home_.put("/");
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), "//");
}

TEST_F(InstallationTest, HomeIsKeptOnceFound) {
  home_.put(path_);
  ASSERT_TRUE(Util::getCorvelHomeDir(result_));
  home_.put("/elsewhere");
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
}

TEST_F(InstallationTest, PathWithCharactersOfSeveralBytesIsNotCut) {
  const ScopedLocale utf8("C.UTF-8");
  const std::string name = directory_ / "\xE2\x82\xAC\xE2\x82\xAC";
  home_.put(name);
  depot_.put(name);
  EXPECT_TRUE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), name + "/");
  EXPECT_TRUE(fs::is_directory(name));
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), name + "/");
}

TEST_F(InstallationTest, UnsetHomeIsAFailureThatIsTriedAgain) {
  EXPECT_FALSE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Environment variable CORVELHOME, does not exist"));
  EXPECT_FALSE(Util::getCorvelHomeDir(result_));
  home_.put(path_);
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
}

TEST_F(InstallationTest, MissingHomeIsAFailureThatIsTriedAgain) {
  home_.put(directory_ / "later");
  EXPECT_FALSE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Corvel Home directory, " + path_ + "/later, does not exist"));
  fs::create_directory(directory_ / "later");
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/later/");
}

TEST_F(InstallationTest, BlankHomeIsAFailure) {
  for (const char* const value : {"", "   "}) {
    home_.put(value);
    EXPECT_FALSE(Util::getCorvelHomeDir(result_));
    EXPECT_EQ(result_.toNarrow(), "");
  }
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Corvel Home directory, , does not exist"));
}

// ---- config --------------------------------------------------------------------------------------------------------

TEST_F(InstallationTest, ConfigStandsInTheHome) {
  fs::create_directory(directory_ / "config");
  for (const char* const ending : {"", "/"}) {
    Util::TEST_forgetDirectories();
    home_.put(path_ + ending);
    EXPECT_TRUE(Util::getCorvelConfigDir(result_));
    EXPECT_EQ(result_.toNarrow(), path_ + "/config/");
  }
}

TEST_F(InstallationTest, ConfigWithoutHomeIsAFailure) {
  EXPECT_FALSE(Util::getCorvelConfigDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Environment variable CORVELHOME, does not exist"));
}

TEST_F(InstallationTest, MissingConfigIsAFailureThatIsTriedAgain) {
  home_.put(path_);
  EXPECT_FALSE(Util::getCorvelConfigDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Corvel Config directory, " + path_ + "/config/, does not exist"));
  fs::create_directory(directory_ / "config");
  EXPECT_TRUE(Util::getCorvelConfigDir(result_));
}

// ---- depot ---------------------------------------------------------------------------------------------------------

TEST_F(InstallationTest, DepotIsTheHomeUnlessNamed) {
  home_.put(path_);
  EXPECT_TRUE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Staging dir environment variable \"QORDEPLOY_AGENTDEPOT\" is not set"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Agent depot dir is \"" + path_ + "/\""));
}

TEST_F(InstallationTest, NamedDepotThatExistsIsUsed) {
  fs::create_directory(directory_ / "depot");
  depot_.put(directory_ / "depot");
  EXPECT_TRUE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/depot/");
  EXPECT_FALSE(trace_.hasPrefix(RAS1_DETAIL, "Successfully created staging dir"));
}

TEST_F(InstallationTest, NamedDepotThatIsMissingIsCreated) {
  depot_.put(directory_ / "new/depot");
  EXPECT_TRUE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), path_ + "/new/depot/");
  EXPECT_TRUE(fs::is_directory(directory_ / "new/depot"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Successfully created staging dir " + path_ + "/new/depot"));
}

TEST_F(InstallationTest, DepotWithoutHomeAndNameIsAFailure) {
  EXPECT_FALSE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "CORVELHOME not set. No idea what to use as a staging dir"));
}

TEST_F(InstallationTest, DepotThatCannotBeCreatedIsAFailureThatIsTriedAgain) {
  directory_.writeFile("file", "");
  depot_.put(directory_ / "file/depot");
  EXPECT_FALSE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(
      RAS1_ERROR, "Failed to create staging dir " + path_ + "/file/depot Return Code was " + std::to_string(EEXIST)));
  fs::remove(directory_ / "file");
  EXPECT_TRUE(Util::getAgentDepotDir(result_));
}

TEST_F(InstallationTest, FileInTheDepotsPlaceIsAFailure) {
  directory_.writeFile("depot", "");
  depot_.put(directory_ / "depot");
  EXPECT_FALSE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.hasPrefix(RAS1_ERROR, "Failed to create staging dir " + path_ + "/depot Return Code was "));
}

TEST_F(InstallationTest, EmptyDepotNameIsAFailure) {
  depot_.put("");
  EXPECT_FALSE(Util::getAgentDepotDir(result_));
  EXPECT_EQ(result_.toNarrow(), "");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to create staging dir  Return Code was -1"));
}

TEST_F(InstallationTest, DepotThatAShellWouldTakeApartIsRefusedBeforeItIsCreated) {
  for (const char* const name : {"a b", "a\tb", "a\nb", "a;b", "a$b",  "a`b", "a&b", "a|b", "a*", "a?",
                                 "(a)", "<a>",  "a'",   "a\"", "a\\b", "[a]", "{a}", "!a",  "~a", "#a"}) {
    SCOPED_TRACE(name);
    trace_.clear();
    depot_.put(directory_ / name);
    EXPECT_FALSE(Util::getAgentDepotDir(result_));
    EXPECT_EQ(result_.toNarrow(), "");
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "Agent depot dir [" + directory_ / name +
                                           "] is refused: white space and shell metacharacters are not allowed in it"));
  }
  EXPECT_TRUE(fs::is_empty(directory_.path()));
}

TEST_F(InstallationTest, HomeThatAShellWouldTakeApartIsNoDepot) {
  fs::create_directory(directory_ / "my home");
  home_.put(directory_ / "my home");
  EXPECT_FALSE(Util::getAgentDepotDir(result_));
  EXPECT_TRUE(Util::getCorvelHomeDir(result_));
}

// ---- together ------------------------------------------------------------------------------------------------------

TEST_F(InstallationTest, ManyThreadsMayAskAtOnce) {
  fs::create_directory(directory_ / "config");
  home_.put(path_);
  ASSERT_TRUE(Util::pathExists(String("/")));  // the first conversion of text belongs to one thread
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([this] {
      String home, config, depot;
      for (int round = 0; round < 50; ++round) {
        EXPECT_TRUE(Util::getAgentDepotDir(depot));
        EXPECT_TRUE(Util::getCorvelConfigDir(config));
        EXPECT_TRUE(Util::getCorvelHomeDir(home));
        EXPECT_EQ(depot.toNarrow(), path_ + "/");
        EXPECT_EQ(config.toNarrow(), path_ + "/config/");
        EXPECT_EQ(home.toNarrow(), path_ + "/");
        Util::TEST_forgetDirectories();
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
}

}  // namespace
