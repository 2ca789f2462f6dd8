#pragma once
// One deployment request on its way from the request table to a task and back as a result.

#include "mgmt/rows.h"
#include "tasks/task_rc.h"
#include "util/string.h"

namespace VMQ {

/// Owned by one thread at a time. A copy copies every text and the whole row.
/// Whoever sets a result sets `retmsgid` (from rcToMsgId) and `retmsgparm` before reporting it.
class TaskQueueElem {
 public:
  /// Empty texts and a row of zero bytes.
  TaskQueueElem();
  TaskQueueElem(const String& originnode, const String& transid, const String& command, const String& product,
                const String& context, const String& optional, const String& daconfig, const String& dascript,
                const String& version, const String& targetmsn);

  /// The synchronous answer: fills `row` from the texts and the return code.
  void ReturnStatus(int rc);

  /// The later answer: sleeps one second, then sends one event of the status table to whoever listens. An event that
  /// nobody listens for is dropped.
  void returnAsyncStatus(int rc);

  /// Fills a character column of `size` bytes: blank-padded, not terminated; a longer text is cut, which only the trace
  /// tells.
  static void SetValueAndPad(char* dst, unsigned long size, const char* src);

  String originnode;
  String transid;
  String command;
  String product;
  String context;
  String optional;
  String daconfig;
  String dascript;
  String version;
  String targetmsn;
  String retmsgid;
  String retmsgparm;
  vmq_kagreqt_data_t row;
};

}  // namespace VMQ

using VMQ::TaskQueueElem;
