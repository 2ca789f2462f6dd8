#include "tasks/task_manager.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "bss1.h"
#include "tasks/task_queue.h"
#include "test_seam.h"
#include "tests/support/failing_allocation.h"
#include "tests/tasks/failing_calls.h"
#include "tests/tasks/installation_home.h"
#include "tests/tasks/recorded_tasks.h"
#include "util/util.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using VMQ::String;

/// The parameters of a request, as tests write them down.
struct Parameters {
  std::string command{}, product{}, context{}, optional{}, version{}, targetmsn{};
  std::string transid = "t1";

  [[nodiscard]] TaskQueueElem request() const {
    const auto text = [](const std::string& s) { return String(s.c_str()); };
    return TaskQueueElem("node7", text(transid), text(command), text(product), text(context), text(optional), "", "",
                         text(version), text(targetmsn));
  }
};

std::string trimmed(const char* column, size_t width) {
  std::string text(column, width);
  text.erase(text.find_last_not_of(' ') + 1);
  return text;
}

class TaskManager : public testing::Test {
 protected:
  ~TaskManager() override {
    taskQueue.clear();
    TEST_resetTaskManager();
  }
  InstallationHome home;
  FailingCalls calls;
  RecordedTasks tasks;
  TEST_TraceCapture trace;
};

class InitializedTaskManager : public TaskManager {
 protected:
  InitializedTaskManager() {
    vmq_taskmgr_init();
    trace.clear();
  }
};

// ---- initialization ------------------------------------------------------------------------------------------------

