#include "tasks/da_console.h"

#include <string>
#include <vector>

#include "tasks/da_config.h"
#include "util/corvel_home.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/da_console"};

std::vector<std::string> environmentOf(const DaConsoleSettings& settings) {
  return {"KUM_PRODSPEC_PATH=" + settings.meta_path.toNarrow() + "/", "KUMP_RB_PATH=" + settings.rb_path.toNarrow(),
          "KUMP_DPCONSOLE_PORT=" + settings.port.toNarrow(),
          "KUM_DP_HOSTNAME=" + getDaHostName(settings.managed_system_name).toNarrow(), "KUMP_DPCONSOLE_NOCONFIRM=Y"};
}

}  // namespace

DaConsole::DaConsole(const DaConsoleSettings& settings, const String& model)
    : model_path_(settings.meta_path + "/" + model), environment_(environmentOf(settings)) {
  const Trace trace(traceUnit);
  for (size_t i = 0; i < environment_.size(); ++i)
    TRACE_DETAIL(trace, "Environment variable %zu - %s", i + 1, environment_[i].c_str());
}

String DaConsole::commandLine(const char* command) const {
  return String(VMQ_CORVELHOME) + "/bin/um_console" + " " + "-h " + VMQ_CORVELHOME + " -c \"" + command + " " +
         model_path_ + "\"";
}

DaConsoleEnd DaConsole::run(const char* command, String& out) const {
  const Trace trace(traceUnit);
  std::vector<std::string> environment = environment_;
  std::vector<char*> entries;
  entries.reserve(environment.size() + 1);
  for (std::string& entry : environment) entries.push_back(entry.data());
  entries.push_back(nullptr);
  int exitCode = 0;
  String err;
  if (!Util::runCommandEnv(commandLine(command), entries.data(), exitCode, out, err, "", /*nonBlocking=*/false))
    return DaConsoleEnd::kNotStarted;
  return exitCode == 0 ? DaConsoleEnd::kFine : DaConsoleEnd::kBadReturnCode;
}
