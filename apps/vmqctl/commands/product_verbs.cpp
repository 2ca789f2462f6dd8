// install, complete-install, uninstall, get-config, set-config, remove-instance, set-da-config.

#include <memory>
#include <optional>
#include <vector>

#include "apps/vmqctl/commands/input_text.h"
#include "apps/vmqctl/commands/install_request.h"
#include "apps/vmqctl/commands/request_options.h"
#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

constexpr unsigned configurationTimeoutSeconds = 600;
constexpr std::size_t contextColumnBytes = 3072;

/// Everything that the verbs here can be told; each takes what it needs.
struct Arguments : InstallArguments {
  std::string target;
  std::string file;
  std::string model;
  std::vector<std::string> scripts;
  std::optional<unsigned> port;
  RequestArguments request;
};

std::string joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : ",") + word;
  return text;
}

// ---- options -------------------------------------------------------------------------------------------------------

void takesTarget(Verb& verb, Arguments& a, const char* description) {
  verb.text("--target MSN", a.target, description);
}

void addInstallOptions(Verb& verb, Arguments& a) {
  takesProduct(verb, a);
  takesVersion(verb, a).required();
  takesCommand(verb, a, "The installer's command line").required();
  takesInstallSteps(verb, a);
}

void addUninstallOptions(Verb& verb, Arguments& a) {
  takesProduct(verb, a);
  takesVersion(verb, a);
  takesCommand(verb, a, "For products that the inventory does not know: what installed them");
}

void addGetConfigOptions(Verb& verb, Arguments& a) {
  takesProduct(verb, a);
  takesTarget(verb, a, "Managed system name or instance");
}

void addSetConfigOptions(Verb& verb, Arguments& a) {
  addGetConfigOptions(verb, a);
  verb.text("FILE", a.file, "The configuration; \"-\", or none, for standard input");
}

void addRemoveInstanceOptions(Verb& verb, Arguments& a) {
  takesProduct(verb, a);
  verb.text("INSTANCE", a.target, "The instance to remove").required();
  verb.text("--config FILE", a.file, "A file for the translator to read; \"-\" for standard input");
}

void addDaConfigOptions(Verb& verb, Arguments& a) {
  takesTarget(verb, a, "Managed system name of the data agent, such as inst1:node1:DA");
  verb.text("--model FILE", a.model, "Model file, relative to the depot");
  verb.texts("--script FILE", a.scripts, "Script file, relative to the depot; may be given several times")
      .check([](const std::string& name) {
        return name.find(',') == std::string::npos ? "" : "must not hold a comma, which would make two names of it";
      });
  verb.number("--port PORT", a.port, {1, 65535}, "Port of the agent's console");
}

void addNoOptions(Verb&, Arguments&) {}

// ---- requests ------------------------------------------------------------------------------------------------------

void buildInstall(Request& request, const Arguments& a) {
  request = installRequest(a);
}

void buildUninstall(Request& request, const Arguments& a) {
  addParameter(request, "VERSION", a.version);
  addParameter(request, "CONTEXT", a.installer);
  if (!a.installer.empty()) return;
  request.explains = [product = a.product](const Result& result) {
    constexpr long notStarted = 1033;
    // It had no command line to run.
    return result.returnValue != notStarted || !result.parameters.empty()
               ? ""
               : "The inventory does not list " + product + "; say with --command what installed it.";
  };
}

void buildGetConfig(Request& request, const Arguments& a) {
  addParameter(request, "TARGETMSN", a.target);
  request.shows = [](const Console& console, const Json& answer) {
    const std::string configuration = textIn(answer, "CONTEXT");
    if (configuration.empty()) console.line("There is no configuration.");
    const bool ended = configuration.empty() || configuration.back() == '\n';
    console.data(linesText(ended ? configuration : configuration + "\n", console.out()));
  };
  request.doubts = [](const Json& answer) {
    return textIn(answer, "CONTEXT").size() < contextColumnBytes
               ? ""
               : "The configuration fills its column and may go on: what an answer holds ends here.";
  };
}

void buildSetConfig(Request& request, const Arguments& a) {
  const std::string configuration = inputText(a.file.empty() ? "-" : a.file);
  if (configuration.empty()) throw Failure(ExitCode::Usage, "The configuration is empty; nothing was sent.", "");
  addParameter(request, "TARGETMSN", a.target);
  addParameter(request, "CONTEXT", configuration);
}

