// vmqctl, the operator's client of vmqd.

#include <new>

#include "apps/vmqctl/cli.h"
#include "apps/vmqctl/failure.h"

namespace {

using namespace vmqctl;

ExitCode run(int argc, char** argv, const Console& console) {
  CommandLine commandLine;
  if (const std::optional<std::string> text = parseCommandLine(argc, argv, commandLine)) {
    console.data(*text);
    return ExitCode::Done;
  }
  Session session(console, commandLine.settings, commandLine.action.defaultTimeoutSeconds);
  try {
    return commandLine.action.run(session);
  } catch (const Interrupted&) {
    throw Failure(ExitCode::Interrupted, "Interrupted while waiting for the daemon.");
  } catch (const TimedOut&) {
    throw Failure(ExitCode::TimedOut,
                  "The daemon did not answer within " + std::to_string(session.timeoutSeconds) + " seconds.",
                  "Allow it more with --timeout.");
  }
}

}  // namespace

int main(int argc, char** argv) {
  const Console console = Console::ofThisProcess();
  try {
    return static_cast<int>(run(argc, argv, console));
  } catch (const Failure& failure) {
    console.error(failure.what(), failure.next());
    return static_cast<int>(failure.code());
  } catch (const std::exception& error) {
    console.error(std::string("An operation of the system failed: ") + error.what() + ".", "");
    return static_cast<int>(ExitCode::Failed);
  }
}
