#pragma once
// What every verb is told on the command line, and what it works with.

#include <functional>
#include <optional>
#include <string>

#include "apps/vmqctl/api_client.h"
#include "apps/vmqctl/exit_codes.h"
#include "apps/vmqctl/output.h"

namespace vmqctl {

struct Settings {
  std::string socket;  ///< --socket; "" without it
  Format format = Format::AsTable;
  std::optional<unsigned> timeoutSeconds;  ///< --timeout; 0 for no limit
};

/// One run of a verb. One thread.
struct Session {
  Session(const Console& theConsole, const Settings& settings, unsigned defaultTimeoutSeconds);

  const Console& console;
  const Format format;
  const unsigned timeoutSeconds;
  Progress progress;
  HttpLoop loop;
  ApiClient client;
};

/// --socket, else the environment's VMQ_SOCKET, else where packages put it. Throws a Failure of usage when the path
/// cannot be one of a socket.
std::string socketPath(const Settings& settings);

constexpr const char* defaultSocket = "/run/vmqd/vmqd.sock";

/// What a verb does with the arguments that it was given.
using Action = std::function<ExitCode(Session&)>;

}  // namespace vmqctl
