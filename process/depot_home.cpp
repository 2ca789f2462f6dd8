// The depot of the management server's tables.
#include <cerrno>
#include <string>

#include "util/resource_bundle.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/depot_home"};

constexpr int failure = -1;
constexpr char commentCharacter = '*';

// The management server's name, as the installation's settings give it; empty when it cannot be told.
String askServerName(const String& home) {
  const Trace trace(traceUnit);
  const String command =
      String("/bin/sh -c \"grep CELLNAME ") + home + String("config/.ConfigData/kmsenv | grep -v default\"");
  TRACE_DETAIL(trace, "Running command: %s", command.c_str().get());
  int rc = 0;
  String out;
  String err;
  if (!Util::runCommand(command, rc, out, err, /*nonBlocking=*/false)) {
    TRACE_ERROR(trace, "Unable to determine RMS name, process failed to start");
    return String();
  }
  if (rc != 0) {
    TRACE_ERROR(trace, "Error running command, retCode = %d", rc);
    TRACE_ERROR(trace, "Error message is: %s", err.c_str().get());
    TRACE_ERROR(trace, "Unable to determine RMS name, error running command");
    return String();
  }
  const unsigned bar = out.find(String("|"), 0U);
  if (bar == String::NPOS || bar == 0) {  // an empty name would give the directory of all servers
    TRACE_ERROR(trace, "Unable to determine RMS name from kmsenv, stdout=[%s]", out.c_str().get());
    return String();
  }
  String name = out.substr(0U, bar);
  TRACE_DETAIL(trace, "RMS name found: %s", name.c_str().get());
  return name;
}

// The depot that the server's environment file names, or the default; empty when the file cannot be read.
String depotOfServer(const String& serverDir) {
  const Trace trace(traceUnit);
  const String file = serverDir + String("/KBBENV");
  String fallback = serverDir + String("/depot");
  if (!Util::pathExists(file)) {
    TRACE_DETAIL(trace, "Can't find %s, defaulting DEPOTHOME to %s", file.c_str().get(), fallback.c_str().get());
    return fallback;
  }
  try {
    const ResourceBundle bundle(file, commentCharacter);
    const String* const value = bundle.getValue(String("DEPOTHOME"));
    if (value != nullptr && value->length() > 0) return *value;
  } catch (const ResourceBundleException& exception) {
    // It may name a depot elsewhere: the default would be a guess.
    TRACE_ERROR(trace, "%s", exception.getErrorMessage().c_str().get());
    return String();
  }
  TRACE_DETAIL(trace, "No DEPOTHOME in KBBENV, defaulting DEPOTHOME to %s", fallback.c_str().get());
  return fallback;
}

int checkDepot(const String& depot, bool create) {
  const Trace trace(traceUnit);
  if (Util::pathExists(depot)) return 0;
  if (!create) {
    TRACE_ERROR(trace, "Path [%s] does not exist", depot.c_str().get());
    return ENOENT;
  }
  TRACE_DETAIL(trace, "Path [%s] does not exist, attempting to create", depot.c_str().get());
  std::string path = depot.toNarrow();
  const int rc = Util::createDir(path.data());
  if (rc != 0) {
    TRACE_ERROR(trace, "Could not create depot dir [%s]", depot.c_str().get());
    return rc;
  }
  TRACE_DETAIL(trace, "Depot directory [%s] created", depot.c_str().get());
  return 0;
}

}  // namespace

int Util::getDepotHome(String& home, bool packages, bool create) {
  const Trace trace(traceUnit);
  const int rc = getDepotHome_UNIX(home, packages, create);
  TRACE_DETAIL(trace, "Depot home is: %s", home.c_str().get());
  return rc;
}

int Util::getDepotHome_UNIX(String& home, bool packages, bool create) {
  const Trace trace(traceUnit);
  const String name = askServerName(home);
  if (name.length() == 0) return failure;
  String depot = depotOfServer(home + String("tables/") + name);
  if (depot.length() == 0) return failure;
  if (packages) depot.append(String("/PACKAGES/"));
  if (const int rc = checkDepot(depot, create); rc != 0) return rc;
  home = depot;
  return 0;
}

}  // namespace VMQ
