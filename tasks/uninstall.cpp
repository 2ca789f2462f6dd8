#include "tasks/uninstall.h"

#include "bss1.h"
#include "tasks/command_report.h"
#include "tasks/product_arch.h"
#include "tasks/task_manager.h"
#include "tasks/two_way_translator.h"
#include "util/corvel_home.h"
#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/uninstall"};

constexpr CommandReport UNINSTALL_REPORT = {.not_started_rc = TASK_UNINSTALL_NOT_STARTED,
                                            .not_started_text = "Failed to start uninstall command",
                                            .failed_rc = TASK_UNINSTALL_FAILED,
                                            .failed_text = "Bad return code",
                                            .failed_source = "from uninstall command",
                                            .return_code = ReturnCodeForm::kCharacter};

/// The command for a product of the standard inventory; empty when its architecture is not known.
String standardUninstallCommand(const String& product) {
  const String arch = getSharedLibArch(product, BSS1_GetEnv("QOR_BINARCH", ""));
  if (arch.length() == 0) return String();
  return String(VMQ_CORVELHOME) + "/" + "bin" + "/" + "uninstall.sh -i " + product + " " + arch;
}

/// The command that the server sent for installing, turned into the one for uninstalling.
String commandOfRequest(const TaskQueueElem& request) {
  return String::replace(replaceTokens(request.context, request.product, request.version), "_Silent_Install.txt",
                         "_silent_uninstall.txt");
}

}  // namespace

String replaceTokens(const String& text, const String& productCode, const String& version) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Received String is [%s]", text.c_str().get());
  String deployDirectory = depotDir + productCode;
  if (productCode != "ci") deployDirectory.append(String("/") + version);
  String resolved = String::replace(text, "|DEPLOYDIR|", deployDirectory);
  resolved = String::replace(resolved, "|CORVELHOME|", VMQ_CORVELHOME);
  resolved = String::replace(resolved, "|DEPOTDIR|", depotDir);
  TRACE_DETAIL(trace, "Resolved String is [%s]", resolved.c_str().get());
  return resolved;
}

TASK_RC uninstall(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const bool standard = isProductInStandardInventory(request.product);
  const String command = standard ? standardUninstallCommand(request.product) : commandOfRequest(request);
  if (standard && command.length() == 0) {
    const char* id = rcToMsgId(TASK_NO_PRODUCT_ARCHITECTURE);
    TRACE_ERROR(trace, "%s No product architecture found for product [%s]", id, request.product.c_str().get());
    request.retmsgid = id;
    request.retmsgparm = request.product;
    return TASK_NO_PRODUCT_ARCHITECTURE;
  }
  TRACE_DETAIL(trace, "UnInstall command is [%s]", command.c_str().get());
  CommandOutput output;
  const TASK_RC rc =
      runAndReport(UNINSTALL_REPORT, command, "", /*nonBlocking=*/false, /*environment=*/nullptr, &request, output);
  if (rc == TASK_OK) TRACE_DETAIL(trace, "UnInstall returned 0 return code.");
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}

TASK_RC removeInstance(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  String translator = request.product;
  if (!findTranslatorFor(request, translator)) return TASK_NO_TRANSLATOR;
  CommandOutput output;
  const TASK_RC rc =
      runAndReport(TRANSLATOR_REPORT, translatorCommand(translator, "-r", request.targetmsn, request.product),
                   request.context, /*nonBlocking=*/false, /*environment=*/nullptr, &request, output);
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}
