// Runs a command and reports.

#include <algorithm>
#include <iterator>

#include "apps/vmqctl/commands/request.h"
#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

enum class Phase {
  Opening,   ///< nothing has been sent
  Sent,      ///< the daemon may have taken the request
  Accepted,  ///< the daemon has taken it
};

// NOLINTNEXTLINE(bugprone-exception-escape): moving JSON checks what it moves, and throws nothing
struct Report {
  const char* result;  ///< in a word
  Result details;
  Json answer;
  Json event;  ///< null without one
};

/// "START of ux (inst1:node1:UX)"
std::string inWords(const Request& request) {
  const std::string product = parameter(request, "PRODUCT");
  const std::string target = parameter(request, "TARGETMSN");
  return request.command + (product.empty() ? "" : " of " + product) + (target.empty() ? "" : " (" + target + ")");
}

/// The word as a shell takes it for one word. Without backslashes, which are shown doubled.
std::string quoted(const std::string& word) {
  constexpr std::string_view plainCharacters =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._/:@%+,";
  if (!word.empty() && word.find_first_not_of(plainCharacters) == std::string::npos) return word;
  std::string result = "'";
  for (const char c : word) result += c == '\'' ? "'\"'\"'" : std::string(1, c);
  return result + "'";
}

/// How the outcome can be learnt when waiting for it has ended.
std::string outcomeHint(const Session& session, const Request& request, const std::string& transactionId) {
  if (request.outcome == Request::Outcome::AtOnce) {  // without an event; asking once more changes nothing
    return session.loop.expired() ? "Ask again, with a longer --timeout." : "Ask again.";
  }
  const std::string socket = session.loop.socket();
  return "Watch for its status event with: vmqctl watch " +
         (socket == defaultSocket ? "" : "--socket " + quoted(socket) + " ") + quoted(transactionId) +
         " (an event that was sent meanwhile is not repeated).";
}

Json ask(Session& session, const Request& request, const std::string& transactionId) {
  const std::vector<Json> rows = session.client.query("KAGREQT", predicatesOf(request, transactionId));
  if (rows.empty()) {
    throw AnswerLost(ExitCode::Failed, "The daemon answered " + inWords(request) + " without a row.");
  }
  return rows.front();
}

Json statusEvent(EventStream& events, const std::string& words) {
  StreamEvent event = events.next();
  switch (event.kind) {
    case StreamEvent::Kind::Row:
      break;
    case StreamEvent::Kind::Lost:
      throw Failure(ExitCode::Failed,
                    "The daemon had to drop the status event of " + words + ", so its outcome is not known.",
                    "Look at the agent itself.");
    case StreamEvent::Kind::End:
      throw Failure(ExitCode::NotReachable,
                    "The daemon ended its event stream before the status event of " + words +
                        " came, so its outcome is not known.",
                    "Look at the agent itself; a daemon that was stopped forgets the requests that it had not begun.");
  }
  return event.data;
}

Report exchange(Session& session, const Request& request, const RequestOptions& options, Phase& phase) {
  const bool wait = options.wait && request.outcome == Request::Outcome::Queued;
  const std::string words = inWords(request);
  session.progress.tell("asking vmqd for " + words + ", transaction " + options.transactionId);

  // The stream first: the event of a short command would else come before anybody listens.
  std::optional<EventStream> events;
  if (wait) events.emplace(session.loop, "KAGDYST", Predicates{{"TRANSID", "eq", options.transactionId}});

  phase = Phase::Sent;
  Report report = {"done", {}, ask(session, request, options.transactionId), nullptr};
  report.details = resultOf(report.answer);
  if (report.details.returnValue != 0) {
    report.result = request.outcome == Request::Outcome::Queued ? "refused" : "failed";
  } else if (wait) {
    phase = Phase::Accepted;
    session.progress.tell(
        "accepted, waiting for its status event" +
        (session.timeoutSeconds == 0 ? "" : ", " + std::to_string(session.timeoutSeconds) + " s at most"));
    report.event = statusEvent(*events, words);
    report.details = resultOf(report.event);
    if (report.details.returnValue != 0) report.result = "failed";
  } else if (request.outcome == Request::Outcome::Queued) {
    report.result = "accepted";
  }
  return report;
}

