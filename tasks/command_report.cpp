#include "tasks/command_report.h"

#include <string>

#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/command_report"};

void setMessage(TaskQueueElem* request, TASK_RC rc, const String& parameter) {
  if (request == nullptr) return;
  request->retmsgid = rcToMsgId(rc);
  request->retmsgparm = parameter;
}

String requestName(const CommandReport& report, const TaskQueueElem* request) {
  if (!report.names_request || request == nullptr) return String();
  return request->command + "," + request->product + ",";
}

String exitCodeText(ReturnCodeForm form, int exitCode) {
  String text;
  if (form == ReturnCodeForm::kDecimal) text = String(std::to_string(exitCode).c_str());
  if (form == ReturnCodeForm::kCharacter) text.append(static_cast<unsigned short>(exitCode));
  return text;
}

String failureParameter(const CommandReport& report, const TaskQueueElem* request, const String& command, int exitCode,
                        const String& standardError) {
  String parameter = requestName(report, request);
  const String code = exitCodeText(report.return_code, exitCode);
  if (report.return_code == ReturnCodeForm::kAbsent) {
    parameter.append(command);
  } else if (report.names_request) {
    parameter.append(code + "," + command);
  } else {
    parameter.append(command + "," + code);
  }
  if (report.with_standard_error) parameter.append(String(",") + standardError);
  return parameter;
}

void traceFailure(const Trace& trace, const CommandReport& report, const String& command, int exitCode,
                  const String& standardError) {
  const char* id = rcToMsgId(report.failed_rc);
  if (report.failed_source == nullptr) {
    TRACE_ERROR(trace, "%s %s [%s]", id, report.failed_text, command.c_str().get());
  } else if (report.with_standard_error) {
    TRACE_ERROR(trace, "%s %s [%d] %s [%s], STDERR=[%s]", id, report.failed_text, exitCode, report.failed_source,
                command.c_str().get(), standardError.c_str().get());
  } else {
    TRACE_ERROR(trace, "%s %s [%d] %s [%s]", id, report.failed_text, exitCode, report.failed_source,
                command.c_str().get());
  }
}

}  // namespace

TASK_RC runAndReport(const CommandReport& report, const String& command, const String& in, bool nonBlocking,
                     char** environment, TaskQueueElem* request, CommandOutput& output) {
  const Trace trace(traceUnit);
  int exitCode = 0;
  if (!VMQ::Util::runCommandEnv(command, environment, exitCode, output.out, output.err, in, nonBlocking)) {
    TRACE_ERROR(trace, "%s %s [%s]", rcToMsgId(report.not_started_rc), report.not_started_text, command.c_str().get());
    setMessage(request, report.not_started_rc, requestName(report, request) + command);
    return report.not_started_rc;
  }
  if (exitCode != 0) {
    traceFailure(trace, report, command, exitCode, output.err);
    setMessage(request, report.failed_rc, failureParameter(report, request, command, exitCode, output.err));
    return report.failed_rc;
  }
  return TASK_OK;
}
