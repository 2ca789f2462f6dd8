// Where Java is.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"
#include "util/util.h"

namespace fs = std::filesystem;
using VMQ::String;
using VMQ::Util;

namespace {

class JavaHomeTest : public testing::Test {
 protected:
  JavaHomeTest() { fs::create_directory(java_); }

  // The answer for this home; "(false)" when there is none.
  std::string ask() {
    String java_home("before");
    const bool found = Util::getJavaHome(String(home_.path().c_str()), java_home);
    EXPECT_EQ(found, java_home.length() > 0);
    return found ? java_home.toNarrow() : "(false)";
  }
  void script(const std::string& body) const { home_.writeScript("bin/CorvelGetJavaHome", body); }

  TemporaryDirectory home_;
  const std::string script_ = home_ / "bin/CorvelGetJavaHome";
  const std::string java_ = home_ / "java";
  ScopedVariable variable_{"JAVA_HOME", std::nullopt};
  TEST_TraceCapture trace_;
};

TEST_F(JavaHomeTest, ScriptNamesIt) {
  script("echo /opt/java");
  EXPECT_EQ(ask(), "/opt/java");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "JavaHome location script is [" + script_ + "]"));
}

TEST_F(JavaHomeTest, OnlyTheFirstLineCounts) {
  script("printf '/opt/java\\r\\nmore\\n'");
  EXPECT_EQ(ask(), "/opt/java");
}

TEST_F(JavaHomeTest, ScriptComesBeforeTheEnvironment) {
  script("echo /opt/java");
  variable_.put(java_);
  EXPECT_EQ(ask(), "/opt/java");
}

TEST_F(JavaHomeTest, WithoutAScriptTheEnvironmentNamesIt) {
  variable_.put(java_);
  EXPECT_EQ(ask(), java_);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "The JavaHome location script [" + script_ + "] was not found"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Found a valid Java location in JAVA_HOME: \"" + java_ + "\"\n"));
}

TEST_F(JavaHomeTest, DirectoryInTheScriptsPlaceIsNoScript) {
  fs::create_directories(script_);
  variable_.put(java_);
  EXPECT_EQ(ask(), java_);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "The JavaHome location script [" + script_ + "] was not found"));
}

TEST_F(JavaHomeTest, ScriptWithoutAnAnswerLeavesItToTheEnvironment) {
  variable_.put(java_);
  for (const char* const body : {":", "echo", "printf '\\r\\n'", "printf '\\n/opt/java\\n'", "echo /opt/java; exit 3",
                                 "echo only this >&2", "kill -9 $$"}) {
    SCOPED_TRACE(body);
    trace_.clear();
    script(body);
    EXPECT_EQ(ask(), java_);
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "The JavaHome script [" + script_ + "] failed or returned no value"));
  }
}

TEST_F(JavaHomeTest, ScriptThatCannotBeStartedLeavesItToTheEnvironment) {
  home_.writeFile("bin/CorvelGetJavaHome", "not executable");
  variable_.put(java_);
  EXPECT_EQ(ask(), java_);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "The JavaHome script [" + script_ + "] failed or returned no value"));
}

TEST_F(JavaHomeTest, UnsetEnvironmentGivesNothing) {
  EXPECT_EQ(ask(), "(false)");
  EXPECT_TRUE(trace_.has(RAS1_ERROR,
                         "Checked for a Java location in JAVA_HOME, but that variable is not set in the environment."));
}

TEST_F(JavaHomeTest, EnvironmentThatNamesNoDirectoryGivesNothing) {
  for (const std::string& value : {std::string(), home_ / "none", home_.writeFile("file", "")}) {
    SCOPED_TRACE(value);
    trace_.clear();
    variable_.put(value);
    EXPECT_EQ(ask(), "(false)");
    EXPECT_TRUE(trace_.has(RAS1_ERROR,
                           "The JAVA_HOME variable is set in the environment, but does not appear to reference a valid "
                           "Java location."));
  }
}

TEST_F(JavaHomeTest, NothingIsLeftBehind) {
  script("echo /opt/java");
  (void)ask();
  const ProcessResources before = ProcessResources::now();
  (void)ask();
  EXPECT_EQ(ProcessResources::now(), before);
}

}  // namespace
