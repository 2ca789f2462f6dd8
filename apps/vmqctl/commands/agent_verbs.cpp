// start, stop, restart.

#include <memory>

#include "apps/vmqctl/commands/request_options.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

// Longer than an agent takes, shorter than a script would hang for. What waits in the daemon's queue before it counts
// too.
constexpr unsigned defaultTimeoutSeconds = 600;

struct AgentVerb {
  const char* name;
  const char* command;
  bool takesInstance;  ///< the component takes the name of an instance as it is
  const char* description;
  const char* example;
};

// clang-format off
constexpr AgentVerb agentVerbs[] = {
    {"start", "START", true, "Start an agent.",
     "  vmqctl start ux\n"
     "  vmqctl start ux --instance inst1"},
    // These two always look the instance up by its managed system name.
    {"stop", "STOP", false, "Stop an agent.",
     "  vmqctl stop ux\n"
     "  vmqctl stop ux --target inst1:node1:UX"},
    {"restart", "RESTART", false, "Stop an agent and start it again.",
     "  vmqctl restart ux --timeout 60\n"
     "  vmqctl restart ux --target inst1:node1:UX"},
};
// clang-format on

struct Arguments {
  std::string product;
  std::string target;
  std::string instance;
  RequestArguments request;
};

Request requestOf(const AgentVerb& verb, const Arguments& arguments) {
  if (!arguments.instance.empty() && !verb.takesInstance) {
    throw Failure(
        ExitCode::Usage,
        std::string(verb.name) + " takes no --instance: it always finds the instance by its managed system name.",
        "Name that with --target.");
  }
  Request request;
  request.command = verb.command;
  request.parameters.push_back({"PRODUCT", "eq", arguments.product});
  if (!arguments.target.empty()) request.parameters.push_back({"TARGETMSN", "eq", arguments.target});
  if (!arguments.instance.empty()) {
    request.parameters.push_back({"TARGETMSN", "eq", arguments.instance});
    request.parameters.push_back({"OPTIONAL", "eq", "INSTANCE"});
  }
  return request;
}

}  // namespace

void addAgentVerbs(Verbs& verbs) {
  for (const AgentVerb& each : agentVerbs) {
    const auto arguments = std::make_shared<Arguments>();
    Verb verb = verbs.add(each.name, each.description, defaultTimeoutSeconds, [&each, arguments] {
      return requestAction(requestOf(each, *arguments), arguments->request);
    });
    verb.text("PRODUCT", arguments->product, "Product code of the agent, such as ux").required();
    const Argument target =
        verb.text("--target MSN", arguments->target, "Managed system name; its instance is looked up");
    verb.text("--instance NAME", arguments->instance,
              each.takesInstance ? "Name of the instance, not looked up" : "Not for this verb; use --target")
        .excludes(target);
    addRequestOptions(verb, arguments->request, Request::Outcome::Queued);
    verb.footer(std::string("Examples:\n") + each.example);
  }
}

}  // namespace vmqctl
