// Where Java is, asked of the installation's own script first.
#include <string>

#include "bss1.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/java_home"};

constexpr int directory = 0;      // of fso_test
constexpr int somethingElse = 1;  // of fso_test
constexpr char variable[] = "JAVA_HOME";

int kindOf(std::string path) {
  return Util::fso_test(path.data());
}

// The first line that the script prints; empty when it fails.
String askScript(const String& script) {
  const Trace trace(traceUnit);
  int rc = 0;
  String out;
  String err;
  String answer;
  // A first line without text is no answer, and stripping it would throw.
  if (Util::runCommand(script, rc, out, err, /*nonBlocking=*/false) && rc == 0 && out.length() > 0 && out[0] != '\r') {
    answer = out;
    Util::stripNewlineCharsFromOutput(answer);
  }
  if (answer.length() == 0) {
    TRACE_ERROR(trace, "The JavaHome script [%s] failed or returned no value", script.c_str().get());
  }
  return answer;
}

String askEnvironment() {
  const Trace trace(traceUnit);
  const char* const value = BSS1_GetEnv(variable, nullptr);
  if (value == nullptr) {
    TRACE_ERROR(trace, "Checked for a Java location in %s, but that variable is not set in the environment.", variable);
    return String();
  }
  if (*value == '\0' || kindOf(value) != directory) {
    TRACE_ERROR(trace,
                "The %s variable is set in the environment, but does not appear to reference a valid Java location.",
                variable);
    return String();
  }
  TRACE_DETAIL(trace, "Found a valid Java location in %s: \"%s\"\n", variable, value);
  return String(value);
}

}  // namespace

bool Util::getJavaHome(const String& homeDir, String& javaHome) {
  const Trace trace(traceUnit);
  const String script = homeDir + String("/bin/CorvelGetJavaHome");
  TRACE_DETAIL(trace, "JavaHome location script is [%s]", script.c_str().get());
  javaHome.clear();
  if (kindOf(script.toNarrow()) == somethingElse) {
    javaHome = askScript(script);
  } else {
    TRACE_DETAIL(trace, "The JavaHome location script [%s] was not found", script.c_str().get());
  }
  if (javaHome.length() == 0) javaHome = askEnvironment();
  return javaHome.length() > 0;
}

}  // namespace VMQ
