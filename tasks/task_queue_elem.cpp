#include "tasks/task_queue_elem.h"

#include <cstring>
#include <string>

#include "bss1.h"
#include "mgmt/kagdyst.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"tasks/task_queue_elem"};

/// A text as one column of a row.
template <unsigned long size>
void fillColumn(char (&column)[size], const String& text) {
  TaskQueueElem::SetValueAndPad(column, size, text.toNarrow().c_str());
}

}  // namespace

TaskQueueElem::TaskQueueElem() : row{} {}

TaskQueueElem::TaskQueueElem(const String& originnodeText, const String& transidText, const String& commandText,
                             const String& productText, const String& contextText, const String& optionalText,
                             const String& daconfigText, const String& dascriptText, const String& versionText,
                             const String& targetmsnText)
    : originnode(originnodeText),
      transid(transidText),
      command(commandText),
      product(productText),
      context(contextText),
      optional(optionalText),
      daconfig(daconfigText),
      dascript(dascriptText),
      version(versionText),
      targetmsn(targetmsnText),
      row{} {}

void TaskQueueElem::ReturnStatus(int rc) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Returning status return code [%d], message id [%s] parms [%s]", rc, retmsgid.c_str().get(),
               retmsgparm.c_str().get());
  fillColumn(row.originnode, originnode);
  fillColumn(row.transid, transid);
  fillColumn(row.command, command);
  fillColumn(row.product, product);
  fillColumn(row.context, context);
  fillColumn(row.optional, optional);
  fillColumn(row.daconfig, daconfig);
  fillColumn(row.dascript, dascript);
  fillColumn(row.version, version);
  row.retval = rc;
  fillColumn(row.retmsgid, retmsgid);
  fillColumn(row.retmsgparm, retmsgparm);
  fillColumn(row.targetmsn, targetmsn);
}

// NOLINTNEXTLINE(readability-make-member-function-const): the interface
void TaskQueueElem::returnAsyncStatus(int rc) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Returning aysnc status return code [%d], message id [%s] parms [%s]", rc, retmsgid.c_str().get(),
               retmsgparm.c_str().get());
  vmq_kagdyst_data_t status{};
  fillColumn(status.originnode, originnode);
  fillColumn(status.transid, transid);
  fillColumn(status.command, command);
  fillColumn(status.targetmsn, targetmsn);
  fillColumn(status.retmsgid, retmsgid);
  fillColumn(status.retmsgparm, retmsgparm);
  status.retval = rc;
  BSS1_Sleep(1);
  // A listener that cannot take the event is the listener's loss: the task has ended either way.
  (void)vmq_kagdyst_manager::EventArrived(&status, 1);
}

void TaskQueueElem::SetValueAndPad(char* dst, unsigned long size, const char* src) {
  const Trace trace(traceUnit);
  const size_t length = std::strlen(src);
  if (length <= size) {
    std::memcpy(dst, src, length);  // NOLINT(bugprone-not-null-terminated-result): blanks fill a column
    std::memset(dst + length, ' ', size - length);
    return;
  }
  std::memcpy(dst, src, size);
  TRACE_ERROR(trace,
              "Result data \"%s\" was truncated to \"%.*s\" because it exceeded the maximum size of %d characters", src,
              static_cast<int>(size), dst, static_cast<int>(size));
}

}  // namespace VMQ
