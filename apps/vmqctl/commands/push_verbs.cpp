// push and deploy: files for the depot, and installs of what was sent.

#include <sys/stat.h>

#include <memory>
#include <vector>

#include "apps/vmqctl/commands/install_request.h"
#include "apps/vmqctl/commands/request_options.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/push/pusher.h"
#include "apps/vmqctl/transaction_id.h"

namespace vmqctl {
namespace {

constexpr unsigned pushTimeoutSeconds = 7200;  // large files
constexpr const char* defaultInstaller = "|DEPLOYDIR|/install.sh |CORVELHOME|";

struct PushArguments {
  std::vector<std::string> sources;
  std::string folder;
  bool verify = false;
  bool dryRun = false;
};

struct DeployArguments {
  std::string bundle;
  InstallArguments install;
  RequestArguments request;
  bool verify = false;
};

// ---- what both do --------------------------------------------------------------------------------------------------

void tellEmptyFolders(const Session& session, const PushPlan& plan) {
  for (const std::string& folder : plan.emptyFolders()) {
    session.console.line("not sent, since no file is in it: " + folder);
  }
}

Json plannedFiles(const PushPlan& plan) {
  Json files = Json::array();
  for (const PlannedFile& file : plan.files()) {
    files.push_back({{"name", file.name}, {"bytes", file.bytes}, {"source", file.source}});
  }
  return files;
}

void showFiles(const Session& session, const PushPlan& plan) {
  std::vector<Json> rows;
  for (const PlannedFile& file : plan.files()) {
    rows.push_back({{"NAME", file.name}, {"BYTES", file.bytes}, {"SOURCE", file.source}});
  }
  session.console.data(table({"NAME", "BYTES", "SOURCE"}, rows, layoutFor(session.console.out())));
}

std::string notSentLine() {
  return std::string("not sent: POST /v1/rpc/") + Packet::interfaceId + "/" + std::to_string(Packet::operation) +
         " for each file";
}

// ---- push ----------------------------------------------------------------------------------------------------------

void write(const Session& session, const Pusher& pusher) {
  const Json report = pusher.report();
  if (session.format == Format::AsJson) {
    session.console.data(jsonText(report, /*oneLine=*/false, session.console.out()));
    return;
  }
  const Json row = {{"RESULT", report["result"]},
                    {"FILES", report["files"].size()},
                    {"BYTES", report["bytes"]},
                    {"CALLS", report["calls"]},
                    {"DEPOT", report["depot"]}};
  session.console.data(table({"RESULT", "FILES", "BYTES", "CALLS", "DEPOT"}, {row}, layoutFor(session.console.out())));
}

ExitCode runPush(Session& session, const PushArguments& arguments) {
  PushPlan plan;
  const std::string folder = cleanFolder(arguments.folder);
  for (const std::string& source : arguments.sources) plan.add(source, folder);
  plan.check();
  tellEmptyFolders(session, plan);
  if (arguments.dryRun) {
    session.console.line(notSentLine());
    if (session.format == Format::AsJson) {
      session.console.data(jsonText({{"files", plannedFiles(plan)}}, /*oneLine=*/false, session.console.out()));
    } else {
      showFiles(session, plan);
    }
    return ExitCode::Done;
  }
  Pusher pusher(session, plan, arguments.verify);
  try {
    pusher.run();
  } catch (const Failure&) {
    session.progress.clear();
    if (session.format == Format::AsJson) write(session, pusher);
    throw;
  }
  session.progress.clear();
  write(session, pusher);
  return ExitCode::Done;
}

// ---- deploy --------------------------------------------------------------------------------------------------------

/// Where an install of the product looks for its files, relative to the depot.
std::string deployFolder(const InstallArguments& install) {
  // The installation's own services lie there without a version.
  return cleanFolder(install.product == "ci" ? install.product : install.product + "/" + install.version);
}

InstallArguments withInstaller(InstallArguments install, const std::string& bundle) {
  if (!install.installer.empty()) return install;
  struct stat found = {};
  if (stat((bundle + "/install.sh").c_str(), &found) != 0 || !S_ISREG(found.st_mode)) {
    throw Failure(ExitCode::Usage, "There is no install.sh in " + bundle + ". Nothing was sent.",
                  "Say with --command what installs the product.");
  }
  install.installer = defaultInstaller;
  return install;
}

/// The folder of the depot is a word of command lines.
std::string blanksIn(const std::string& value) {
  return value.find_first_of(" \t\n") == std::string::npos ? ""
                                                           : "must not hold blanks, at which command lines are split";
}

ExitCode runDeploy(Session& session, const DeployArguments& arguments) {
  PushPlan plan;
  plan.addContents(arguments.bundle, deployFolder(arguments.install));
  plan.check();
  const Request request = installRequest(withInstaller(arguments.install, arguments.bundle));
  const std::string id = transactionIdFor(arguments.request);
  checkSendable(predicatesOf(request, id));
  tellEmptyFolders(session, plan);
  if (arguments.request.dryRun) {
    session.console.line(notSentLine());
    if (session.format == Format::AsTable) {
      showFiles(session, plan);
      return requestAction(request, arguments.request)(session);
    }
    session.console.data(
        jsonText({{"files", plannedFiles(plan)}, {"request", {{"predicates", toJson(predicatesOf(request, id))}}}},
                 /*oneLine=*/false, session.console.out()));
    return ExitCode::Done;
  }

  RequestOptions options = {id, !arguments.request.noWait};
  {
    Pusher pusher(session, plan, arguments.verify);
    try {
      pusher.run();
    } catch (const Failure& failure) {
      session.progress.clear();
      throw Failure(failure.code(), std::string(failure.what()) + " The install was not asked for.", failure.next());
    }
    session.progress.clear();
    session.console.line(pusher.summary());
    options.push = pusher.report();
  }
  return runRequest(session, request, options);
}

}  // namespace

void addPush(Verbs& verbs) {
  const auto arguments = std::make_shared<PushArguments>();
  Verb verb = verbs.add("push", "Send files and folders to the depot.", pushTimeoutSeconds,
                        [arguments] { return [arguments](Session& session) { return runPush(session, *arguments); }; });
  verb.texts("FILE|DIR", arguments->sources, "What to send; a folder with everything in it, under its own name")
      .required();
  verb.text("--to PATH", arguments->folder, "The folder in the depot to put it in (default: the depot itself)");
  verb.flag("--verify", arguments->verify, "Compare size and SHA-256 of each file with what has arrived");
  verb.flag("--dry-run", arguments->dryRun, "Show what would be sent, and send nothing");
  verb.footer(
      "Examples:\n"
      "  vmqctl push bundles/ux\n"
      "  vmqctl push sales.mdl read_sales.sh --to models --verify");
}

void addDeploy(Verbs& verbs) {
  const auto arguments = std::make_shared<DeployArguments>();
  Verb verb =
      verbs.add("deploy", "Send the files of a product to the depot and install it.", installationTimeoutSeconds,
                [arguments] { return [arguments](Session& session) { return runDeploy(session, *arguments); }; });
  verb.text("BUNDLE_DIR", arguments->bundle, "The folder with the files of this version of the product").required();
  takesProduct(verb, arguments->install).check(blanksIn);
  takesVersion(verb, arguments->install).required().check(blanksIn);
  takesCommand(verb, arguments->install,
               std::string("The installer's command line (default: ") + defaultInstaller + ")");
  takesInstallSteps(verb, arguments->install);
  verb.flag("--verify", arguments->verify, "Compare size and SHA-256 of each file with what has arrived");
  addRequestOptions(verb, arguments->request, Request::Outcome::Queued);
  verb.footer(
      "Examples:\n"
      "  vmqctl deploy bundles/ux/06.20 ux --version 06.20\n"
      "  vmqctl deploy ./ux ux --version 06.20 --verify --command '|DEPLOYDIR|/setup -q'");
}

}  // namespace vmqctl
