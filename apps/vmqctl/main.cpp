// vmqctl, the operator's client of vmqd.

#include <fcntl.h>
#include <unistd.h>

#include <new>

#include "apps/vmqctl/cli.h"
#include "apps/vmqctl/failure.h"

namespace {

using namespace vmqctl;

/// A file or socket that is opened must not become a standard stream because that was closed: what is said would go
/// into it.
void openStandardStreams() {
  int descriptor = 0;
  while (descriptor >= 0 && descriptor <= STDERR_FILENO) descriptor = open("/dev/null", O_RDWR);
  if (descriptor > STDERR_FILENO) (void)close(descriptor);  // they were open already
}

ExitCode run(int argc, char** argv, const Console& console) {
  Invocation invocation;
  if (const std::optional<std::string> text = parseCommandLine(argc, argv, invocation)) {
    console.data(*text);
    return ExitCode::Done;
  }
  Session session(console, invocation.settings, invocation.defaultTimeoutSeconds);
  try {
    return invocation.action(session);
  } catch (const Interrupted&) {
    throw Failure(ExitCode::Interrupted, "Interrupted while waiting for the daemon.");
  } catch (const TimedOut&) {
    throw Failure(ExitCode::TimedOut,
                  "The daemon did not answer within " + counted(session.timeoutSeconds, "second") + ".",
                  "Allow it more with --timeout.");
  }
}

}  // namespace

int main(int argc, char** argv) {
  openStandardStreams();
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
