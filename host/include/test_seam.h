#pragma once
// For tests only: what the host library can be made to do. Nothing here is called by the component or the daemon.
// Objects of these classes act while they live; at most one of each class at a time.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "ras1.h"

/// Turns every level of every unit on and keeps the lines in memory instead of writing them.
class TEST_TraceCapture {
 public:
  struct Line {
    RAS1_Level level;
    std::string unit;      ///< "tasks/start_stop"
    std::string function;  ///< as given to RAS1_Printf
    std::string text;      ///< formatted, exactly as passed: line feeds kept. Entry and exit lines: "entry" and "exit"
  };
  TEST_TraceCapture();
  ~TEST_TraceCapture();
  TEST_TraceCapture(const TEST_TraceCapture&) = delete;
  TEST_TraceCapture& operator=(const TEST_TraceCapture&) = delete;

  [[nodiscard]] std::vector<Line> lines() const;
  /// The texts of one level, in order.
  [[nodiscard]] std::vector<std::string> texts(RAS1_Level level) const;
  /// True when some line of the level has exactly this text.
  [[nodiscard]] bool has(RAS1_Level level, const std::string& text) const;
  /// True when some line of the level has a text that begins so.
  [[nodiscard]] bool hasPrefix(RAS1_Level level, const std::string& prefix) const;
  void clear();
};

/// Replaces sleeping: BSS1_Sleep records its seconds, moves the clocks (BSS1_GetTime, BSS1_GetElapsed) forward by them and
/// returns at once. In between, the clocks run on as usual. At the end BSS1_GetTime is back at the real time;
/// BSS1_GetElapsed, which never steps back, keeps its lead.
class TEST_RecordedSleeps {
 public:
  TEST_RecordedSleeps();
  ~TEST_RecordedSleeps();
  TEST_RecordedSleeps(const TEST_RecordedSleeps&) = delete;
  TEST_RecordedSleeps& operator=(const TEST_RecordedSleeps&) = delete;

  [[nodiscard]] std::vector<unsigned> seconds() const;  ///< of each BSS1_Sleep, in order
};

/// Replaces waiting: BSS1_TimedWait waits a few real milliseconds for its signal, then moves the clocks forward, as
/// TEST_RecordedSleeps does, by its whole time and returns ETIMEDOUT. For tests of what happens when time is up: on a busy
/// machine a child hardly begins in those milliseconds.
class TEST_RecordedWaits {
 public:
  TEST_RecordedWaits();
  ~TEST_RecordedWaits();
  TEST_RecordedWaits(const TEST_RecordedWaits&) = delete;
  TEST_RecordedWaits& operator=(const TEST_RecordedWaits&) = delete;

  [[nodiscard]] std::vector<int64_t> milliseconds() const;  ///< of each BSS1_TimedWait that timed out, in order
};

/// Makes one call of a service fail: the n-th from now on (n = 1: the next). Services are named like their functions,
/// "FSI1_NewList"; the result is the given status (null for those that return pointers, 0 for XML1_ParseBuffer).
/// These can: BSS1_GetEnv (its default), BSS1_PutEnv, BSS1_GetLock, BSS1_ReleaseLock, BSS1_InitializeOnce, FSI1_*,
/// XML1_ParserCreate, XML1_GetBuffer, XML1_ParseBuffer (XML1_GetErrorCode then gives the status), NLS2_GetLocale,
/// RegisterWithManager, InsertRow, Dispatch, rpc__register_mgr, rpc__malloc, rpc__alloc_pkt. What gives something back
/// (BSS1_ReleaseLock, FSI1_DeleteList) has done so, and so has Dispatch: the rows that waited are gone.
class TEST_FailCall {
 public:
  TEST_FailCall(const std::string& service, unsigned n, int status);
  ~TEST_FailCall();
  TEST_FailCall(const TEST_FailCall&) = delete;
  TEST_FailCall& operator=(const TEST_FailCall&) = delete;
  [[nodiscard]] bool happened() const;
};
