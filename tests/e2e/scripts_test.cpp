// The scripts that a person runs first: what a test can say about them without installing packages and building.

#include <gmock/gmock.h>

#include <filesystem>
#include <regex>
#include <set>

#include "tests/e2e/shell.h"
#include "tests/support/temporary_directory.h"

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
  for (const char* wrong : {"", " dom_parser", " 0", " 00", " 5s"}) {
    const Outcome outcome = runShell(script + wrong);
    EXPECT_EQ(outcome.exit_code, 2) << wrong;
    EXPECT_EQ(outcome.output, help.output) << wrong;
  }
  const Outcome unknown = runShell(script + " 5 nothing");
  EXPECT_EQ(unknown.exit_code, 2);
  EXPECT_EQ(unknown.output, "there is no target nothing\n");
}

TEST(Scripts, BenchmarksTakeNoArguments) {
  const std::string script = quoted(VMQ_SOURCE_DIR "/scripts/bench");
  const Outcome help = runShell(script + " --help");
  EXPECT_EQ(help.exit_code, 0);
  EXPECT_THAT(help.output, testing::HasSubstr("scripts/bench"));
  for (const char* wrong : {" quick", " ''", " --help now"}) {
    const Outcome outcome = runShell(script + wrong);
    EXPECT_EQ(outcome.exit_code, 2) << wrong;
    EXPECT_EQ(outcome.output, help.output) << wrong;
  }
}

TEST(Scripts, AgentThatCannotBeFetchedIsTold) {
  const TemporaryDirectory directory;
  (void)directory.writeScript("bin/apt-get", "echo E: no network >&2; exit 100");
  (void)directory.writeScript("bin/sudo", "exec \"$@\"");
  // As on a machine where it is not installed.
  const Outcome outcome = runShell(
      "cd " + quoted(directory.path()) +
      " && sed 's|=/usr/bin/|=/none/|' " VMQ_SOURCE_DIR
      "/scripts/packages.sh >packages.sh && PATH=$PWD/bin:$PATH && . ./packages.sh && fetch_exporter $PWD/agent");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, testing::HasSubstr("E: no network\n"));
  EXPECT_THAT(outcome.output, testing::EndsWith("prometheus-node-exporter, the agent, cannot be downloaded\n"));
}

TEST(Installation, LinksOfItsDocumentsLeadSomewhere) {
  const TemporaryDirectory directory;
  const Outcome installed = runShell("cmake --install " VMQ_PROGRAMS "/.. --prefix " + quoted(directory.path()));
  ASSERT_EQ(installed.exit_code, 0) << installed.output;
  std::set<std::string> documents;
  for (const auto& entry : fs::recursive_directory_iterator(directory.path() / "share/doc")) {
    if (entry.path().extension() != ".md") continue;
    documents.insert(entry.path().filename());
    const std::string text = readWholeFile(entry.path());
    const std::regex link(R"(\]\(([^)#:]+)\))");
    for (std::sregex_iterator found(text.begin(), text.end(), link), end; found != end; ++found)
      EXPECT_TRUE(fs::exists(entry.path().parent_path() / (*found)[1].str())) << entry.path() << ": " << (*found)[1];
  }
  EXPECT_THAT(documents, testing::ElementsAre("SECURITY.md", "file-transfer.md", "messages.md", "trace.md", "vmqctl.md",
                                              "vmqd.md"));
}

}  // namespace
