#include "tests/mgmt/deployment_case.h"

#include <filesystem>

#include "mgmt/rows.h"
#include "tests/support/temporary_directory.h"

using testing::ElementsAre;
using testing::IsSupersetOf;

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
  answer.retmsgparm = atHome(answer.retmsgparm).substr(0, sizeof(vmq_kagreqt_data_t::retmsgparm));
  answer.context = atHome(answer.context).substr(0, sizeof(vmq_kagreqt_data_t::context));
  EXPECT_THAT(ask(deployment.request), ElementsAre(answer.bytes()));
  for (StatusEvent event : deployment.events) {
    event.retmsgparm = atHome(event.retmsgparm).substr(0, sizeof(vmq_kagdyst_data_t::retmsgparm));
    EXPECT_EQ(events.next(), event.bytes());
  }
  std::vector<std::string> commands;
  for (const std::string& command : deployment.commands) commands.push_back(atHome(command));
  EXPECT_EQ(commandLines(trace), commands);
  for (const auto& [name, text] : deployment.leaves) EXPECT_EQ(readWholeFile(home.path() + "/" + name), atHome(text));
  for (const std::string& name : deployment.absent) EXPECT_FALSE(std::filesystem::exists(home.path() + "/" + name));
  std::vector<std::string> errors;
  for (const std::string& error : deployment.errors) errors.push_back(atHome(error));
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsSupersetOf(errors));
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
