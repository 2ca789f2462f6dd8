#pragma once
// The data agent's console program, which knows the type of a model and replaces models in the running agent.

#include <string>
#include <vector>

#include "util/string.h"

/// What the console needs to know beside its command.
struct DaConsoleSettings {
  VMQ::String meta_path;  ///< directory of model files, without a separator at its end
  VMQ::String rb_path;
  VMQ::String port;  ///< empty: the console's own default
  VMQ::String managed_system_name;
};

/// The three ways in which a console command can end.
enum class DaConsoleEnd { kNotStarted, kBadReturnCode, kFine };

/// Runs console commands on one model. For one thread.
class DaConsole {
 public:
  DaConsole(const DaConsoleSettings& settings, const VMQ::String& model);

  /// The command line for a console command such as "getdptype".
  [[nodiscard]] VMQ::String commandLine(const char* command) const;

  /// Runs it; `out` receives its standard output.
  DaConsoleEnd run(const char* command, VMQ::String& out) const;

 private:
  const VMQ::String model_path_;
  const std::vector<std::string> environment_;
};