TEST_F(TaskManager, FindsTheDepotAndOffersTheCommandsInOrder) {
  vmq_taskmgr_init();
  EXPECT_EQ(depotDir.toNarrow(), home.depot());
  std::vector<std::string> names;
  for (const String& name : getSupportedTasks()) names.push_back(name.toNarrow());
  EXPECT_THAT(names, ElementsAre("START", "STOP", "RESTART", "INSTALL", "UNINSTALL", "GETCONFIG", "SETCONFIG",
                                 "COMPLETE_INSTALL", "REMOVEINSTANCE"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL,
                        "Commands supported are: START,STOP,RESTART,INSTALL,UNINSTALL,GETCONFIG,SETCONFIG,"
                        "COMPLETE_INSTALL,REMOVEINSTANCE\n"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Command vector being initialized"));
  EXPECT_EQ(calls.executors_started, 1);
}

TEST_F(TaskManager, IsInitializedOnce) {
  vmq_taskmgr_init();
  vmq_taskmgr_init();
  EXPECT_EQ(calls.executors_started, 1);
  EXPECT_EQ(getSupportedTasks().size(), 9u);
}

TEST_F(TaskManager, WithoutADepotRefusesEveryRequest) {
  BSS1_PutEnv("QORDEPLOY_AGENTDEPOT=/proc/no/depot/here");
  VMQ::Util::TEST_forgetDirectories();
  vmq_taskmgr_init();
  EXPECT_TRUE(trace.has(RAS1_ERROR, "VMQ1010E No Agent Depot directory set"));
  EXPECT_EQ(calls.executors_started, 0);
  EXPECT_THAT(getSupportedTasks(), IsEmpty());
  for (const char* command : {"START", "STOP", "RESTART", "INSTALL", "UNINSTALL", "GETCONFIG", "SETCONFIG",
                              "COMPLETE_INSTALL", "REMOVEINSTANCE"}) {
    TaskQueueElem request = Parameters{.command = command, .product = "ux"}.request();
    EXPECT_EQ(runTask(request), 1006) << command;
    EXPECT_EQ(trimmed(request.row.retmsgid, sizeof request.row.retmsgid), "VMQ1006E");
    EXPECT_EQ(trimmed(request.row.retmsgparm, sizeof request.row.retmsgparm), command);
  }
  EXPECT_THAT(tasks.calls, IsEmpty());
}

TEST_F(TaskManager, FailedPreparationsAreTracedAndTheNextOnesAttempted) {
  calls.mutex_init = ENOMEM;
  calls.cond_init = EAGAIN;
  calls.create = EAGAIN;
  vmq_taskmgr_init();
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("Unable to initialize queue mutex, return code 12\n",
                                                   "Unable to initialize condition variable, return code 11\n",
                                                   "Unable to create executor thread, return code 11\n"));
  EXPECT_TRUE(isSupportedTask("START"));
  vmq_taskmgr_init();  // counts as initialized all the same
  EXPECT_EQ(calls.executors_started, 0);
}

// ---- the synchronous answer ----------------------------------------------------------------------------------------

struct Answer {
  const char* situation;
  Parameters parameters;
  int rc;
  const char* message_id;
  const char* message_parameter;
  bool queued = false;
  std::vector<std::string> tasks_run_at_once = {};
  const char* traced = nullptr;  // at the error level
};

void PrintTo(const Answer& answer, std::ostream* out) {
  *out << answer.situation;
}

class RequestAnswer : public InitializedTaskManager, public testing::WithParamInterface<Answer> {};

TEST_P(RequestAnswer, IsGivenAtOnce) {
  const Answer& c = GetParam();
  TaskQueueElem request = c.parameters.request();
  request.retmsgid = "left over";
  request.retmsgparm = "left over";
  EXPECT_EQ(runTask(request), c.rc);
  EXPECT_EQ(request.row.retval, c.rc);
  EXPECT_EQ(trimmed(request.row.retmsgid, sizeof request.row.retmsgid), c.message_id);
  EXPECT_EQ(trimmed(request.row.retmsgparm, sizeof request.row.retmsgparm), c.message_parameter);
  EXPECT_EQ(trimmed(request.row.transid, sizeof request.row.transid), c.parameters.transid);
  EXPECT_EQ(taskQueue.size(), c.queued ? 1u : 0u);
  EXPECT_EQ(tasks.calls, c.tasks_run_at_once);
  if (c.traced != nullptr) {
    EXPECT_TRUE(trace.has(RAS1_ERROR, c.traced)) << c.traced;
  }
}

const Answer kAnswers[] = {
    // ---- accepted
    {"start", {.command = "START", .product = "ux"}, 0, "", "", /*queued=*/true},
    {"stop", {.command = "STOP", .product = "ux"}, 0, "", "", /*queued=*/true},
    {"restart", {.command = "RESTART", .product = "ux"}, 0, "", "", /*queued=*/true},
    {"install", {.command = "INSTALL", .product = "ux", .context = "c", .version = "1"}, 0, "", "", /*queued=*/true},
    {"uninstall", {.command = "UNINSTALL", .product = "ux"}, 0, "", "", /*queued=*/true},
    {"set configuration", {.command = "SETCONFIG", .product = "ux", .context = "c"}, 0, "", "", /*queued=*/true},
    {"remove instance", {.command = "REMOVEINSTANCE", .product = "ux", .targetmsn = "m"}, 0, "", "", /*queued=*/true},
    {.situation = "get configuration is run at once",
     .parameters = {.command = "GETCONFIG", .product = "ux"},
     .rc = 0,
     .message_id = "",
     .message_parameter = "",
     .tasks_run_at_once = {"getConfig"}},
    {.situation = "complete install is run at once and needs no parameter",
     .parameters = {.command = "COMPLETE_INSTALL"},
     .rc = 0,
     .message_id = "",
     .message_parameter = "",
     .tasks_run_at_once = {"completeInstallAfterRestart"}},
    {"set data agent configuration without context", {.command = "SETCONFIG", .product = "um"}, 0, "", "", true},
    {"set data agent configuration, product in mixed case", {.command = "SETCONFIG", .product = "uM"}, 0, "", "", true},
    {"start data agent", {.command = "START", .product = "UM"}, 0, "", "", /*queued=*/true},

    // ---- refused
    {.situation = "no command",
     .parameters = {.product = "ux"},
     .rc = 1001,
     .message_id = "VMQ1001E",
     .message_parameter = "",
     .traced = "VMQ1001E No [COMMAND] specified, it is a required parameter"},
    {.situation = "no transaction id",
     .parameters = {.command = "START", .product = "ux", .transid = ""},
     .rc = 1002,
     .message_id = "VMQ1002E",
     .message_parameter = "",
     .traced = "VMQ1002E No [TRANSID] specified, it is a required parameter"},
    {.situation = "neither command nor transaction id: the later check wins",
     .parameters = {.transid = ""},
     .rc = 1002,
     .message_id = "VMQ1002E",
     .message_parameter = "",
     .traced = "VMQ1001E No [COMMAND] specified, it is a required parameter"},
    {.situation = "unknown command",
     .parameters = {.command = "REBOOT", .product = "ux"},
     .rc = 1006,
     .message_id = "VMQ1006E",
     .message_parameter = "REBOOT",
     .traced = "VMQ1006E Command [REBOOT] is not a supported command"},
    {.situation = "command in lower case",
     .parameters = {.command = "start", .product = "ux"},
     .rc = 1006,
     .message_id = "VMQ1006E",
     .message_parameter = "start",
     .traced = "Command start is NOT supported"},
    {.situation = "start without product",
     .parameters = {.command = "START"},
     .rc = 1003,
     .message_id = "VMQ1003E",
     .message_parameter = "",
     .traced = "VMQ1003E No [PRODUCT] specified, it is a required parameter"},
    {"stop without product", {.command = "STOP"}, 1003, "VMQ1003E", ""},
    {"restart without product", {.command = "RESTART"}, 1003, "VMQ1003E", ""},
    {"uninstall without product", {.command = "UNINSTALL"}, 1003, "VMQ1003E", ""},
    {"get configuration without product", {.command = "GETCONFIG"}, 1003, "VMQ1003E", ""},
    {"install without product", {.command = "INSTALL", .context = "c", .version = "1"}, 1003, "VMQ1003E", ""},
    {.situation = "install without version",
     .parameters = {.command = "INSTALL", .product = "ux", .context = "c"},
     .rc = 1029,
     .message_id = "VMQ1029E",
     .message_parameter = "",
     .traced = "VMQ1029E No [VERSION] specified, it is a required parameter"},
    {.situation = "install without context",
     .parameters = {.command = "INSTALL", .product = "ux", .version = "1"},
     .rc = 1004,
     .message_id = "VMQ1004E",
     .message_parameter = "",
     .traced = "VMQ1004E No [CONTEXT] specified, it is a required parameter"},
    {"install without version and context: the later check wins",
     {.command = "INSTALL", .product = "ux"},
     1004,
     "VMQ1004E",
     ""},
    {"install without product and version", {.command = "INSTALL", .context = "c"}, 1029, "VMQ1029E", ""},
    {"set configuration without context", {.command = "SETCONFIG", .product = "ux"}, 1004, "VMQ1004E", ""},
    {"set configuration without product", {.command = "SETCONFIG", .context = "c"}, 1003, "VMQ1003E", ""},
    {"remove instance without product", {.command = "REMOVEINSTANCE", .targetmsn = "m"}, 1003, "VMQ1003E", ""},
    {.situation = "remove instance without target",
     .parameters = {.command = "REMOVEINSTANCE", .product = "ux"},
     .rc = 1005,
     .message_id = "VMQ1005E",
     .message_parameter = "",
     .traced = "VMQ1005E No [TARGETMSN] specified, it is a required parameter"},
    {.situation = "remove instance of the data agent",
     .parameters = {.command = "REMOVEINSTANCE", .product = "um", .targetmsn = "m"},
     .rc = 1006,
     .message_id = "VMQ1006E",
     .message_parameter = "REMOVEINSTANCE",
     .traced = "VMQ1006E Command [REMOVEINSTANCE] is not a supported command for DA"},
    {"remove instance of the data agent, product in upper case",
     {.command = "REMOVEINSTANCE", .product = "UM"},
     1006,
     "VMQ1006E",
     "REMOVEINSTANCE"},
};

INSTANTIATE_TEST_SUITE_P(All, RequestAnswer, testing::ValuesIn(kAnswers));

TEST_F(InitializedTaskManager, TellsWhichCommandItRuns) {
  TaskQueueElem request = Parameters{.command = "START", .product = "ux"}.request();
  runTask(request);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Command START is supported"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Going to run command START"));
}

