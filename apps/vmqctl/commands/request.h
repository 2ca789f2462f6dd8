#pragma once
// A command for an agent, and the one way in which every command is sent, waited for and reported.

#include <functional>
#include <string>

#include "apps/vmqctl/commands/result.h"
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
  /// Shows the answer row of a success in place of the table; for commands whose answer is what was asked for.
  std::function<void(const Console& console, const Json& answer)> shows = {};
  /// A line for the person about the answer row of a success, "" for none.
  std::function<std::string(const Json& answer)> doubts = {};
  /// What more there is to say of a failure, "" for nothing.
  std::function<std::string(const Result& failure)> explains = {};
  std::string afterSuccess = {};  ///< a line for the person when the command has succeeded
};

struct RequestOptions {
  std::string transactionId;  ///< not empty
  bool wait = true;           ///< for the status event of a queued command
  Json push = nullptr;        ///< what was sent to the depot before it: the member "push" of its JSON; null for none
};

/// The value of a parameter, "" without it.
std::string parameter(const Request& request, const std::string& column);

/// Everything that is sent, in this order: COMMAND, TRANSID and the others.
Predicates predicatesOf(const Request& request, const std::string& transactionId);

/// Sends the request, waits for its outcome, writes it to standard output and explains a failure on standard error.
/// Returns Done or Failed; throws a Failure when the outcome is not known.
ExitCode runRequest(Session& session, const Request& request, const RequestOptions& options);

}  // namespace vmqctl