void write(const Session& session, const Request& request, const RequestOptions& options, const Report& report) {
  if (session.format == Format::AsJson) {
    Json object = {{"result", report.result},
                   {"command", request.command},
                   {"product", parameter(request, "PRODUCT")},
                   {"target", parameter(request, "TARGETMSN")},
                   {"transid", options.transactionId},
                   {"retval", report.details.returnValue},
                   {"message_id", report.details.messageId},
                   {"message", messageText(report.details.messageId)},
                   {"parameters", report.details.parameters},
                   {"answer", report.answer},
                   {"event", report.event}};
    if (!options.push.is_null()) object["push"] = options.push;
    session.console.data(jsonText(object, /*oneLine=*/false, session.console.out()));
    return;
  }
  const Json row = {{"COMMAND", request.command},
                    {"PRODUCT", parameter(request, "PRODUCT")},
                    {"TARGETMSN", parameter(request, "TARGETMSN")},
                    {"TRANSID", options.transactionId},
                    {"RESULT", report.result},
                    {"RETVAL", report.details.returnValue},
                    {"RETMSGID", report.details.messageId}};
  session.console.data(table({"COMMAND", "PRODUCT", "TARGETMSN", "TRANSID", "RESULT", "RETVAL", "RETMSGID"}, {row},
                             layoutFor(session.console.out())));
}

/// Where what the command printed can be read: the daemon traces it when a command exits non-zero. What an installer
/// printed that may restart the daemon is in files of the depot, which the message names.
std::string outputHint(const Request& request, long returnValue) {
  if (request.command == "COMPLETE_INSTALL" || parameter(request, "OPTIONAL") == "REQUIRES_RESTART") return "";
  constexpr long exitedNonZero[] = {1008, 1016, 1024, 1031, 1032};
  if (std::find(std::begin(exitedNonZero), std::end(exitedNonZero), returnValue) == std::end(exitedNonZero)) return "";
  return "What the command printed is in the trace of vmqd, in the lines STDOUT and STDERR.";
}

}  // namespace

Predicates predicatesOf(const Request& request, const std::string& transactionId) {
  Predicates all = {{"COMMAND", "eq", request.command}, {"TRANSID", "eq", transactionId}};
  all.insert(all.end(), request.parameters.begin(), request.parameters.end());
  return all;
}

std::string parameter(const Request& request, const std::string& column) {
  const auto found = std::find_if(request.parameters.begin(), request.parameters.end(),
                                  [&](const Predicate& p) { return p.column == column; });
  return found == request.parameters.end() ? "" : found->value;
}

ExitCode runRequest(Session& session, const Request& request, const RequestOptions& options) {
  const std::string words = inWords(request);
  const auto hint = [&] { return outcomeHint(session, request, options.transactionId); };
  const std::string seconds = counted(session.timeoutSeconds, "second");
  Phase phase = Phase::Opening;
  Report report;
  try {
    report = exchange(session, request, options, phase);
  } catch (const Interrupted&) {
    if (phase == Phase::Opening) {
      throw Failure(ExitCode::Interrupted, "Interrupted before " + words + " was sent; nothing has been started.");
    }
    throw Failure(ExitCode::Interrupted,
                  phase == Phase::Sent ? "Interrupted; if the daemon has taken " + words + ", it goes on with it."
                                       : "Interrupted; the daemon goes on with " + words + ".",
                  hint());
  } catch (const TimedOut&) {
    if (phase == Phase::Opening) {
      throw Failure(ExitCode::TimedOut,
                    "The daemon did not open its event stream within " + seconds + "; " + words + " was not sent.",
                    "Look at the daemon with: vmqctl status.");
    }
    throw Failure(ExitCode::TimedOut,
                  phase == Phase::Sent
                      ? "The daemon did not answer " + words + " within " + seconds + "; it may have taken it."
                      : "No status event of " + words + " came within " + seconds + "; the daemon goes on with it.",
                  hint());
  } catch (const AnswerLost& lost) {
    throw Failure(lost.code(), std::string(lost.what()) + " It may have taken " + words + " all the same.", hint());
  }

  session.progress.clear();
  const bool failed = report.details.returnValue != 0;
  if (!failed && request.shows && session.format == Format::AsTable) {
    request.shows(session.console, report.answer);
  } else {
    write(session, request, options, report);
  }
  const std::string details = explanation(report.details);
  if (failed) {
    const std::string more = request.explains ? request.explains(report.details) : "";
    session.console.error(
        words + (report.result == std::string_view("refused") ? " was refused: " : " failed: ") + details,
        more.empty() ? outputHint(request, report.details.returnValue) : more);
    return ExitCode::Failed;
  }
  if (const std::string doubt = request.doubts ? request.doubts(report.answer) : ""; !doubt.empty()) {
    session.console.line(doubt);
  }
  // A restart whose stop failed and whose start succeeded is a success that carries the stop's message.
  if (!details.empty())
    session.console.error(words + " is " + report.result + ", but a step of it failed: " + details, "");
  if (!request.afterSuccess.empty()) session.console.line(request.afterSuccess);
  return ExitCode::Done;
}

}  // namespace vmqctl
