#include "tasks/two_way_translator.h"

#include "tasks/da_config.h"
#include "tasks/product_arch.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/two_way_translator"};

constexpr CommandReport translatorReport(bool with_standard_error) {
  return {.not_started_rc = TASK_TRANSLATOR_NOT_STARTED,
          .not_started_text = "Failed to start two way translator using command",
          .failed_rc = TASK_TRANSLATOR_FAILED,
          .failed_text = "Received bad return code",
          .failed_source = "from two-way translator command",
          .names_request = true,
          .return_code = ReturnCodeForm::kDecimal,
          .with_standard_error = with_standard_error};
}

constexpr CommandReport SETCONFIG_REPORT = translatorReport(/*with_standard_error=*/true);

TASK_RC runForRequest(const CommandReport& report, const char* option, const String& in, TaskQueueElem& request,
                      CommandOutput& output) {
  String translator;
  if (!findTranslatorFor(request, translator)) return TASK_NO_TRANSLATOR;
  return runAndReport(report, translatorCommand(translator, option, request.targetmsn, request.product), in,
                      /*nonBlocking=*/false, /*environment=*/nullptr, &request, output);
}

/// The translator's answer for a managed system name; empty on any failure.
String askForInstance(const Trace& trace, const String& productCode, const String& managedSystemName) {
  String translator;
  if (!getTwoWayTranslator(translator)) {
    TRACE_ERROR(trace, "No two-way translator found for product code [%s]", productCode.c_str().get());
    return String();
  }
  const String command = translatorCommand(translator, "-i", managedSystemName, productCode);
  int exitCode = 0;
  String out, err;
  if (!Util::runCommand(command, exitCode, out, err, "", /*nonBlocking=*/false)) {
    TRACE_ERROR(trace, "Failed to start two way translator using command [%s]", command.c_str().get());
    return String();
  }
  if (exitCode != 0) {
    TRACE_ERROR(trace, "Received bad return code [%d] from two-way translator command [%s]", exitCode,
                command.c_str().get());
    return String();
  }
  return out;
}

}  // namespace

// NOLINTNEXTLINE(cert-err58-cpp): without that little memory the host had better not load the component
const CommandReport TRANSLATOR_REPORT = translatorReport(/*with_standard_error=*/false);

bool getTwoWayTranslator(String& translator) {
  const Trace trace(traceUnit);
  translator = getSharedLibArchDir() + "/" + "vmq_xa";
  if (Util::pathExists(translator)) {
    TRACE_DETAIL(trace, "Using default two-way translator [%s]", translator.c_str().get());
    return true;
  }
  TRACE_ERROR(trace, "No two-way translator found, default translator [%s] does not exist", translator.c_str().get());
  translator.clear();
  return false;
}

bool findTranslatorFor(TaskQueueElem& request, String& translator) {
  const Trace trace(traceUnit);
  if (getTwoWayTranslator(translator)) return true;
  TRACE_ERROR(trace, "%s No two-way translator found for product code [%s]", rcToMsgId(TASK_NO_TRANSLATOR),
              request.product.c_str().get());
  request.retmsgid = rcToMsgId(TASK_NO_TRANSLATOR);
  request.retmsgparm = request.command + "," + request.product;
  return false;
}

String translatorCommand(const String& translator, const char* option, const String& name, const String& productCode) {
  return translator + " " + option + " " + name + " -pc " + productCode;
}

TASK_RC getConfig(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  CommandOutput output;
  const TASK_RC rc = runForRequest(TRANSLATOR_REPORT, "-g", "", request, output);
  if (rc == TASK_OK) {
    const unsigned configuration = output.out.find(String("INSTANCE="), 0);
    if (configuration != String::NPOS) request.context = output.out.substr(configuration);
  }
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}

TASK_RC setConfig(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  CommandOutput output;
  const TASK_RC rc = runForRequest(SETCONFIG_REPORT, "-p", request.context, request, output);
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}

String getInstanceName(const String& productCode, const String& managedSystemName) {
  const Trace trace(traceUnit);
  String instance;
  if (managedSystemName.length() != 0)
    instance = productCode == "um" ? getDaInstanceName(managedSystemName)
                                   : askForInstance(trace, productCode, managedSystemName);
  instance.trim();
  TRACE_DETAIL(trace, "Returning instance [%s] for managed system name [%s]", instance.c_str().get(),
               managedSystemName.c_str().get());
  return instance;
}
