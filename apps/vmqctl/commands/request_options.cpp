// Options of requests.

#include "apps/vmqctl/commands/request_options.h"

#include "apps/vmqctl/transaction_id.h"

namespace vmqctl {
namespace {

ExitCode show(Session& session, const Request& request, const std::string& transactionId) {
  session.console.line("not sent: POST /v1/tables/KAGREQT/query");
  const Json body = {{"predicates", toJson(predicatesOf(request, transactionId))}};
  session.console.data(jsonText(body, /*oneLine=*/false, session.console.out()));
  return ExitCode::Done;
}

}  // namespace

void addRequestOptions(CLI::App& verb, RequestArguments& arguments, Request::Outcome outcome) {
  const auto fits = [](const std::string& id) {
    return id.size() <= maximumTransactionIdBytes
               ? std::string()
               : "longer than " + std::to_string(maximumTransactionIdBytes) + " bytes";
  };
  verb.add_option("--transid", arguments.transactionId, "Transaction id, unique among requests (default: one is made)")
      ->type_name("ID")
      ->check(notEmpty)
      ->check(CLI::Validator(fits, ""));
  if (outcome == Request::Outcome::Queued) {
    verb.add_flag("--no-wait", arguments.noWait, "End when the request is accepted; do not wait for its status event");
  }
  verb.add_flag("--dry-run", arguments.dryRun, "Show the request that would be sent, and send nothing");
}

std::string transactionIdFor(const RequestArguments& arguments) {
  return arguments.transactionId.empty() ? newTransactionId() : arguments.transactionId;
}

Action requestAction(const Request& request, const RequestArguments& arguments, unsigned defaultTimeoutSeconds) {
  const std::string transactionId = transactionIdFor(arguments);
  if (arguments.dryRun) {
    (void)toJson(predicatesOf(request, transactionId));  // refuses what could not be sent
    return {defaultTimeoutSeconds,
            [request, transactionId](Session& session) { return show(session, request, transactionId); }};
  }
  const RequestOptions options = {transactionId, !arguments.noWait};
  return {defaultTimeoutSeconds,
          [request, options](Session& session) { return runRequest(session, request, options); }};
}

}  // namespace vmqctl
