// The environment, with values that stay valid.

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>
#include <unordered_set>

#include "environment.h"
#include "lock.h"
#include "seam.h"

namespace vmqhost {

constinit BSS1_Lock environmentLock;

const char* keptText(const char* text) {
  const LockScope held(environmentLock);
  static auto& texts = *new std::unordered_set<std::string>;
  return texts.emplace(text).first->c_str();
}

const char* environmentValue(const char* name, const char* defaultValue) try {
  const LockScope held(environmentLock);
  const char* const value = name == nullptr ? nullptr : std::getenv(name);
  return value == nullptr ? defaultValue : keptText(value);
} catch (const std::bad_alloc&) {
  return defaultValue;  // the value cannot be kept, and a borrowed one would break the promise
}

}  // namespace vmqhost

using vmqhost::environmentLock;

const char* BSS1_GetEnv(const char* name, const char* defaultValue) {
  if (int status; vmqhost::seam::fails("BSS1_GetEnv", &status)) return defaultValue;
  return vmqhost::environmentValue(name, defaultValue);
}

int BSS1_PutEnv(const char* assignment) try {
  if (int status; vmqhost::seam::fails("BSS1_PutEnv", &status)) return status;
  const char* const equals = assignment == nullptr ? nullptr : std::strchr(assignment, '=');
  if (equals == nullptr || equals == assignment) return EINVAL;
  const std::string name(assignment, equals);
  const vmqhost::LockScope held(environmentLock);
  return setenv(name.c_str(), equals + 1, /*overwrite=*/1) == 0 ? 0 : errno;
} catch (const std::bad_alloc&) {
  return ENOMEM;
}

BSS1_Lock* BSS1_EnvironmentLock() {
  return &environmentLock;
}
