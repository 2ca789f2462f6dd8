#include "tests/e2e/sample_home.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <thread>

#include "tests/e2e/loopback.h"

namespace fs = std::filesystem;

namespace {

/// Of a file of /proc, which may vanish at any time.
std::string contents(const fs::path& file) {
  std::ifstream stream(file, std::ios::binary);
  std::ostringstream text;
  text << stream.rdbuf();  // a read that fails ends it; stream iterators would throw
  return text.str();
}

}  // namespace

SampleHome::SampleHome() {
  if (access(VMQ_EXPORTER, X_OK) != 0) {
    ADD_FAILURE() << "there is no agent to start, \"" VMQ_EXPORTER
                     "\": run scripts/test, which fetches it, or configure with -DVMQ_EXPORTER=PATH";
  }
  fs::copy(VMQ_SOURCE_DIR "/examples/home", path(), fs::copy_options::recursive);
  // By a name in this home, so that the command line of each agent tells whose it is.
  const std::string program = *this / "prometheus-node-exporter";
  fs::create_symlink(VMQ_EXPORTER, program);
  EXPECT_EQ(runShell("sed -i 's|/opt/vmq-home|" + path() + "|' " + quoted(*this / "config/um.config")).exit_code, 0);
  for (const char* agent : {"ux", "ux_inst1", "um"}) {
    configure(agent, "PROGRAM=" + program);
    configure(agent, "PORT=" + std::to_string(freePort()));
  }
}

SampleHome::~SampleHome() {
  signalEveryProcessNaming(path(), SIGKILL);
  EXPECT_TRUE(soon([this] { return signalEveryProcessNaming(path(), 0) == 0; })) << "an agent outlives its test";
}

uint16_t SampleHome::port(const std::string& agent) const {
  std::ifstream file(*this / ("config/" + agent + ".config"));
  std::string port;
  for (std::string line; std::getline(file, line);)
    if (line.starts_with("PORT=")) port = line.substr(5);
  return static_cast<uint16_t>(std::stoi(port));
}

void SampleHome::configure(const std::string& agent, const std::string& line) const {
  std::ofstream(*this / ("config/" + agent + ".config"), std::ios::app) << line << "\n";
}

std::string SampleHome::writeProgram(const std::string& name, const std::string& body) const {
  return directory_.writeScript("home/" + name, body);
}

std::optional<pid_t> SampleHome::pid(const std::string& agent) const {
  std::ifstream file(*this / ("run/" + agent + ".pid"));
  pid_t pid = 0;
  if (!(file >> pid) || pid <= 1) return std::nullopt;
  return pid;
}

Outcome SampleHome::control(const std::string& arguments) const {
  return runShell(quoted(*this / "bin/CorvelAgent") + " -h " + quoted(path()) + " " + arguments);
}

void SampleHome::openToEveryUser() const {
  fs::permissions(directory_.path(), fs::perms(0755));
  fs::permissions(path(), fs::perms(0755));
  for (const char* folder : {"logs", "run"}) {
    fs::create_directories(*this / folder);
    fs::permissions(*this / folder, fs::perms(0777));
  }
  // The agent's program itself may lie where others may not go.
  const std::string program = *this / "prometheus-node-exporter";
  fs::remove(program);
  fs::copy_file(VMQ_EXPORTER, program);
}

bool isRunning(pid_t pid) {
  const std::string stat = contents("/proc/" + std::to_string(pid) + "/stat");
  const size_t state = stat.rfind(") ");
  return state != std::string::npos && stat[state + 2] != 'Z';
}

bool soon(const std::function<bool()>& question) {
  for (int tries = 0; tries < 3000; ++tries) {
    if (question()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
  return false;
}

unsigned signalEveryProcessNaming(const std::string& text, int signal) {
  if (text.find("/vmq-test-") == std::string::npos)
    throw std::invalid_argument("not in a temporary directory of a test: \"" + text + "\"");
  unsigned found = 0;
  for (const auto& entry : fs::directory_iterator("/proc")) {
    const std::string name = entry.path().filename();
    if (name.find_first_not_of("0123456789") != std::string::npos) continue;
    const pid_t pid = std::stoi(name);
    if (pid == getpid() || contents(entry.path() / "cmdline").find(text) == std::string::npos) continue;
    if (kill(pid, signal) == 0) ++found;
  }
  return found;
}
