// Where a child writes its own trace.
#include <string>

#include "bss1.h"
#include "process/spawn.h"
#include "util/log_pruning.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/child_trace"};

constexpr char kLogSetting[] = "KBB_RAS1_LOG=";
constexpr char kLogPrefix[] = "vmqproc_ras1";
constexpr int kLogsKept = 10;

}  // namespace

std::string childTraceSetting() {
  const Trace trace(traceUnit);
  const char* const levels = BSS1_GetEnv("KBB_RAS1", nullptr);
  if (levels == nullptr || *levels == '\0') return "";

  String home;
  if (!Util::getCorvelHomeDir(home)) {
    TRACE_DETAIL(trace, "Disabling RAS1 for child process");
    return kLogSetting;
  }
  const std::string directory = home.toNarrow() + "logs";
  pruneLogs(directory.c_str(), kLogPrefix, kLogsKept);
  const std::string log = directory + "/" + kLogPrefix + "_" + std::to_string(BSS1_GetTime()) + ".log";
  TRACE_DETAIL(trace, "Sending child process RAS1 tracing to %s", log.c_str());
  return kLogSetting + log;
}

}  // namespace VMQ
