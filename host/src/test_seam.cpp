// What tests can make the services do. Everything here outlives the objects that control it, because a thread may still
// be inside a service when its test ends.

#include "test_seam.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <new>

#include "ras1_units.h"
#include "seam.h"

namespace seam = vmqhost::seam;

namespace vmqhost::seam {

constinit std::atomic<bool> captureActive{false};
constinit std::atomic<bool> sleepsRecorded{false};
constinit std::atomic<bool> waitsRecorded{false};
constinit std::atomic<int64_t> wallClockAhead{0};
constinit std::atomic<int64_t> elapsedClockAhead{0};
constinit std::atomic<bool> failureArmed{false};

namespace {

constexpr int64_t kMillisecondsPerSecond = 1000;

/// Guards the records below.
constinit std::mutex mutex;

struct Records {
  std::vector<TEST_TraceCapture::Line> lines;
  std::vector<unsigned> sleeps;
  std::vector<int64_t> waits;
  std::string failingService;
  unsigned callsUntilFailure = 0;
  int failureStatus = 0;
  bool failureHappened = false;
};

Records& records() {
  static auto& kept = *new Records;
  return kept;
}

void moveClocks(int64_t milliseconds) {
  wallClockAhead.fetch_add(milliseconds, std::memory_order_relaxed);
  elapsedClockAhead.fetch_add(milliseconds, std::memory_order_relaxed);
}

[[gnu::format(printf, 1, 0)]] std::string formatted(const char* format, va_list arguments) {
  char* text = nullptr;
  const int length = vasprintf(&text, format, arguments);
  if (length < 0) return format;
  std::string result(text, static_cast<size_t>(length));
  std::free(text);
  return result;
}

}  // namespace

void captureLine(const RAS1_Unit& unit, RAS1_Level level, const char* function, const char* format,
                 va_list arguments) try {
  TEST_TraceCapture::Line line{level, unit.name, function, formatted(format, arguments)};
  const std::lock_guard held(mutex);
  if (captureActive) records().lines.push_back(std::move(line));
} catch (const std::bad_alloc&) {
  // Tests of a lack of memory lose the line rather than the process.
}

void recordSleep(unsigned seconds) {
  const std::lock_guard held(mutex);
  records().sleeps.push_back(seconds);
  moveClocks(int64_t{seconds} * kMillisecondsPerSecond);
}

void recordTimedOutWait(int64_t milliseconds) {
  const std::lock_guard held(mutex);
  records().waits.push_back(milliseconds);
  moveClocks(std::max<int64_t>(milliseconds, 0));
}

bool takeFailure(const char* service, int* status) {
  const std::lock_guard held(mutex);
  Records& kept = records();
  if (!failureArmed || kept.failingService != service || --kept.callsUntilFailure > 0) return false;
  failureArmed = false;
  kept.failureHappened = true;
  *status = kept.failureStatus;
  return true;
}

}  // namespace vmqhost::seam

TEST_TraceCapture::TEST_TraceCapture() {
  clear();
  seam::captureActive = true;
  vmqhost::refreshUnits();
}

TEST_TraceCapture::~TEST_TraceCapture() {
  {
    const std::lock_guard held(seam::mutex);
    seam::captureActive = false;
  }
  vmqhost::refreshUnits();
}

std::vector<TEST_TraceCapture::Line> TEST_TraceCapture::lines() const {
  const std::lock_guard held(seam::mutex);
  return seam::records().lines;
}

std::vector<std::string> TEST_TraceCapture::texts(RAS1_Level level) const {
  std::vector<std::string> found;
  for (Line& line : lines()) {
    if (line.level == level) found.push_back(std::move(line.text));
  }
  return found;
}

bool TEST_TraceCapture::has(RAS1_Level level, const std::string& text) const {
  const std::vector<std::string> found = texts(level);
  return std::find(found.begin(), found.end(), text) != found.end();
}

bool TEST_TraceCapture::hasPrefix(RAS1_Level level, const std::string& prefix) const {
  const std::vector<std::string> found = texts(level);
  return std::any_of(found.begin(), found.end(), [&](const std::string& text) { return text.starts_with(prefix); });
}

void TEST_TraceCapture::clear() {
  const std::lock_guard held(seam::mutex);
  seam::records().lines.clear();
}

TEST_RecordedSleeps::TEST_RecordedSleeps() {
  const std::lock_guard held(seam::mutex);
  seam::records().sleeps.clear();
  seam::sleepsRecorded = true;
}

TEST_RecordedSleeps::~TEST_RecordedSleeps() {
  const std::lock_guard held(seam::mutex);
  seam::sleepsRecorded = false;
  if (!seam::waitsRecorded) seam::wallClockAhead = 0;
}

std::vector<unsigned> TEST_RecordedSleeps::seconds() const {
  const std::lock_guard held(seam::mutex);
  return seam::records().sleeps;
}

TEST_RecordedWaits::TEST_RecordedWaits() {
  const std::lock_guard held(seam::mutex);
  seam::records().waits.clear();
  seam::waitsRecorded = true;
}

TEST_RecordedWaits::~TEST_RecordedWaits() {
  const std::lock_guard held(seam::mutex);
  seam::waitsRecorded = false;
  if (!seam::sleepsRecorded) seam::wallClockAhead = 0;
}

std::vector<int64_t> TEST_RecordedWaits::milliseconds() const {
  const std::lock_guard held(seam::mutex);
  return seam::records().waits;
}

TEST_FailCall::TEST_FailCall(const std::string& service, unsigned n, int status) {
  const std::lock_guard held(seam::mutex);
  seam::Records& kept = seam::records();
  kept.failingService = service;
  kept.callsUntilFailure = n;
  kept.failureStatus = status;
  kept.failureHappened = false;
  seam::failureArmed = n > 0;
}

TEST_FailCall::~TEST_FailCall() {
  seam::failureArmed = false;
}

bool TEST_FailCall::happened() const {
  const std::lock_guard held(seam::mutex);
  return seam::records().failureHappened;
}
