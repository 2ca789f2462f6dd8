#include "tasks/install.h"

#include <cstdlib>
#include <memory>
#include <string>

#include "bss1.h"
#include "tasks/command_report.h"
#include "tasks/file_helpers.h"
#include "tasks/restart_script.h"
#include "tasks/task_manager.h"
#include "tasks/two_way_translator.h"
#include "tasks/uninstall.h"
#include "util/shell_word.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/install"};

constexpr char REQUIRES_RESTART[] = "REQUIRES_RESTART";
constexpr unsigned SECONDS_BEFORE_RESTART = 5;
constexpr unsigned SECONDS_BEFORE_READING_RC = 10;

constexpr CommandReport INSTALL_REPORT = {.not_started_rc = TASK_INSTALL_NOT_STARTED,
                                          .not_started_text = "Failed to start install command",
                                          .failed_rc = TASK_INSTALL_FAILED,
                                          .failed_text = "Bad return code",
                                          .failed_source = "from install command"};

constexpr CommandReport SET_RMS_REPORT = {.not_started_rc = TASK_TRANSLATOR_NOT_STARTED,
                                          .not_started_text = "Failed to start two way translator",
                                          .failed_rc = TASK_TRANSLATOR_FAILED,
                                          .failed_text = "Bad return code",
                                          .failed_source = "from setRMS command",
                                          .names_request = true,
                                          .return_code = ReturnCodeForm::kCharacter};

String lowerCased(String text) {
  return text.toLower();
}

TASK_RC refuse(TaskQueueElem& request, TASK_RC rc, TASK_RC messageOf, const String& parameter) {
  request.retmsgid = rcToMsgId(messageOf);
  request.retmsgparm = parameter;
  return rc;
}

/// The translator with its registration request; empty when there is no translator.
String setRmsCommand(const Trace& trace, const String& product) {
  String translator;
  if (getTwoWayTranslator(translator)) return translator + " -setRMS " + product;
  TRACE_ERROR(trace, "No default two way translator found");
  return String();
}

/// The script removes the product's directory by an unquoted name.
bool mayStandInScript(const String& product) {
  return product != "." && product != ".." && product.find(String("/"), 0) == String::NPOS &&
         VMQ::isPlainShellWord(product);
}

TASK_RC prepareRestart(const Trace& trace, String& command, TaskQueueElem& request) {
  String translatorCommand = setRmsCommand(trace, request.product);
  if (translatorCommand.length() == 0)
    return refuse(request, TASK_INSTALL_FAILED, /*messageOf=*/TASK_INSTALL_NOT_STARTED, command);
  TRACE_DETAIL(trace, "Using Two-Way Translator %s", translatorCommand.c_str().get());
  if (!mayStandInScript(request.product)) {
    TRACE_ERROR(trace, "%s Product code [%s] must not stand in a script", rcToMsgId(TASK_INSTALL_FAILED),
                request.product.c_str().get());
    return refuse(request, TASK_INSTALL_FAILED, /*messageOf=*/TASK_INSTALL_FAILED, command);
  }
  TRACE_DETAIL(trace, "Generating post install script");
  setupForRestart(command, translatorCommand, request);
  TRACE_DETAIL(trace, "Sleeping for 5 seconds...");
  BSS1_Sleep(SECONDS_BEFORE_RESTART);
  request.returnAsyncStatus(TASK_OK);
  return TASK_OK;
}

/// Patches of these two products keep the pipes open behind them.
bool isPatchThatKeepsPipes(const Trace& trace, const String& command, const String& product) {
  const String code = lowerCased(product);
  if ((code != "oy" && code != "or") || command.find(String("qorpatch"), 0) == String::NPOS) return false;
  TRACE_DETAIL(trace, "Patch being applied to oy or or, setting nonblocking io flag to true");
  return true;
}

TASK_RC registerWithServer(const Trace& trace, TaskQueueElem& request) {
  const String command = setRmsCommand(trace, request.product);
  if (command.length() == 0) return TASK_INSTALL_FAILED;
  CommandOutput output;
  const TASK_RC rc =
      runAndReport(SET_RMS_REPORT, command, "", /*nonBlocking=*/false, /*environment=*/nullptr, &request, output);
  if (rc == TASK_OK) TRACE_DETAIL(trace, "SetRMS for product [%s] was successfull.", request.product.c_str().get());
  return rc;
}

TASK_RC runInstaller(const Trace& trace, const String& command, TaskQueueElem& request) {
  TRACE_DETAIL(trace, "Install command is [%s]", command.c_str().get());
  const bool nonBlocking = isPatchThatKeepsPipes(trace, command, request.product);
  TRACE_DETAIL(trace, "Executing install command %s", command.c_str().get());
  CommandOutput output;
  const TASK_RC rc = runAndReport(INSTALL_REPORT, command, "", nonBlocking, /*environment=*/nullptr, &request, output);
  if (rc != TASK_OK) return rc;
  TRACE_DETAIL(trace, "Install returned 0 return code.");
  const bool registers = request.optional.length() != 0 && request.optional != REQUIRES_RESTART;
  return registers ? registerWithServer(trace, request) : TASK_OK;
}

}  // namespace

TASK_RC install(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  String command = replaceTokens(request.context, request.product, request.version);
  TASK_RC rc = TASK_OK;
  if (request.optional == REQUIRES_RESTART) rc = prepareRestart(trace, command, request);
  if (rc == TASK_OK) rc = runInstaller(trace, command, request);
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}

void setupForRestart(String& installCommand, String& translatorCommand, TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const String script = depotDir + "runcmd.sh";
  installCommand = String("/bin/sh ") + script + " " + installCommand;
  if (translatorCommand.length() == 0) {
    TRACE_DETAIL(trace, "Constructing install only script %s", script.c_str().get());
  } else {
    TRACE_DETAIL(trace, "Constructing install and two-way script %s", script.c_str().get());
    TRACE_DETAIL(trace, "Two Way Translator is: %s", translatorCommand.c_str().get());
  }
  if (writeFile(script, restartScript(depotDir, lowerCased(request.product), translatorCommand))) return;
  // What a full file system took of it must not run: an empty script succeeds, and half a line removes half a path.
  (void)deleteFile(script);
}

TASK_RC completeInstallAfterRestart(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  BSS1_Sleep(SECONDS_BEFORE_READING_RC);
  const String file = depotDir + "rc.txt";
  char* contents = nullptr;
  const int status = Util::readFile(file.toNarrow().c_str(), &contents);
  const std::unique_ptr<char, decltype(&std::free)> owner(contents, &std::free);
  if (status != 0) {
    TRACE_ERROR(trace, "Unable to read rc.txt for install's return code");
    return refuse(request, TASK_INSTALL_FAILED, TASK_INSTALL_FAILED, file + "," + "NOTFOUND");
  }
  String text(contents);
  text.trim();
  int exitCode = 0;
  if (!String::convertToInt(text, &exitCode) || exitCode == 0) return TASK_OK;
  return refuse(request, TASK_INSTALL_FAILED, TASK_INSTALL_FAILED,
                file + "," + String(std::to_string(exitCode).c_str()));
}
