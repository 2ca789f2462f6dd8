// Whole requests: what the management server asks, what the machine's tools do, what is run and what comes back.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/tasks/rows.h"

namespace {

using testing::ElementsAre;
using testing::IsSupersetOf;

struct Deployment {
  const char* situation;
  std::vector<RequestDetail::Predicate> request;
  /// What bin/CorvelAgent does; empty: it is not there.
  std::string control_script = {};
  std::string run_as_file = {};
  /// The command lines run, in order. In them and in the texts below, "~" stands for the installation home.
  std::vector<std::string> commands = {};
  AnswerRow answer;
  std::optional<StatusEvent> event = std::nullopt;
  std::vector<std::string> errors = {};  ///< among the lines traced at the error level
};

std::ostream& operator<<(std::ostream& out, const Deployment& deployment) {
  return out << deployment.situation;
}

std::vector<RequestDetail::Predicate> asked(const std::string& command,
                                            std::vector<RequestDetail::Predicate> parameters = {}) {
  parameters.insert(parameters.begin(), {equal("COMMAND", command), equal("TRANSID", "t1")});
  return parameters;
}

const auto runAs = InstallationHome::runAs;

// clang-format off
const Deployment kDeployments[] = {
    // ---- refused before anything is done ----------------------------------------------------------------------------
    {.situation = "no command",
     .request = {equal("TRANSID", "t1")},
     .answer = {.originnode = kNode, .transid = "t1", .retval = 1001, .retmsgid = "VMQ1001E"},
     .errors = {"VMQ1001E No [COMMAND] specified, it is a required parameter"}},
    {.situation = "no transaction id",
     .request = {equal("COMMAND", "START"), equal("PRODUCT", "ux")},
     .answer = {.originnode = kNode, .command = "START", .product = "ux", .retval = 1002, .retmsgid = "VMQ1002E"},
     .errors = {"VMQ1002E No [TRANSID] specified, it is a required parameter"}},
    {.situation = "no product",
     .request = asked("START"),
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .retval = 1003, .retmsgid = "VMQ1003E"},
     .errors = {"VMQ1003E No [PRODUCT] specified, it is a required parameter"}},
    {.situation = "no context",
     .request = asked("SETCONFIG", {equal("PRODUCT", "ux")}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "SETCONFIG", .product = "ux", .retval = 1004,
                .retmsgid = "VMQ1004E"},
     .errors = {"VMQ1004E No [CONTEXT] specified, it is a required parameter"}},
    {.situation = "no target",
     .request = asked("REMOVEINSTANCE", {equal("PRODUCT", "ux")}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "REMOVEINSTANCE", .product = "ux", .retval = 1005,
                .retmsgid = "VMQ1005E"},
     .errors = {"VMQ1005E No [TARGETMSN] specified, it is a required parameter"}},
    {.situation = "unknown command",
     .request = asked("start", {equal("PRODUCT", "ux")}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "start", .product = "ux", .retval = 1006,
                .retmsgid = "VMQ1006E", .retmsgparm = "start"},
     .errors = {"VMQ1006E Command [start] is not a supported command"}},
    {.situation = "remove instance of the data agent",
     .request = asked("REMOVEINSTANCE", {equal("PRODUCT", "Um"), equal("TARGETMSN", "inst1:node7:DA")}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "REMOVEINSTANCE", .product = "Um", .retval = 1006,
                .retmsgid = "VMQ1006E", .retmsgparm = "REMOVEINSTANCE", .targetmsn = "inst1:node7:DA"},
     .errors = {"VMQ1006E Command [REMOVEINSTANCE] is not a supported command for DA"}},
    {.situation = "no version",
     .request = asked("INSTALL", {equal("PRODUCT", "ux"), equal("CONTEXT", "./install.sh")}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "INSTALL", .product = "ux", .context = "./install.sh",
                .retval = 1029, .retmsgid = "VMQ1029E"},
     .errors = {"VMQ1029E No [VERSION] specified, it is a required parameter"}},

