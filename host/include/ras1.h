#pragma once
// Trace service of the host agent. Every function here may be called from any thread, and between fork and exec of a
// plain fork: writing a line takes no lock. All but RAS1_Configure leave errno as it was.

#include <atomic>
#include <cstdint>

/// What a trace line is; a unit's level is a set of these.
enum RAS1_Level : uint32_t {
  RAS1_ERROR = 1,   ///< failures
  RAS1_EVENT = 2,   ///< entry to and exit from routines
  RAS1_DETAIL = 4,  ///< everything else
};

/// Entry to, or exit from, the traced routine.
enum RAS1_EventKind : uint32_t { RAS1_ENTRY, RAS1_EXIT };

/// A unit that has not asked for its levels yet. All bits are set, so a unit's first line takes the slow path.
inline constexpr uint32_t RAS1_UNRESOLVED = 0xFFFFFFFFu;

/// One traced source unit, named like "tasks/start_stop". REQUIRES: static storage duration, constant-initialised
/// (the trace service keeps a pointer to it for the life of the process).
struct RAS1_Unit {
  const char* name;
  std::atomic<uint32_t> levels{RAS1_UNRESOLVED};  ///< set of RAS1_Level, or RAS1_UNRESOLVED
  RAS1_Unit* next = nullptr;                      ///< the service's list of known units
};

extern "C" {

/// Makes the unit known to the service, looks its levels up in the configuration, stores and returns them.
uint32_t RAS1_Sync(RAS1_Unit* unit);

/// Writes one line (a trailing line feed of the text is dropped, others are written as "\n"). Does not test the level:
/// callers ask RAS1_Enabled first, so that arguments of silent lines are never computed.
[[gnu::format(printf, 5, 6)]] void RAS1_Printf(RAS1_Unit* unit, RAS1_Level level, int line, const char* function,
                                               const char* format, ...);

/// Writes the entry or exit line of a routine. Does not test the level.
void RAS1_Event(RAS1_Unit* unit, RAS1_EventKind kind, int line, const char* function);

/// For the process that owns the trace (daemon, tests): reads KBB_RAS1 and KBB_RAS1_LOG again, reopens the log and
/// gives every known unit its levels. Returns false, with a message in `error` (of `errorSize` bytes, terminated), when
/// KBB_RAS1 does not follow its syntax or the log cannot be opened; the previous configuration then stays.
/// Syntax of KBB_RAS1: items joined by ",", each `[unit-prefix=]level[+level...]` with the levels none, error, event,
/// detail and all; an item without a prefix is for every unit; of the items that match a unit the last one counts.
/// Example: "error,tasks/=all,util/string=none". Unset or empty is "error", and so is a unit that no item matches. The
/// log is appended to; unset or empty means standard error.
bool RAS1_Configure(char* error, unsigned long errorSize);

}  // extern "C"

/// True when lines of this level are wanted from the unit. One relaxed load when they are not.
inline bool RAS1_Enabled(RAS1_Unit& unit, RAS1_Level level) {
  uint32_t levels = unit.levels.load(std::memory_order_relaxed);
  if ((levels & level) == 0) [[likely]]
    return false;
  if (levels == RAS1_UNRESOLVED) levels = RAS1_Sync(&unit);
  return (levels & level) != 0;
}
