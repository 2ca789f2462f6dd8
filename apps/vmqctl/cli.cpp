// Reads the command line.

#include "apps/vmqctl/cli.h"

#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

/// --socket and -o: they may stand before the verb or behind it.
void addPlaceOptions(CLI::App& app, Settings& settings) {
  static const std::map<std::string, Format> formats = {{"table", Format::AsTable}, {"json", Format::AsJson}};
  app.add_option("--socket", settings.socket,
                 std::string("The daemon's socket (default: VMQ_SOCKET, else ") + defaultSocket + ")")
      ->type_name("PATH");
  app.add_option_function<std::string>(
         "-o,--output", [&settings](const std::string& name) { settings.format = formats.at(name); },
         "How to show data (default: table)")
      ->type_name("table|json")
      ->check(CLI::IsMember({"table", "json"}).description(""));
}

/// The verb that was typed, as its help is asked for.
std::string helpCommand(const CLI::App& app) {
  const auto typed = app.get_subcommands();
  return "vmqctl " + (typed.empty() ? "" : typed.front()->get_name() + " ") + "--help";
}

}  // namespace

const CLI::Validator notEmpty([](std::string& text) { return text.empty() ? "must not be empty" : std::string(); }, "");

void addCommonOptions(CLI::App& verb, Invocation& invocation, unsigned defaultTimeoutSeconds) {
  addPlaceOptions(verb, invocation.settings);
  verb.add_option(
          "--timeout", invocation.settings.timeoutSeconds,
          "How long to wait altogether; 0 for no limit (default: " + std::to_string(defaultTimeoutSeconds) + ")")
      ->type_name("SECONDS");
}

std::optional<std::string> parseCommandLine(int argc, const char* const* argv, CommandLine& result) {
  Invocation invocation;
  CLI::App app("Starts, stops, deploys, configures and lists the agents of this machine through the daemon vmqd.",
               "vmqctl");
  app.set_version_flag("--version", "vmqctl " VMQ_VERSION, "Print the version and end");
  app.set_help_flag("-h,--help", "Print this and end");
  app.require_subcommand(0, 1);  // none at all is told below, in words that fit a mistyped verb too
  addPlaceOptions(app, invocation.settings);
  for (const auto add :
       {addAgentVerbs, addPush, addDeploy, addProductVerbs, addInventory, addQuery, addWatch, addStatus}) {
    add(app, invocation);
  }
  app.footer(
      "Each verb has its own --help.\n"
      "Example:\n"
      "  vmqctl start ux\n"
      "Exit codes: 0 done, 1 failed, 2 usage, 4 not allowed, 6 timed out, 7 daemon not reachable, 130 interrupted.");
  try {
    app.parse(argc, argv);
  } catch (const CLI::CallForHelp&) {
    return app.help();  // the typed verb's, when there is one
  } catch (const CLI::CallForVersion& version) {
    return std::string(version.what()) + "\n";
  } catch (const CLI::ParseError& error) {
    std::string sentence = error.what();
    if (sentence.empty() || sentence.back() != '.') sentence += '.';
    throw Failure(ExitCode::Usage, sentence, "See " + helpCommand(app) + ".");
  }
  if (!invocation.action.run) throw Failure(ExitCode::Usage, "No verb is given.", "See vmqctl --help.");
  result = {invocation.settings, invocation.action};
  return std::nullopt;
}

}  // namespace vmqctl
