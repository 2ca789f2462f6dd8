// The depot of the management server's tables.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <filesystem>
#include <string>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"
#include "util/util.h"

namespace fs = std::filesystem;
using VMQ::String;
using VMQ::Util;

namespace {

constexpr bool packages = true;
constexpr bool create = true;

class DepotHomeTest : public testing::Test {
 protected:
  DepotHomeTest() { kmsenv("default|CELLNAME|\nRMS1|CELLNAME|more\nRMS1|OTHER|x\n"); }

  void kmsenv(const std::string& text) const { directory_.writeFile("config/.ConfigData/kmsenv", text); }
  void kbbenv(const std::string& text) const { directory_.writeFile("tables/RMS1/KBBENV", text); }

  // The depot; "(failed)" when there is none, and then the home given must be untouched.
  std::string ask(bool append_packages = !packages, bool create_missing = create) {
    String home(home_.c_str());
    if (Util::getDepotHome(home, append_packages, create_missing) == 0) return home.toNarrow();
    EXPECT_EQ(home.toNarrow(), home_);
    return "(failed)";
  }

  TemporaryDirectory directory_;
  const std::string home_ = directory_ / "";
  const std::string default_ = home_ + "tables/RMS1/depot";
  TEST_TraceCapture trace_;
};

TEST_F(DepotHomeTest, ServersFileNamesIt) {
  kbbenv("*DEPOTHOME=/no\nOTHER=1\nDEPOTHOME = " + home_ + "else\n");
  EXPECT_EQ(ask(), home_ + "else");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Running command: /bin/sh -c \"grep CELLNAME " + home_ +
                                          "config/.ConfigData/kmsenv | grep -v default\""));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "RMS name found: RMS1"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Depot home is: " + home_ + "else"));
}

TEST_F(DepotHomeTest, FileWithoutTheValueMeansTheDefault) {
  for (const char* const text : {"OTHER=1\n", "", "*DEPOTHOME=/no", "DEPOTHOME=\n"}) {
    SCOPED_TRACE(text);
    trace_.clear();
    kbbenv(text);
    EXPECT_EQ(ask(), default_);
    EXPECT_TRUE(trace_.has(RAS1_DETAIL, "No DEPOTHOME in KBBENV, defaulting DEPOTHOME to " + default_));
  }
}

TEST_F(DepotHomeTest, NoFileMeansTheDefault) {
  EXPECT_EQ(ask(), default_);
  EXPECT_TRUE(
      trace_.has(RAS1_DETAIL, "Can't find " + home_ + "tables/RMS1/KBBENV, defaulting DEPOTHOME to " + default_));
}

TEST_F(DepotHomeTest, FirstOfSeveralServersCounts) {
  kmsenv("RMS2|CELLNAME|\nRMS1|CELLNAME|\n");
  EXPECT_EQ(ask(), home_ + "tables/RMS2/depot");
}

TEST_F(DepotHomeTest, PackagesAreAppendedWhenAskedFor) {
  EXPECT_EQ(ask(packages), default_ + "/PACKAGES/");
  EXPECT_TRUE(fs::is_directory(default_ + "/PACKAGES"));
}

TEST_F(DepotHomeTest, MissingDirectoryIsCreatedWhenAskedFor) {
  EXPECT_EQ(ask(), default_);
  EXPECT_TRUE(fs::is_directory(default_));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Path [" + default_ + "] does not exist, attempting to create"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Depot directory [" + default_ + "] created"));
}

TEST_F(DepotHomeTest, DirectoryThatExistsNeedsNoCreation) {
  fs::create_directories(default_);
  EXPECT_EQ(ask(!packages, !create), default_);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::IsEmpty());
}

TEST_F(DepotHomeTest, MissingDirectoryIsAFailureOtherwise) {
  EXPECT_EQ(ask(!packages, !create), "(failed)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Path [" + default_ + "] does not exist"));
  EXPECT_FALSE(fs::exists(default_));
}

TEST_F(DepotHomeTest, DirectoryThatCannotBeCreatedIsAFailure) {
  directory_.writeFile("file", "");
  kbbenv("DEPOTHOME=" + home_ + "file/depot");
  EXPECT_EQ(ask(), "(failed)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Could not create depot dir [" + home_ + "file/depot]"));
}

TEST_F(DepotHomeTest, CommandThatCannotBeStartedIsAFailure) {
  (void)ask();  // sanitizers need descriptors of their own when they see a type for the first time
  rlimit before{};
  ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &before), 0);
  rlimit none = before;
  none.rlim_cur = 3;  // no room for the pipes
  ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &none), 0);
  const std::string answer = ask();
  ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &before), 0);
  EXPECT_EQ(answer, "(failed)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Unable to determine RMS name, process failed to start"));
}

TEST_F(DepotHomeTest, CommandThatFindsNothingIsAFailure) {
  kmsenv("default|CELLNAME|\n");
  EXPECT_EQ(ask(), "(failed)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error running command, retCode = 1"));
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error message is: "));
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Unable to determine RMS name, error running command"));
}

TEST_F(DepotHomeTest, MissingSettingsAreAFailureThatSaysWhy) {
  fs::remove_all(home_ + "config");
  EXPECT_EQ(ask(), "(failed)");
  EXPECT_TRUE(trace_.hasPrefix(RAS1_ERROR, "Error message is: grep: " + home_ + "config/.ConfigData/kmsenv: "));
}

TEST_F(DepotHomeTest, AnswerWithoutAServersNameIsAFailure) {
  for (const std::string text : {"CELLNAME without a separator\n", "|CELLNAME|\n"}) {
    SCOPED_TRACE(text);
    trace_.clear();
    kmsenv(text);
    EXPECT_EQ(ask(), "(failed)");
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "Unable to determine RMS name from kmsenv, stdout=[" + text + "]"));
  }
}

TEST_F(DepotHomeTest, FileThatCannotBeReadIsAFailureBecauseTheDefaultWouldBeAGuess) {
  fs::create_directories(home_ + "tables/RMS1/KBBENV");
  EXPECT_EQ(ask(), "(failed)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Unable to read file: " + home_ + "tables/RMS1/KBBENV"));
  EXPECT_FALSE(fs::exists(default_));
}

TEST_F(DepotHomeTest, NothingIsLeftBehind) {
  (void)ask();
  const ProcessResources before = ProcessResources::now();
  (void)ask();
  EXPECT_EQ(ProcessResources::now(), before);
}

}  // namespace
