// The parts of a data agent's managed system name.

#include "tasks/da_config.h"
#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/managed_system_name"};

/// The part before ":DA"; empty when there is none.
String beforeType(const String& managedSystemName) {
  const Trace trace(traceUnit);
  const unsigned end = managedSystemName.find(String(":DA"), 0);
  return end == String::NPOS || end == 0 ? String() : managedSystemName.substr(0, end);
}

/// The position of the ":" that ends an instance name; NPOS when there is none.
unsigned endOfInstance(const String& instanceAndHost) {
  const Trace trace(traceUnit);
  const unsigned end = instanceAndHost.find(String(":"), 0);
  return end == 0 ? String::NPOS : end;
}

}  // namespace

String getDaInstanceName(const String& managedSystemName) {
  const Trace trace(traceUnit);
  const String name = beforeType(managedSystemName);
  const unsigned end = endOfInstance(name);
  String instance = end == String::NPOS ? String() : name.substr(0, end);
  TRACE_DETAIL(trace, "Returning instance <%s> for managed system name <%s>", instance.c_str().get(),
               managedSystemName.c_str().get());
  return instance;
}

String getDaHostName(const String& managedSystemName) {
  const Trace trace(traceUnit);
  const String name = beforeType(managedSystemName);
  const unsigned end = endOfInstance(name);
  String host = name;
  if (end != String::NPOS) host = end + 1 < name.length() ? name.substr(end + 1) : String();
  TRACE_DETAIL(trace, "Returning hostname <%s> for managed system name <%s>", host.c_str().get(),
               managedSystemName.c_str().get());
  return host;
}
