// The scripts that a person runs first: what a test can say about them without installing packages and building.

#include <gmock/gmock.h>

#include <filesystem>

#include "tests/e2e/shell.h"

namespace {

namespace fs = std::filesystem;

TEST(Scripts, EachOneIsWellFormedShellAndRunsFromAnywhere) {
  unsigned seen = 0;
  for (const char* folder : {"scripts", ".ci", "examples/home/bin", "examples/home/zlpqor6/lx8266/bin",
                             "examples/bundles", "examples/bundles/ux/010100000", "examples/bundles/um"}) {
    for (const auto& entry : fs::directory_iterator(fs::path(VMQ_SOURCE_DIR) / folder)) {
      const std::string script = entry.path();
      if (entry.is_directory() || script.ends_with(".md") || script.ends_with(".txt") || script.ends_with(".mdl"))
        continue;
      const bool is_sourced = script.ends_with("packages.sh") || script.ends_with(".shl");
      EXPECT_EQ(runShell("tr -d '\\r' <" + quoted(script) + " | /bin/sh -n").output, "") << script;
      EXPECT_EQ(fs::status(script).permissions() & fs::perms::owner_exec,
                is_sourced ? fs::perms::none : fs::perms::owner_exec)
          << script;
      ++seen;
    }
  }
  EXPECT_GE(seen, 10U);
}

TEST(Scripts, HelpOfTheTestCommandIsWhatStandsInIt) {
  const Outcome outcome = runShell("cd / && " + quoted(VMQ_SOURCE_DIR "/scripts/test") + " --help");
  EXPECT_EQ(outcome.exit_code, 0);
  EXPECT_THAT(outcome.output, testing::StartsWith("Installs what the tests need"));
  EXPECT_THAT(outcome.output, testing::HasSubstr("scripts/test [PRESET...]"));
}

TEST(Scripts, FuzzingSaysHowItIsUsedAndKnowsItsTargets) {
  const std::string script = quoted(VMQ_SOURCE_DIR "/scripts/fuzz");
  const Outcome help = runShell("cd / && " + script + " --help");
  EXPECT_EQ(help.exit_code, 0);
  EXPECT_THAT(help.output, testing::HasSubstr("scripts/fuzz SECONDS [TARGET...]"));
  for (const char* wrong : {"", " dom_parser", " 0", " 5s"}) {
    const Outcome outcome = runShell(script + wrong);
    EXPECT_EQ(outcome.exit_code, 2) << wrong;
    EXPECT_EQ(outcome.output, help.output) << wrong;
  }
  const Outcome unknown = runShell(script + " 5 nothing");
  EXPECT_EQ(unknown.exit_code, 2);
  EXPECT_EQ(unknown.output, "there is no target nothing\n");
}

}  // namespace
