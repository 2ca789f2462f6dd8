#pragma once
// The deployment tasks, as the linker gives them to a test program (--wrap): each only records that it was called.

#include <functional>
#include <string>
#include <vector>

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"

/// The tasks of this program while it lives. For one thread.
struct RecordedTasks {
  RecordedTasks();
  ~RecordedTasks();
  RecordedTasks(const RecordedTasks&) = delete;
  RecordedTasks& operator=(const RecordedTasks&) = delete;

  /// In order: the task's name, and for agents the product code and the instance name.
  std::vector<std::string> calls;
  /// What a task does, when it is set; otherwise it succeeds. getInstanceName does not ask: it answers "instance of "
  /// and the managed system name.
  std::function<TASK_RC(TaskQueueElem&)> behaviour;
};
