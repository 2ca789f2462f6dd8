// The session of README.md, typed as it stands there.

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

/// What is typed in the blocks marked "console", with ">" lines joined to theirs.
std::string typedCommands(const std::string& page) {
  std::istringstream lines(page);
  std::string typed;
  bool inside = false;
  for (std::string line; std::getline(lines, line);) {
    if (line.starts_with("```")) inside = line == "```console";
    if (inside && (line.starts_with("$ ") || line.starts_with("> "))) typed += line.substr(2) + "\n";
  }
  return typed;
}

/// Replaces the one place where the text holds `from`.
void replace(std::string& text, const std::string& from, const std::string& to) {
  const size_t place = text.find(from);
  ASSERT_NE(place, std::string::npos) << from << " is not in\n" << text;
  text.replace(place, from.size(), to);
}

TEST(Readme, SessionDoesWhatItShows) {
  // A folder that looks like the source tree after scripts/demo; the home is on a port that is free.
  const SampleHome home;
  const TemporaryDirectory tree;
  fs::create_directories(tree / "build/demo");
  fs::create_directories(tree / "build/exporter/usr/bin");
  fs::create_directories(tree / "examples");
  fs::create_directory_symlink(VMQ_PROGRAMS, tree / "build/demo/bin");
  fs::create_symlink(home / "prometheus-node-exporter", tree / "build/exporter/usr/bin/prometheus-node-exporter");
  fs::copy(home.path(), tree / "examples/home", fs::copy_options::recursive);
  const std::string port = std::to_string(home.port("ux"));

  std::string typed = typedCommands(readWholeFile(VMQ_SOURCE_DIR "/README.md"));
  replace(typed, ":19100/", ":" + port + "/");
  // A person takes longer to type than the daemon to listen, curl to watch, and an event to come.
  replace(typed, "vmqd.conf &\n",
          "vmqd.conf &\nuntil vmqctl status --socket $H/sock >$H/status 2>&1; do sleep 0.1; done\n");
  replace(typed, "TRANSID=t1' &\n",
          "TRANSID=t1' &\nvmqctl watch t1 --count 1 & event=$!\n"
          "until vmqctl status | grep -q 'watchers  *2$'; do sleep 0.1; done\n");
  replace(typed, "\"PRODUCT\": \"ux\"}}'\n", "\"PRODUCT\": \"ux\"}}'\nwait $event\n");
  std::ofstream(tree / "session") << typed;

  const Outcome outcome =
      runShell("cd " + quoted(tree.path()) + " && TMPDIR=" + quoted(tree.path()) + " bash ./session");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  for (const char* shown :
       {"vmqd: version ", "START    ux ", "  done         0\n", "\nnode_load1 ",
        "event: open\ndata: {\"table\":\"KAGDYST\"}\n", R"({"table":"KAGREQT","rows":[{)",
        R"("TRANSID":"t1","COMMAND":"START","RETVAL":0,"RETMSGID":"","RETMSGPARM":"","TARGETMSN":""})",
        "Unix host agent", "failed    1024  VMQ1024E\n", "vmqctl: STOP of lz failed: VMQ1024E The agent control script",
        "vmqd: stopped\n"})
    EXPECT_THAT(outcome.output, HasSubstr(shown));
  EXPECT_EQ(signalEveryProcessNaming(tree.path(), 0), 0U) << "something is still running";
}

}  // namespace
