// The environment that the component finds, and its trace.

#include "apps/vmqd/environment.h"

#include <stdexcept>

#include "apps/vmqd/log.h"
#include "bss1.h"
#include "ras1.h"

namespace vmqd {
namespace {

constexpr const char* traceLogVariable = "KBB_RAS1_LOG";

void put(const std::string& name, const std::string& value) {
  if (const int error = BSS1_PutEnv((name + "=" + value).c_str())) {
    throw std::runtime_error(withReason("the environment variable " + name, error));
  }
}

void putAll(const Configuration& configuration) {
  for (const auto& [name, value] : configuration.variables) put(name, value);
}

void configureTrace(const Configuration& configuration, const char* key) {
  char reason[256] = "";
  if (RAS1_Configure(reason, sizeof reason)) return;
  const auto place = configuration.places.find(key);
  // Not from the file: the variable was in the environment that vmqd was started with.
  const std::string where = place == configuration.places.end() ? std::string("environment") : place->second;
  throw ConfigurationError(where + ": " + reason);
}

}  // namespace

void applyEnvironment(const Configuration& configuration) {
  const std::string inherited_log = environmentValue(traceLogVariable);
  checkEnvironment(configuration);
  put(traceLogVariable, inherited_log);
  putAll(configuration);
  configureTrace(configuration, "trace_log");
}

void checkEnvironment(const Configuration& configuration) {
  putAll(configuration);
  // Without its log first, so that a complaint is about the one key or the other.
  put(traceLogVariable, "");
  configureTrace(configuration, "trace");
}

std::string environmentValue(const char* name) {
  return BSS1_GetEnv(name, "");
}

}  // namespace vmqd
