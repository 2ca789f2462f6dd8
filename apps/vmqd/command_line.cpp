// What vmqd is told on its command line.

#include "apps/vmqd/command_line.h"

#include <CLI/CLI.hpp>

#include "apps/vmqd/config.h"

namespace vmqd {
namespace {

std::string footer() {
  std::string text =
      "The configuration file holds lines \"key = value\"; a line that begins with # is a comment. Keys:\n";
  for (const auto& [name, help] : configurationKeys()) {
    text.append("  ").append(name).append(name.size() < 24 ? 24 - name.size() : 1, ' ').append(help).append("\n");
  }
  return text +
         "\nSIGTERM and SIGINT stop the daemon. Exit codes: 0 stopped as told, 2 wrong command line or configuration,\n"
         "1 anything else: another vmqd on the socket, a component that does not load, ...";
}

}  // namespace

std::optional<CommandLine> readCommandLine(int count, char** arguments, int* exit_code) {
  CommandLine result;
  CLI::App app("Runs the remote-deployment component and serves it, as HTTP on a Unix socket, in the foreground.",
               "vmqd");
  app.add_option("--config", result.config, "Configuration file")->required()->type_name("FILE");
  app.add_flag("--check", result.check, "Check the configuration and exit");
  app.set_version_flag("--version", "vmqd " VMQ_VERSION, "Print the version and exit");
  app.set_help_flag("-h,--help", "Print this help and exit");
  app.footer(footer());
  try {
    app.parse(count, arguments);
    return result;
  } catch (const CLI::ParseError& ending) {
    *exit_code = app.exit(ending) == 0 ? 0 : exitUsage;
    return std::nullopt;
  }
}

}  // namespace vmqd
