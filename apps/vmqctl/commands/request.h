#pragma once
// A command for an agent, and the one way in which every command is sent, waited for and reported.

#include <string>

#include "apps/vmqctl/settings.h"

namespace vmqctl {

struct Request {
  enum class Outcome {
    Queued,  ///< the answer says only that it was accepted; a status event follows
    AtOnce,  ///< the answer is the outcome
  };

  std::string command;    ///< COMMAND, such as "START"
  Predicates parameters;  ///< the others, but for TRANSID
  Outcome outcome = Outcome::Queued;
};

struct RequestOptions {
  std::string transactionId;  ///< not empty
  bool wait = true;           ///< for the status event of a queued command
};

/// The value of a parameter, "" without it.
std::string parameter(const Request& request, const std::string& column);

/// Sends the request, waits for its outcome, writes it to standard output and explains a failure on standard error.
/// Returns Done or Failed; throws a Failure when the outcome is not known.
ExitCode runRequest(Session& session, const Request& request, const RequestOptions& options);

}  // namespace vmqctl
