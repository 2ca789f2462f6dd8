// Running a command: its input written, its output collected while it runs, its end awaited.
#include <poll.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <limits>
#include <vector>

#include "bss1.h"
#include "process/output_collector.h"
#include "process/process.h"
#include "process/stdin_writer.h"
#include "process/trace_errno.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/command_runner"};

constexpr int64_t kNever = std::numeric_limits<int64_t>::max();
constexpr int kNoStatus = 255;
constexpr int kTailPasses = 4;

/// Milliseconds as poll takes them.
int pollTimeout(int64_t deadline) {
  if (deadline == kNever) return -1;
  return static_cast<int>(std::clamp<int64_t>(deadline - BSS1_GetElapsed(), 0, std::numeric_limits<int>::max()));
}

/// Sleeps until the child has printed, takes input or has ended, or the deadline has come. False when that does not
/// work.
bool awaitChild(const Trace& trace, const Process& process, const std::vector<OutputCollector>& outputs,
                const StdinWriter& input, int64_t deadline) {
  std::vector<pollfd> events{{process.completionDescriptor(), POLLIN, 0}};
  for (const OutputCollector& output : outputs) {
    if (!output.ended()) events.push_back({output.descriptor(), POLLIN, 0});
  }
  if (input.pending()) events.push_back({input.descriptor(), POLLOUT, 0});
  if (poll(events.data(), events.size(), pollTimeout(deadline)) >= 0 || errno == EINTR) return true;
  const int error = errno;
  TRACE_ERRNO(trace, error);
  return false;
}

/// Writes the child's input and collects its outputs while there is any use in it. Returns the moment (BSS1_GetElapsed)
/// from which on the child is to be killed.
///
/// A set TIMEOUT bounds the whole run from the start of the child. Otherwise there is no limit while output may come
/// (installers run for long); with all outputs closed, or none wanted, what is left is a wait, and the time spent here
/// on writing the input counts as its time: a child that neither reads nor ends is killed when it would have been.
int64_t converse(Process& process, StdinWriter& input, std::vector<OutputCollector>& outputs) {
  const Trace trace(traceUnit);
  const int64_t timeout = int64_t{process.timeoutSeconds()} * 1000;
  int64_t deadline = process.timeoutIsSet() ? process.startedAtMilliseconds() + timeout : kNever;
  int tailPasses = 0;
  while (true) {
    // Asked before the streams are drained: what the child has printed by the time it ends is then not missed.
    const bool wasRunning = process.running();
    bool found = false;
    for (OutputCollector& output : outputs) found |= output.drain();
    if (wasRunning) input.write();

    const bool outputsEnded =
        std::all_of(outputs.begin(), outputs.end(), [](const OutputCollector& output) { return output.ended(); });
    if (outputsEnded && deadline == kNever) deadline = BSS1_GetElapsed() + timeout;
    if (outputsEnded && !input.pending()) break;
    if (!wasRunning) {
      // All of the child's own output fits into these passes; a daemon that it left behind may print for ever.
      if (!found || ++tailPasses == kTailPasses) break;
      continue;
    }
    if (BSS1_GetElapsed() >= deadline) break;
    if (!awaitChild(trace, process, outputs, input, deadline)) break;
  }
  input.close();
  return deadline != kNever ? deadline : BSS1_GetElapsed() + timeout;
}

void traceOutcome(const Trace& trace, const String& command, int rc, const String& out, const String& err) {
  const RAS1_Level level = rc != 0 ? RAS1_ERROR : RAS1_DETAIL;
  if (rc != 0) {
    TRACE_ERROR(trace, "Bad return code (%d) from command \"%s\"", rc, command.c_str().get());
  } else {
    TRACE_DETAIL(trace, "Return code (%d) from command \"%s\"", rc, command.c_str().get());
  }
  TRACE_AT_LEVEL(trace, level, "STDOUT [%d characters] is: %s", static_cast<int>(out.length()), out.c_str().get());
  TRACE_AT_LEVEL(trace, level, "STDERR [%d characters] is: %s", static_cast<int>(err.length()), err.c_str().get());
}

}  // namespace

bool Util::runCommand(const String& command, int& rc, String& out, String& err, const String& in, bool nonBlocking) {
  const Trace trace(traceUnit);
  return runCommandEnv(command, nullptr, rc, out, err, in, nonBlocking);
}

bool Util::runCommand(const String& command, int& rc, String& out, String& err, bool nonBlocking) {
  const Trace trace(traceUnit);
  return runCommandEnv(command, nullptr, rc, out, err, String(), nonBlocking);
}

bool Util::runCommandEnv(const String& command, char** env, int& rc, String& out, String& err, bool nonBlocking) {
  const Trace trace(traceUnit);
  return runCommandEnv(command, env, rc, out, err, String(), nonBlocking);
}

// `nonBlocking` has nothing left to ask for: no read here ever waits.
bool Util::runCommandEnv(const String& command, char** env, int& rc, String& out, String& err, const String& in,
                         bool /*nonBlocking*/) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Command to run is \"%s\"", command.c_str().get());
  Process process(command, const_cast<const char**>(env));
  if (!process.start()) {
    TRACE_ERROR(trace, "Failed to start process for cmd %s", command.c_str().get());
    return false;
  }
  const bool startsAgent = command.find(String("CorvelAgent"), 0) != String::NPOS;
  StdinWriter input(*process.getStdIn(), in.toNarrow());
  out.clear();
  err.clear();

  std::vector<OutputCollector> outputs;
  outputs.emplace_back(*process.getStdOut(), out, "outbuf");
  outputs.emplace_back(*process.getStdErr(), err, "errbuf");
  std::vector<OutputCollector> none;
  const int64_t killAt = converse(process, input, startsAgent ? none : outputs);

  rc = kNoStatus;  // unless the wait can tell
  if (!process.waitUntil(&rc, killAt)) TRACE_ERROR(trace, "Failed to wait on process");
  for (OutputCollector& output : outputs) (void)output.readOnce();  // what is left, if anything
  traceOutcome(trace, command, rc, out, err);
  return true;
}

}  // namespace VMQ