TEST_F(InitializedTaskManager, QueuesACopyOfTheRequest) {
  TaskQueueElem request = Parameters{.command = "START", .product = "ux", .targetmsn = "m"}.request();
  runTask(request);
  EXPECT_EQ(request.product, "ux");
  const auto queued = takeTask();
  ASSERT_TRUE(queued.has_value());
  EXPECT_EQ(queued->originnode, "node7");
  EXPECT_EQ(queued->transid, "t1");
  EXPECT_EQ(queued->command, "START");
  EXPECT_EQ(queued->product, "ux");
  EXPECT_EQ(queued->targetmsn, "m");
  EXPECT_EQ(queued->retmsgid, "");
}

TEST_F(InitializedTaskManager, AnswersWithWhatACommandRunAtOnceCameTo) {
  tasks.behaviour = [](TaskQueueElem& request) {
    request.retmsgid = "VMQ1007E";
    request.retmsgparm = "GETCONFIG,ux";
    return TASK_NO_TRANSLATOR;
  };
  TaskQueueElem request = Parameters{.command = "GETCONFIG", .product = "ux"}.request();
  EXPECT_EQ(runTask(request), 1007);
  EXPECT_EQ(request.row.retval, 1007);
  EXPECT_EQ(trimmed(request.row.retmsgid, 16), "VMQ1007E");
  EXPECT_EQ(trimmed(request.row.retmsgparm, 256), "GETCONFIG,ux");
}

