#include "tests/mgmt/deployment_case.h"

#include "tests/support/temporary_directory.h"

using testing::ElementsAre;

DeploymentRun::DeploymentRun() : home(runningComponent()) {}

std::string DeploymentRun::atHome(std::string text) const {
  for (size_t at = 0; (at = text.find('~', at)) != std::string::npos; at += home.path().size())
    text.replace(at, 1, home.path());
  return text;
}

void DeploymentRun::run(const DeploymentCase& deployment) {
  for (const auto& [name, body] : deployment.tools) home.tool(name, atHome(body));
  for (const auto& [name, text] : deployment.files) home.file(name, atHome(text));
  StatusEvents events;

  AnswerRow answer = deployment.answer;
  for (std::string* text : {&answer.retmsgparm, &answer.context}) *text = atHome(*text);
  EXPECT_THAT(ask(deployment.request), ElementsAre(answer.bytes()));
  for (StatusEvent event : deployment.events) {
    event.retmsgparm = atHome(event.retmsgparm);
    EXPECT_EQ(events.next(), event.bytes());
  }
  std::vector<std::string> commands;
  for (const std::string& command : deployment.commands) commands.push_back(atHome(command));
  EXPECT_EQ(commandLines(trace), commands);
  for (const auto& [name, text] : deployment.leaves) EXPECT_EQ(readWholeFile(home.path() + "/" + name), atHome(text));
  expectNothingMore(events);
}

void DeploymentRun::expectNothingMore(StatusEvents& events) {
  home.controlScript("exit 0");
  ask({equal("COMMAND", "START"), equal("TRANSID", "next"), equal("PRODUCT", "ux")});
  EXPECT_EQ(events.next(), (StatusEvent{.originnode = kNode, .transid = "next", .command = "START"}.bytes()));
}

std::vector<RequestDetail::Predicate> asked(const std::string& command,
                                            std::vector<RequestDetail::Predicate> parameters) {
  parameters.insert(parameters.begin(), {equal("COMMAND", command), equal("TRANSID", "t1")});
  return parameters;
}
