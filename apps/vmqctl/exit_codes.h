#pragma once
// What the process ends with; scripts rely on these numbers (docs/vmqctl.md).

namespace vmqctl {

enum class ExitCode : int {
  Done = 0,
  Failed = 1,        ///< the daemon or the command said no, or the outcome is not known
  Usage = 2,         ///< the command line is wrong; nothing has been sent
  NotAllowed = 4,    ///< the socket or the daemon does not admit this user
  TimedOut = 6,      ///< --timeout has passed
  NotReachable = 7,  ///< no daemon on the socket, or it went away
  Interrupted = 130,
};

}  // namespace vmqctl