TEST(RequiredParameter, KeepsAnEarlierFailureWhenItIsThere) {
  TaskQueueElem request;
  EXPECT_EQ(requiredParameterOk("PRODUCT", "ux", request, TASK_NO_TRANSID, TASK_NO_PRODUCT), TASK_NO_TRANSID);
  EXPECT_EQ(request.retmsgid, "");
}

TEST(RequiredParameter, OverwritesAnEarlierFailureWhenItIsMissing) {
  TaskQueueElem request;
  request.retmsgparm = "left over";
  EXPECT_EQ(requiredParameterOk("PRODUCT", "", request, TASK_NO_TRANSID, TASK_NO_PRODUCT), TASK_NO_PRODUCT);
  EXPECT_EQ(request.retmsgid, "VMQ1003E");
  EXPECT_EQ(request.retmsgparm, "");
}

// ---- the queued task -----------------------------------------------------------------------------------------------

struct Dispatch {
  const char* situation;
  Parameters parameters;
  std::vector<std::string> calls;
};

void PrintTo(const Dispatch& dispatch, std::ostream* out) {
  *out << dispatch.situation;
}

class QueuedRequest : public InitializedTaskManager, public testing::WithParamInterface<Dispatch> {};

TEST_P(QueuedRequest, IsGivenToItsTask) {
  const Dispatch& c = GetParam();
  TaskQueueElem request = c.parameters.request();
  EXPECT_EQ(processAsyncTask(request), TASK_OK);
  EXPECT_EQ(tasks.calls, c.calls);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 0"));
}

const Dispatch kDispatches[] = {
    {"start",
     {.command = "START", .product = "ux", .targetmsn = "m"},
     {"getInstanceName ux [m]", "startAgent ux [instance of m]"}},
    {"start of a named instance",
     {.command = "START", .product = "ux", .optional = "INSTANCE", .targetmsn = "inst1"},
     {"startAgent ux [inst1]"}},
    {"start with something else in OPTIONAL",
     {.command = "START", .product = "ux", .optional = "instance", .targetmsn = "m"},
     {"getInstanceName ux [m]", "startAgent ux [instance of m]"}},
    {"stop looks the instance up even when it is named",
     {.command = "STOP", .product = "ux", .optional = "INSTANCE", .targetmsn = "m"},
     {"getInstanceName ux [m]", "stopAgent ux [instance of m]"}},
    {"restart looks the instance up even when it is named",
     {.command = "RESTART", .product = "ux", .optional = "INSTANCE", .targetmsn = "m"},
     {"getInstanceName ux [m]", "restartAgent ux [instance of m]"}},
    {"install", {.command = "INSTALL"}, {"install"}},
    {"uninstall", {.command = "UNINSTALL"}, {"uninstall"}},
    {"remove instance", {.command = "REMOVEINSTANCE"}, {"removeInstance"}},
    {"set configuration", {.command = "SETCONFIG", .product = "ux"}, {"setConfig"}},
    {"set data agent configuration", {.command = "SETCONFIG", .product = "um"}, {"setDaconfig"}},
    {"set data agent configuration, mixed case", {.command = "SETCONFIG", .product = "Um"}, {"setDaconfig"}},
    {"commands that are run at once do nothing here", {.command = "GETCONFIG", .product = "ux"}, {}},
    {"nor does an unknown one", {.command = "REBOOT", .product = "ux"}, {}},
};

INSTANTIATE_TEST_SUITE_P(All, QueuedRequest, testing::ValuesIn(kDispatches));