    // ---- start, stop, restart ---------------------------------------------------------------------------------------
    {.situation = "start",
     .request = asked("START", {equal("PRODUCT", "ux")}),
     .control_script = "exit 0",
     .commands = {"~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START"}},
    {.situation = "start of a named instance",
     .request = asked("START", {equal("PRODUCT", "ux"), equal("OPTIONAL", "INSTANCE"), equal("TARGETMSN", "inst1")}),
     .control_script = "exit 0",
     .commands = {"~/bin/CorvelAgent  -h ~ -o inst1 start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux", .optional = "INSTANCE",
                .targetmsn = "inst1"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START", .targetmsn = "inst1"}},
    {.situation = "stop of a data agent's instance",
     .request = asked("STOP", {equal("PRODUCT", "um"), equal("TARGETMSN", "inst1:node7:DA")}),
     .control_script = "exit 0",
     .commands = {"~/bin/CorvelAgent  -h ~ -c -o inst1 stop um"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "STOP", .product = "um",
                .targetmsn = "inst1:node7:DA"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "STOP", .targetmsn = "inst1:node7:DA"}},
    {.situation = "restart",
     .request = asked("RESTART", {equal("PRODUCT", "ux")}),
     .control_script = "exit 0",
     .commands = {"~/bin/CorvelAgent  -h ~ -c stop ux", "~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "RESTART", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "RESTART"}},
    {.situation = "start that cannot be started",
     .request = asked("START", {equal("PRODUCT", "ux")}),
     .commands = {"~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START", .retval = 1025,
                          .retmsgid = "VMQ1025E", .retmsgparm = "~/bin/CorvelAgent  -h ~ start ux"},
     .errors = {"VMQ1025E Failed to start command [~/bin/CorvelAgent  -h ~ start ux]"}},
    {.situation = "stop that fails",
     .request = asked("STOP", {equal("PRODUCT", "ux")}),
     .control_script = "exit 1",
     .commands = {"~/bin/CorvelAgent  -h ~ -c stop ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "STOP", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "STOP", .retval = 1024,
                          .retmsgid = "VMQ1024E", .retmsgparm = "~/bin/CorvelAgent  -h ~ -c stop ux"},
     .errors = {"VMQ1024E Bad return code from start/stop command [~/bin/CorvelAgent  -h ~ -c stop ux]"}},
    {.situation = "restart whose stop fails keeps the message of the stop",
     .request = asked("RESTART", {equal("PRODUCT", "ux")}),
     .control_script = "case \"$*\" in *stop*) exit 1;; esac",
     .commands = {"~/bin/CorvelAgent  -h ~ -c stop ux", "~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "RESTART", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "RESTART", .retval = 0,
                          .retmsgid = "VMQ1024E", .retmsgparm = "~/bin/CorvelAgent  -h ~ -c stop ux"},
     .errors = {"VMQ1024E Bad return code from start/stop command [~/bin/CorvelAgent  -h ~ -c stop ux]"}},
    {.situation = "start as a user who is not there",
     .request = asked("START", {equal("PRODUCT", "ux"), equal("OPTIONAL", "INSTANCE"), equal("TARGETMSN", "inst1")}),
     .control_script = "exit 0",
     .run_as_file = runAs("ux", "inst1", "vmq-no-such-user"),
     .commands = {"/usr/bin/su - vmq-no-such-user -c \"~/bin/CorvelAgent  -h ~ -o inst1 start ux\""},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux", .optional = "INSTANCE",
                .targetmsn = "inst1"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START", .retval = 1024,
                          .retmsgid = "VMQ1024E",
                          .retmsgparm = "/usr/bin/su - vmq-no-such-user -c \"~/bin/CorvelAgent  -h ~ -o inst1 start ux\"",
                          .targetmsn = "inst1"},
     .errors = {"VMQ1024E Bad return code from start/stop "
                "command [/usr/bin/su - vmq-no-such-user -c \"~/bin/CorvelAgent  -h ~ -o inst1 start ux\"]"}},
    {.situation = "run-as file without the product",
     .request = asked("START", {equal("PRODUCT", "ux")}),
     .control_script = "exit 0",
     .run_as_file = runAs("or", "", "vmq-no-such-user"),
     .commands = {"~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START"}},
    {.situation = "run-as file without the instance",
     .request = asked("START", {equal("PRODUCT", "ux")}),
     .control_script = "exit 0",
     .run_as_file = runAs("ux", "inst1", "vmq-no-such-user"),
     .commands = {"~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START"}},
    {.situation = "run-as file with an empty user",
     .request = asked("START", {equal("PRODUCT", "ux")}),
     .control_script = "exit 0",
     .run_as_file = runAs("ux", "", ""),
     .commands = {"~/bin/CorvelAgent  -h ~ start ux"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "START", .product = "ux"},
     .event = StatusEvent{.originnode = kNode, .transid = "t1", .command = "START"}},
};
// clang-format on

class WholeRequest : public testing::TestWithParam<Deployment> {
 protected:
  /// With the installation home in place of each "~".
  [[nodiscard]] std::string atHome(std::string text) const {
    for (size_t at = 0; (at = text.find('~', at)) != std::string::npos; at += home.path().size())
      text.replace(at, 1, home.path());
    return text;
  }
  InstallationHome& home = runningComponent();
  TEST_RecordedSleeps sleeps;
  TEST_TraceCapture trace;
};

TEST_P(WholeRequest, IsAnsweredAndReported) {
  const Deployment& c = GetParam();
  if (!c.control_script.empty()) home.controlScript(c.control_script);
  home.runAsFile(c.run_as_file);
  StatusEvents events;

  EXPECT_THAT(ask(c.request), ElementsAre(c.answer.bytes()));
  if (c.event) {
    StatusEvent expected = *c.event;
    expected.retmsgparm = atHome(expected.retmsgparm);
    EXPECT_EQ(events.next(), expected.bytes());
  }
  std::vector<std::string> expected_commands;
  for (const std::string& command : c.commands) expected_commands.push_back(atHome(command));
  EXPECT_EQ(commandLines(trace), expected_commands);
  std::vector<std::string> expected_errors;
  for (const std::string& error : c.errors) expected_errors.push_back(atHome(error));
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsSupersetOf(expected_errors));

  // Nothing more was on its way: the next event is that of the next request.
  home.runAsFile("");
  home.controlScript("exit 0");
  ask({equal("COMMAND", "START"), equal("TRANSID", "next"), equal("PRODUCT", "ux")});
  EXPECT_EQ(events.next(), (StatusEvent{.originnode = kNode, .transid = "next", .command = "START"}.bytes()));
}

INSTANTIATE_TEST_SUITE_P(All, WholeRequest, testing::ValuesIn(kDeployments));

}  // namespace
