// Reads the command line.

#include "apps/vmqctl/cli.h"

#include <climits>

#include "apps/vmqctl/commands/verbs.h"

namespace vmqctl {
namespace {

/// --socket and -o: they may stand before the verb or behind it.
void addPlaceOptions(Verb& verb, Settings& settings, std::string& format) {
  verb.text("--socket PATH", settings.socket,
            std::string("The daemon's socket (default: VMQ_SOCKET, else ") + defaultSocket + ")");
  verb.text("-o,--output table|json", format, "How to show data (default: table)").check([](const std::string& name) {
    return name == "table" || name == "json" ? "" : name + " not in {table,json}";
  });
}

}  // namespace

std::optional<std::string> parseCommandLine(int argc, const char* const* argv, Invocation& result) {
  CommandLine line("vmqctl", "vmqctl " VMQ_VERSION,
                   "Starts, stops, deploys, configures and lists the agents of this machine through the daemon vmqd.");
  std::string format = "table";
  addPlaceOptions(line.common(), result.settings, format);
  line.common().footer(
      "Each verb has its own --help.\n"
      "Example:\n"
      "  vmqctl start ux\n"
      "Exit codes: 0 done, 1 failed, 2 usage, 4 not allowed, 6 timed out, 7 daemon not reachable, 130 interrupted.");

  Verbs verbs(line);
  for (const auto add :
       {addAgentVerbs, addPush, addDeploy, addProductVerbs, addInventory, addQuery, addWatch, addStatus}) {
    add(verbs);
  }
  for (DeclaredVerb& each : verbs.all()) {
    addPlaceOptions(each.verb, result.settings, format);
    each.verb.number(
        "--timeout SECONDS", result.settings.timeoutSeconds, {0, UINT_MAX, " of seconds"},
        "How long to wait altogether; 0 for no limit (default: " + std::to_string(each.defaultTimeoutSeconds) + ")");
  }
  if (std::optional<std::string> text = line.parse(argc, argv)) return text;

  result.settings.format = format == "json" ? Format::AsJson : Format::AsTable;
  const DeclaredVerb& typed = verbs.named(line.typedVerb());
  result.defaultTimeoutSeconds = typed.defaultTimeoutSeconds;
  result.action = typed.prepare();
  return std::nullopt;
}

}  // namespace vmqctl