TEST_F(InitializedTaskManager, ReportsWhatTheTaskCameTo) {
  tasks.behaviour = [](TaskQueueElem&) { return TASK_INSTALL_FAILED; };
  TaskQueueElem request = Parameters{.command = "INSTALL"}.request();
  EXPECT_EQ(processAsyncTask(request), TASK_INSTALL_FAILED);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 1031"));
}

// ---- exceptions ----------------------------------------------------------------------------------------------------

struct Failure {
  const char* command;
  TASK_RC rc;
  const char* message_id;
};

void PrintTo(const Failure& failure, std::ostream* out) {
  *out << failure.command;
}

class TaskThatThrows : public InitializedTaskManager, public testing::WithParamInterface<Failure> {
 protected:
  TaskThatThrows() {
    tasks.behaviour = [](TaskQueueElem&) -> TASK_RC { throw std::runtime_error("no more of it"); };
  }
};

class QueuedTaskThatThrows : public TaskThatThrows {};

TEST_P(QueuedTaskThatThrows, CouldNotStart) {
  TaskQueueElem request = Parameters{.command = GetParam().command, .product = "ux"}.request();
  EXPECT_EQ(processAsyncTask(request), GetParam().rc);
  EXPECT_EQ(request.retmsgid, GetParam().message_id);
  EXPECT_EQ(request.retmsgparm.toNarrow(), std::string(GetParam().command) + ",ux");
  EXPECT_TRUE(trace.has(RAS1_ERROR, std::string("Exception while ") + GetParam().command + ": no more of it"));
}

INSTANTIATE_TEST_SUITE_P(All, QueuedTaskThatThrows,
                         testing::Values(Failure{"START", TASK_STARTSTOP_NOT_STARTED, "VMQ1025E"},
                                         Failure{"STOP", TASK_STARTSTOP_NOT_STARTED, "VMQ1025E"},
                                         Failure{"RESTART", TASK_STARTSTOP_NOT_STARTED, "VMQ1025E"},
                                         Failure{"INSTALL", TASK_INSTALL_NOT_STARTED, "VMQ1030E"},
                                         Failure{"UNINSTALL", TASK_UNINSTALL_NOT_STARTED, "VMQ1033E"},
                                         Failure{"SETCONFIG", TASK_TRANSLATOR_NOT_STARTED, "VMQ1009E"},
                                         Failure{"REMOVEINSTANCE", TASK_TRANSLATOR_NOT_STARTED, "VMQ1009E"}));

class ImmediateTaskThatThrows : public TaskThatThrows {};

TEST_P(ImmediateTaskThatThrows, IsAnsweredAllTheSame) {
  TaskQueueElem request = Parameters{.command = GetParam().command, .product = "ux"}.request();
  EXPECT_EQ(runTask(request), GetParam().rc);
  EXPECT_EQ(request.row.retval, GetParam().rc);
  EXPECT_EQ(trimmed(request.row.retmsgid, 16), GetParam().message_id);
}

INSTANTIATE_TEST_SUITE_P(All, ImmediateTaskThatThrows,
                         testing::Values(Failure{"GETCONFIG", TASK_TRANSLATOR_NOT_STARTED, "VMQ1009E"},
                                         Failure{"COMPLETE_INSTALL", TASK_INSTALL_FAILED, "VMQ1031E"}));

TEST_F(InitializedTaskManager, ThrownTaskWithoutMemoryForItsMessageKeepsItsCode) {
  const std::string product(5000, 'p');
  std::optional<FailingAllocation> failing;
  tasks.behaviour = [&](TaskQueueElem&) -> TASK_RC {
    failing.emplace(product.size());
    throw std::runtime_error("no more of it");
  };
  TaskQueueElem request = Parameters{.command = "INSTALL", .product = product}.request();
  EXPECT_EQ(processAsyncTask(request), TASK_INSTALL_NOT_STARTED);
  EXPECT_TRUE(failing->happened());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception while INSTALL: no more of it"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception while writing the message of a failed task: std::bad_alloc"));
  EXPECT_EQ(request.retmsgparm.length(), 0u);
}

TEST_F(InitializedTaskManager, ExceptionOfUnknownKindIsTracedToo) {
  tasks.behaviour = [](TaskQueueElem&) -> TASK_RC { throw 42; };
  TaskQueueElem request = Parameters{.command = "INSTALL", .product = "ux"}.request();
  EXPECT_EQ(processAsyncTask(request), TASK_INSTALL_NOT_STARTED);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Exception of unknown kind while INSTALL"));
}

}  // namespace
