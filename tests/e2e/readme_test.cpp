// The session of README.md, typed as it stands there; what stands under it is what comes.

#include <gmock/gmock.h>
#include <signal.h>

#include <filesystem>
#include <fstream>
#include <regex>
#include <set>
#include <sstream>
#include <vector>

#include "tests/e2e/loopback.h"
#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;

/// The blocks marked "console" of a page.
struct Session {
  std::string typed;               ///< with ">" lines joined to theirs
  std::vector<std::string> shown;  ///< the lines under what is typed, but for empty ones
};

Session sessionOf(const std::string& page) {
  std::istringstream lines(page);
  Session session;
  bool inside = false;
  for (std::string line; std::getline(lines, line);) {
    if (line.starts_with("```")) {
      inside = line == "```console";
    } else if (inside && (line.starts_with("$ ") || line.starts_with("> "))) {
      session.typed += line.substr(2) + "\n";
    } else if (inside && !line.empty()) {
      session.shown.push_back(line);
    }
  }
  return session;
}

/// The line without what differs from one run to the next.
std::string lasting(std::string line) {
  const std::pair<const char*, const char*> changes[] = {
      {R"([^ ="]*/tmp\.\w{10})", "$$H"},
      {R"(vmqctl-\d{8}T\d{6}Z-[0-9a-f]{16})", "ID"},
      {R"(^((node_load1|sample_load\{.*\}) ).*)", "$1N"},
      {R"(^uptime .*)", "uptime N"},
      {R"(\(\d+ MiB\))", "(N MiB)"},
      {R"( Linux +\w+ )", " Linux ARCH "},
      {" +", " "},
  };
  for (const auto& [pattern, replacement] : changes) line = std::regex_replace(line, std::regex(pattern), replacement);
  return line;
}

/// Replaces the one place where the text holds `from`.
void replace(std::string& text, const std::string& from, const std::string& to) {
  const size_t place = text.find(from);
  ASSERT_NE(place, std::string::npos) << from << " is not in\n" << text;
  text.replace(place, from.size(), to);
}

/// A folder that looks like the source tree after scripts/demo, with agents on ports that are free.
class Readme : public testing::Test {
 protected:
  Readme() {
    for (const char* folder : {"build/demo", "build/exporter/usr/bin", "examples"})
      fs::create_directories(tree / folder);
    fs::create_directory_symlink(VMQ_PROGRAMS, tree / "build/demo/bin");
    fs::create_symlink(home / "prometheus-node-exporter", tree / "build/exporter/usr/bin/prometheus-node-exporter");
    for (const char* folder : {"scripts", "examples/bundles"})
      fs::create_directory_symlink(fs::path(VMQ_SOURCE_DIR) / folder, tree / folder);
    fs::copy(VMQ_SOURCE_DIR "/examples/home", tree / "examples/home", fs::copy_options::recursive);
    for (const auto& [agent, port, free] : ports) {
      const std::string file = tree / ("examples/home/config/" + std::string(agent) + ".config");
      std::string configuration = readWholeFile(file);
      replace(configuration, std::string("PORT=") + port, "PORT=" + free);
      std::ofstream(file) << configuration;
    }
  }

  ~Readme() override { EXPECT_EQ(signalEveryProcessNaming(tree.path(), SIGKILL), 0U) << "something was still running"; }

  const struct {
    const char* agent;
    const char* port;
    std::string free;
  } ports[3] = {{"ux", "19100", std::to_string(freePort())},
                {"ux_inst1", "19101", std::to_string(freePort())},
                {"um", "19110", std::to_string(freePort())}};
  const SampleHome home;
  const TemporaryDirectory tree;
};

TEST_F(Readme, SessionDoesWhatItShows) {
  auto [typed, shown] = sessionOf(readWholeFile(VMQ_SOURCE_DIR "/README.md"));
  ASSERT_GT(shown.size(), 50U);
  for (const auto& [agent, port, free] : ports)
    typed = std::regex_replace(typed, std::regex(std::string(":") + port + "/"), ":" + free + "/");
  replace(typed, "\"home = $H/home\"", "\"home = $H/home\" \"library = " VMQ_HURRIED_COMPONENT "\"");
  // A person takes longer to type than the daemon to listen, clients to watch, and events and exit codes to come.
  replace(typed, "vmqd.conf &\n",
          "vmqd.conf &\nuntil vmqctl status --socket $H/sock >$H/status 2>&1; do sleep 0.1; done\n");
  replace(typed, "TRANSID=t1' &\n",
          "TRANSID=t1' > >(tee $H/stream) &\nuntil grep -qs open $H/stream; do sleep 0.1; done\n");
  replace(typed, "\"PRODUCT\": \"ux\"}}'; echo\n",
          "\"PRODUCT\": \"ux\"}}'; echo\nuntil grep -q RETVAL $H/stream; do sleep 0.1; done\n");
  replace(typed, "vmqctl complete-install\n",
          "until [ -s $H/depot/rc.txt ]; do sleep 0.1; done\nvmqctl complete-install\n");
  replace(typed, "watch t2 --count 1 2>/dev/null &\n",
          "watch t2 --count 1 2>$H/watching & event=$!\nuntil grep -qs watching $H/watching; do sleep 0.1; done\n");
  replace(typed, "t2 --no-wait\n", "t2 --no-wait\nwait $event\n");
  std::ofstream(tree / "session") << typed;

  const Outcome outcome =
      runShell("cd " + quoted(tree.path()) + " && TMPDIR=" + quoted(tree.path()) + " bash ./session");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  std::set<std::string> came;
  std::istringstream lines(outcome.output);
  for (std::string line; std::getline(lines, line);) {
    for (const auto& [agent, port, free] : ports)
      line = std::regex_replace(line, std::regex("=" + free + "$"), "=" + std::string(port));
    came.insert(lasting(line));
  }
  for (const std::string& line : shown)
    EXPECT_TRUE(came.contains(lasting(line))) << line << "\nis not in\n" << outcome.output;
}

}  // namespace