void buildRemoveInstance(Request& request, const Arguments& a) {
  addParameter(request, "TARGETMSN", a.target);
  if (!a.file.empty()) addParameter(request, "CONTEXT", inputText(a.file));
}

void buildDaConfig(Request& request, const Arguments& a) {
  if (a.model.empty() && a.scripts.empty())
    throw Failure(ExitCode::Usage, "There is nothing to configure: name a --model or a --script.", "");
  addParameter(request, "TARGETMSN", a.target);
  addParameter(request, "DACONFIG", a.model);
  addParameter(request, "DASCRIPT", joined(a.scripts));
  if (a.port) addParameter(request, "CONTEXT", "PORT=" + std::to_string(*a.port));
}

void buildNothing(Request&, const Arguments&) {}

// ---- the verbs -----------------------------------------------------------------------------------------------------

struct ProductVerb {
  const char* name;
  const char* command;
  const char* product;  ///< null: typed
  Request::Outcome outcome;
  unsigned timeoutSeconds;
  void (*addOptions)(Verb&, Arguments&);
  void (*build)(Request&, const Arguments&);
  const char* description;
  const char* example;
};

constexpr auto Queued = Request::Outcome::Queued;
constexpr auto AtOnce = Request::Outcome::AtOnce;

// clang-format off
constexpr ProductVerb productVerbs[] = {
    {"install", "INSTALL", nullptr, Queued, installationTimeoutSeconds, addInstallOptions, buildInstall,
     "Install a product from the depot.",
     "  vmqctl install ux --version 06.20 --command '|DEPLOYDIR|/install.sh -q'\n"
     "  vmqctl install ci --version 06.20 --command '|DEPLOYDIR|/install.sh' --restart"},
    {"complete-install", "COMPLETE_INSTALL", "", AtOnce, configurationTimeoutSeconds, addNoOptions, buildNothing,
     "Ask for the outcome of an install that restarted vmqd. Takes 10 seconds.",
     "  vmqctl complete-install"},
    {"uninstall", "UNINSTALL", nullptr, Queued, installationTimeoutSeconds, addUninstallOptions, buildUninstall,
     "Remove a product.",
     "  vmqctl uninstall ux"},
    {"get-config", "GETCONFIG", nullptr, AtOnce, configurationTimeoutSeconds, addGetConfigOptions, buildGetConfig,
     "Show the configuration of a product's instance.",
     "  vmqctl get-config ux --target inst1 > inst1.cfg"},
    {"set-config", "SETCONFIG", nullptr, Queued, configurationTimeoutSeconds, addSetConfigOptions, buildSetConfig,
     "Write the configuration of a product's instance.",
     "  vmqctl set-config ux --target inst1 inst1.cfg\n"
     "  vmqctl set-config ux < inst1.cfg"},
    {"remove-instance", "REMOVEINSTANCE", nullptr, Queued, configurationTimeoutSeconds, addRemoveInstanceOptions,
     buildRemoveInstance,
     "Remove one instance of a product.",
     "  vmqctl remove-instance ux inst1"},
    {"set-da-config", "SETCONFIG", "um", Queued, configurationTimeoutSeconds, addDaConfigOptions, buildDaConfig,
     "Give the data agent a model and scripts from the depot.",
     "  vmqctl set-da-config --target inst1:node1:DA --model sales.mdl --script read_sales.sh"},
};
// clang-format on

}  // namespace

void addProductVerbs(Verbs& verbs) {
  for (const ProductVerb& each : productVerbs) {
    const auto arguments = std::make_shared<Arguments>();
    Verb verb = verbs.add(each.name, each.description, each.timeoutSeconds, [&each, arguments] {
      Request request;
      request.command = each.command;
      request.outcome = each.outcome;
      addParameter(request, "PRODUCT", each.product != nullptr ? each.product : arguments->product);
      each.build(request, *arguments);
      return requestAction(request, arguments->request);
    });
    each.addOptions(verb, *arguments);
    addRequestOptions(verb, arguments->request, each.outcome);
    verb.footer(std::string("Examples:\n") + each.example);
  }
}

}  // namespace vmqctl
