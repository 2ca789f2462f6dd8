#pragma once
// What the component can be told to do: one row for each command.

#include <span>

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// A parameter that must not be empty.
struct RequiredParameter {
  const char* name;  ///< null: none
  VMQ::String TaskQueueElem::*value;
  TASK_RC missing;  ///< the answer when it is empty
};

/// What is different when the product is the data agent.
enum class ForDataAgent {
  kNothing,
  kNoChecks,  ///< its parameters are checked by the task itself
  kRefused,
};

struct Command {
  const char* name;  ///< upper case; compared exactly
  enum Answer { kQueued, kAtOnce } answer;
  ForDataAgent forDataAgent;
  RequiredParameter required[3];  ///< in the order in which they are checked
  TASK_RC (*run)(TaskQueueElem& request);
  TASK_RC couldNotStart;  ///< the result when the task ends with an exception
};

/// All commands, in the order in which they are offered.
std::span<const Command> commandTable();

/// The row of a command, or null.
const Command* findCommand(const VMQ::String& name);

/// True for the product code "um" in any mix of upper and lower case.
bool isDataAgent(const VMQ::String& productCode);

/// Runs the command's task on the calling thread. An exception of the task ends here: it is traced and answered with
/// the command's "could not start" code, whose message carries the command and the product code.
TASK_RC runCommandTask(const Command& command, TaskQueueElem& request);
