// Where this installation is: its directories, found once from the environment, and the name of the host.
#include <sys/utsname.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <mutex>
#include <string>
#include <system_error>

#include "bss1.h"
#include "util/shell_word.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/installation"};

constexpr char homeVariable[] = "CORVELHOME";
constexpr char depotVariable[] = "QORDEPLOY_AGENTDEPOT";

// Read by the executor, by host threads and, at exit, by whichever of them still runs: never destroyed.
struct Directories {
  std::recursive_mutex lock;  // recursive: the depot is computed from the home
  String _homeDir;            // each empty until it has been computed
  String _configDir;
  String _agentDepotDir;
};

Directories& directories() {
  static Directories& kept = *new Directories;
  return kept;
}

// "/" alone becomes "//": rfind is blind at position 0, and both name the same directory.
void endWithSlash(String& dir) {
  if (dir.length() == 0 || dir.rfind('/') != dir.length() - 1) dir.append('/');
}

bool getDirectory(String& cached, bool (*initialize)(String&), String& dir) {
  if (cached.length() == 0 && !initialize(cached)) cached.clear();
  dir = cached;
  return dir.length() > 0;
}

bool readHomeVariable(const Trace& trace, String& home) {
  const char* const value = BSS1_GetEnv(homeVariable, nullptr);
  if (value == nullptr) {
    TRACE_ERROR(trace, "Environment variable %s, does not exist", homeVariable);
    return false;
  }
  home = String(value);
  home.trim();
  return true;
}

}  // namespace

bool Util::getCorvelHomeDir(String& dir) {
  const Trace trace(traceUnit);
  const std::lock_guard guard(directories().lock);
  return getDirectory(directories()._homeDir, initCorvelHomeDir, dir);
}

bool Util::getCorvelConfigDir(String& dir) {
  const Trace trace(traceUnit);
  const std::lock_guard guard(directories().lock);
  return getDirectory(directories()._configDir, initCorvelConfigDir, dir);
}

bool Util::getAgentDepotDir(String& dir) {
  const Trace trace(traceUnit);
  const std::lock_guard guard(directories().lock);
  return getDirectory(directories()._agentDepotDir, initAgentDepotDir, dir);
}

bool Util::initCorvelHomeDir(String& dir) {
  const Trace trace(traceUnit);
  dir.clear();
  String home;
  if (!readHomeVariable(trace, home)) return false;
  if (!pathExists(home)) {
    TRACE_ERROR(trace, "Corvel Home directory, %s, does not exist", home.c_str().get());
    return false;
  }
  endWithSlash(home);
  dir = home;
  return true;
}

bool Util::initCorvelConfigDir(String& dir) {
  const Trace trace(traceUnit);
  dir.clear();
  String config;
  if (!readHomeVariable(trace, config)) return false;
  endWithSlash(config);
  config.append(String("config/"));
  if (!pathExists(config)) {
    TRACE_ERROR(trace, "Corvel Config directory, %s, does not exist", config.c_str().get());
    return false;
  }
  dir = config;
  return true;
}

bool Util::initAgentDepotDir(String& dir) {
  const Trace trace(traceUnit);
  dir.clear();
  String depot;
  if (const char* const value = BSS1_GetEnv(depotVariable, nullptr)) {
    depot = String(value);
  } else {
    TRACE_DETAIL(trace, "Staging dir environment variable \"%s\" is not set", depotVariable);
    if (!getCorvelHomeDir(depot)) {
      TRACE_ERROR(trace, "CORVELHOME not set. No idea what to use as a staging dir");
      return false;
    }
  }
  if (!isPlainShellWord(depot)) {
    TRACE_ERROR(trace, "Agent depot dir [%s] is refused: white space and shell metacharacters are not allowed in it",
                depot.c_str().get());
    return false;
  }
  std::string path = depot.toNarrow();
  std::error_code ignored;  // what cannot be looked at is no directory
  if (!pathExists(depot) || !std::filesystem::is_directory(path, ignored)) {
    const int rc = createDir(path.data());
    if (rc != 0) {
      TRACE_ERROR(trace, "Failed to create staging dir %s Return Code was %i", depot.c_str().get(), rc);
      return false;
    }
    TRACE_DETAIL(trace, "Successfully created staging dir %s", depot.c_str().get());
  }
  endWithSlash(depot);
  TRACE_DETAIL(trace, "Agent depot dir is \"%s\"", depot.c_str().get());
  dir = depot;
  return true;
}

String Util::getHostName() {
  const Trace trace(traceUnit);
  struct utsname system;
  if (uname(&system) < 0) {
    TRACE_ERROR(trace, "No host name: %s", std::strerror(errno));
    return String();
  }
  String name(system.nodename);
  if (std::strstr(system.sysname, "HP-UX") != nullptr) {  // its node name may be cut
    char full[257];
    if (gethostname(full, sizeof full) == 0) {
      full[sizeof full - 1] = '\0';
      name = String(full);
    }
  }
  // The search for a character throws on an empty text.
  const unsigned dot = name.length() == 0 ? String::NPOS : name.find('.', 0U);
  if (dot != String::NPOS) name.erase(dot);
  return name;
}

void Util::TEST_forgetDirectories() {
  const std::lock_guard guard(directories().lock);
  directories()._homeDir.clear();
  directories()._configDir.clear();
  directories()._agentDepotDir.clear();
}

}  // namespace VMQ
