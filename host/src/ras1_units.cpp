// The list of known units and the configuration in force.

#include "ras1_units.h"

#include <pthread.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <mutex>
#include <string>

#include "environment.h"
#include "lock.h"
#include "ras1.h"
#include "ras1_levels.h"
#include "ras1_log.h"
#include "seam.h"

namespace {

using namespace vmqhost;

constinit std::mutex mutex;  // guards what follows
constinit RAS1_Unit* firstUnit = nullptr;
constinit std::atomic<bool> configured{false};  // written under the mutex

LevelRules& rulesInForce() {
  static auto& rules = *new LevelRules;
  return rules;
}

/// REQUIRES: mutex held.
uint32_t levelsOf(const RAS1_Unit& unit) {
  return seam::captureActive.load(std::memory_order_relaxed) ? kAllLevels : rulesInForce().levelsOf(unit.name);
}

/// REQUIRES: mutex held.
void refreshUnitsLocked() {
  for (RAS1_Unit* unit = firstUnit; unit != nullptr; unit = unit->next) {
    unit->levels.store(levelsOf(*unit), std::memory_order_relaxed);
  }
}

/// What the environment asks for, read and opened but not yet in force.
struct Configuration {
  LevelRules rules;
  OpenedLog log;

  /// These return false and say in `error` what is wrong. REQUIRES: mutex not held, because they take the environment's
  /// lock, whose holders may trace.
  bool readRules(std::string& error) {
    if (rules.parse(environmentValue("KBB_RAS1", ""), error)) return true;
    error = "KBB_RAS1: " + error;
    return false;
  }
  bool openLog(std::string& error) {
    if (log.open(environmentValue("KBB_RAS1_LOG", ""), error)) return true;
    error = "KBB_RAS1_LOG: " + error;
    return false;
  }

  /// REQUIRES: mutex held.
  void use() {
    log.use();
    rulesInForce() = std::move(rules);
    configured.store(true, std::memory_order_release);
    refreshUnitsLocked();
  }
};

constinit RAS1_Unit ownUnit{"host/ras1"};

/// For a process that never called RAS1_Configure: a mistake costs the setting it is in, and one line tells of it.
void configureFromEnvironment() {
  Configuration configuration;
  std::string rules_error;
  std::string log_error;
  configuration.readRules(rules_error);
  configuration.openLog(log_error);
  {
    const std::lock_guard held(mutex);
    if (configured.load(std::memory_order_relaxed)) return;
    configuration.use();
  }
  for (const std::string& error : {rules_error, log_error}) {
    if (!error.empty()) RAS1_Printf(&ownUnit, RAS1_ERROR, __LINE__, __func__, "%s", error.c_str());
  }
}

// ---- fork: the child gets both locks free ----------------------------------------------------------------------

void beforeFork() {
  (void)acquire(environmentLock);
  mutex.lock();
}

void afterFork() {
  mutex.unlock();
  (void)release(environmentLock);
}

/// ENOMEM is the only failure, at load time, when there is nobody to tell.
[[maybe_unused]] const int forkHandlersRegistered = pthread_atfork(beforeFork, afterFork, afterFork);

}  // namespace

void vmqhost::refreshUnits() {
  const std::lock_guard held(mutex);
  refreshUnitsLocked();
}

uint32_t RAS1_Sync(RAS1_Unit* unit) try {
  if (!configured.load(std::memory_order_acquire)) {
    const int saved = errno;  // about to be traced, perhaps
    configureFromEnvironment();
    errno = saved;
  }
  const std::lock_guard held(mutex);
  if (unit->levels.load(std::memory_order_relaxed) == RAS1_UNRESOLVED) {
    unit->next = firstUnit;
    firstUnit = unit;
  }
  const uint32_t levels = levelsOf(*unit);
  unit->levels.store(levels, std::memory_order_relaxed);
  return levels;
} catch (...) {
  return RAS1_ERROR;  // no memory for the configuration: the next line tries again
}

bool RAS1_Configure(char* error, unsigned long errorSize) {
  std::string reason;
  try {
    Configuration configuration;
    if (configuration.readRules(reason) && configuration.openLog(reason)) {
      const std::lock_guard held(mutex);
      configuration.use();
      return true;
    }
  } catch (...) {
    reason = "no memory";  // short enough to need none
  }
  if (error != nullptr && errorSize > 0) {
    const size_t length = std::min<size_t>(reason.size(), errorSize - 1);
    std::memcpy(error, reason.data(), length);
    error[length] = '\0';
  }
  return false;
}
