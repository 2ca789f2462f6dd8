#pragma once
// Running a task's command and telling its three ends apart: could not be started, exited non-zero, fine.
// What a task reports for each is data.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// How an exit code appears in a message parameter.
enum class ReturnCodeForm {
  kAbsent,
  kDecimal,
  kCharacter,  ///< one character whose code is the exit code, not its digits: kept on purpose
};

/// What a task reports when its command does not end well. The texts are traced behind the message id.
struct CommandReport {
  TASK_RC not_started_rc;
  const char* not_started_text;  ///< traced as "<id> <text> [<command>]"
  TASK_RC failed_rc;
  const char* failed_text;     ///< traced as "<id> <text> [<exit code>] <source> [<command>]"
  const char* failed_source;   ///< null: traced as "<id> <text> [<command>]"
  bool names_request = false;  ///< the message parameter begins with COMMAND and PRODUCT
  ReturnCodeForm return_code = ReturnCodeForm::kDecimal;
  bool with_standard_error = false;  ///< what the command wrote there ends the trace line and the message parameter
};

/// The output of a command that ended with exit code 0.
struct CommandOutput {
  VMQ::String out;
  VMQ::String err;
};

/// Runs the command with `in` on its standard input. TASK_OK with `output` filled when it exited with 0; otherwise the
/// failure's code, with the message id and parameter in the request, which may be null.
/// The parts of a message parameter are joined by ",": COMMAND, PRODUCT, exit code, command, standard error; without
/// COMMAND and PRODUCT the command stands before the exit code.
TASK_RC runAndReport(const CommandReport& report, const VMQ::String& command, const VMQ::String& in, bool nonBlocking,
                     char** environment, TaskQueueElem* request, CommandOutput& output);
