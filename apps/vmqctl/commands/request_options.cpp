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

void addRequestOptions(Verb& verb, RequestArguments& arguments, Request::Outcome outcome) {
  verb.text("--transid ID", arguments.transactionId, "Transaction id, unique among requests (default: one is made)")
      .check([](const std::string& id) {
        return id.size() <= maximumTransactionIdBytes
                   ? std::string()
                   : "longer than " + std::to_string(maximumTransactionIdBytes) + " bytes";
      });
  if (outcome == Request::Outcome::Queued) {
    verb.flag("--no-wait", arguments.noWait, "End when the request is accepted; do not wait for its status event");
  }
  verb.flag("--dry-run", arguments.dryRun, "Show the request that would be sent, and send nothing");
}

std::string transactionIdFor(const RequestArguments& arguments) {
  return arguments.transactionId.empty() ? newTransactionId() : arguments.transactionId;
}

Action requestAction(const Request& request, const RequestArguments& arguments) {
  const RequestOptions options = {transactionIdFor(arguments), !arguments.noWait};
  checkSendable(predicatesOf(request, options.transactionId));
  if (arguments.dryRun) return [=](Session& session) { return show(session, request, options.transactionId); };
  return [=](Session& session) { return runRequest(session, request, options); };
}

}  // namespace vmqctl
