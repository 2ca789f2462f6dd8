// What every verb works with.

#include "apps/vmqctl/settings.h"

#include <sys/un.h>

#include <cstdlib>

#include "apps/vmqctl/failure.h"

namespace vmqctl {

Session::Session(const Console& theConsole, const Settings& settings, unsigned defaultTimeoutSeconds)
    : console(theConsole),
      format(settings.format),
      timeoutSeconds(settings.timeoutSeconds.value_or(defaultTimeoutSeconds)),
      progress(theConsole),
      loop(socketPath(settings), timeoutSeconds, progress),
      client(loop) {}

std::string socketPath(const Settings& settings) {
  const char* fromEnvironment = std::getenv("VMQ_SOCKET");
  std::string path = !settings.socket.empty()                                 ? settings.socket
                     : fromEnvironment != nullptr && *fromEnvironment != '\0' ? fromEnvironment
                                                                              : defaultSocket;
  constexpr std::size_t room = sizeof(sockaddr_un::sun_path);
  if (path.size() >= room) {
    throw Failure(ExitCode::Usage, "The path of the socket is too long: " + path + ".",
                  "Give --socket a path of at most " + std::to_string(room - 1) + " bytes.");
  }
  return path;
}

}  // namespace vmqctl
