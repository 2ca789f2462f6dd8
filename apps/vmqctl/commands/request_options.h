#pragma once
// What every verb that sends a request takes on the command line, and how the request is then run.

#include <string>

#include "apps/vmqctl/command_line.h"
#include "apps/vmqctl/commands/request.h"

namespace vmqctl {

struct RequestArguments {
  std::string transactionId;
  bool noWait = false;
  bool dryRun = false;
};

/// Adds --transid, --dry-run and, for a command whose outcome comes later, --no-wait.
void addRequestOptions(Verb& verb, RequestArguments& arguments, Request::Outcome outcome);

/// The transaction id that was given, or a new one.
std::string transactionIdFor(const RequestArguments& arguments);

/// Sends the request, or shows what would be sent. `dryRun` shows on standard output, as JSON, the body of the HTTP
/// request; nothing is sent. Throws a Failure of usage at once when the request could not be sent.
Action requestAction(const Request& request, const RequestArguments& arguments);

}  // namespace vmqctl
