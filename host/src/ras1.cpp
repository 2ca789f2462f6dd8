// Writing of trace lines.

#include "ras1.h"

#include <time.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdarg>

#include "line_buffer.h"
#include "ras1_log.h"
#include "seam.h"

namespace {

using vmqhost::LineBuffer;

const char* levelName(RAS1_Level level) {
  switch (level) {
    case RAS1_ERROR:
      return "error";
    case RAS1_EVENT:
      return "event";
    case RAS1_DETAIL:
      return "detail";
  }
  return "?";
}

/// By hand: gmtime_r takes a lock of the C library, which another thread may hold when this one forks.
void appendTime(LineBuffer& line, const timespec& time) {
  using namespace std::chrono;
  const sys_seconds moment{seconds(time.tv_sec)};
  const auto day = floor<days>(moment);
  const year_month_day date(day);
  const hh_mm_ss clock(moment - day);
  line.append("%04d-%02u-%02uT%02d:%02d:%02d.%06ldZ", static_cast<int>(date.year()),
              static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()),
              static_cast<int>(clock.hours().count()), static_cast<int>(clock.minutes().count()),
              static_cast<int>(clock.seconds().count()), time.tv_nsec / 1000);
}

[[gnu::format(printf, 5, 0)]] void printLine(const RAS1_Unit& unit, RAS1_Level level, int number, const char* function,
                                             const char* format, va_list arguments) {
  timespec time{};
  (void)clock_gettime(CLOCK_REALTIME, &time);  // cannot fail for this clock
  LineBuffer line;
  appendTime(line, time);
  line.append(" %d %s %s:%d %s: ", static_cast<int>(gettid()), levelName(level), unit.name, number, function);
  const size_t text = line.size();
  line.append(format, arguments);
  line.makeOneLine(text);
  line.endLine();
  vmqhost::writeToLog(line.data(), line.size());
}

}  // namespace

void RAS1_Printf(RAS1_Unit* unit, RAS1_Level level, int line, const char* function, const char* format, ...) {
  const int saved = errno;  // callers trace between a failed call and their look at errno
  va_list arguments;
  va_start(arguments, format);
  if (vmqhost::seam::captureActive.load(std::memory_order_relaxed)) [[unlikely]] {
    vmqhost::seam::captureLine(*unit, level, function, format, arguments);
  } else {
    printLine(*unit, level, line, function, format, arguments);
  }
  va_end(arguments);
  errno = saved;
}

void RAS1_Event(RAS1_Unit* unit, RAS1_EventKind kind, int line, const char* function) {
  RAS1_Printf(unit, RAS1_EVENT, line, function, "%s", kind == RAS1_ENTRY ? "entry" : "exit");
}
