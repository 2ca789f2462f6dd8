// watch: status events as they come.

#include <climits>
#include <memory>
#include <optional>

#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

struct Arguments {
  std::string transactionId;
  std::optional<unsigned> count;
};

/// "t1: START of inst1:node1:UX on node1 failed: VMQ1024E The agent control script ..."
std::string inWords(const Json& row) {
  const Result result = resultOf(row);
  const std::string target = textIn(row, "TARGETMSN");
  const std::string details = explanation(result);
  return textIn(row, "TRANSID") + ": " + textIn(row, "COMMAND") + (target.empty() ? "" : " of " + target) + " on " +
         textIn(row, "ORIGINNODE") +
         (result.returnValue == 0 ? details.empty() ? " done" : " done, but a step of it failed: " : " failed: ") +
         details;
}

void show(const Session& session, const Json& row) {
  const Stream& out = session.console.out();
  session.console.data(session.format == Format::AsJson ? jsonText(row, /*oneLine=*/true, out)
                                                        : escaped(inWords(row), out.charset) + "\n");
}

Predicates filterOf(const Arguments& arguments) {
  if (arguments.transactionId.empty()) return {};
  return {{"TRANSID", "eq", arguments.transactionId}};
}

/// Returns once `count` events have come; throws else.
void watch(Session& session, const Arguments& arguments) {
  EventStream events(session.loop, "KAGDYST", filterOf(arguments));
  session.progress.tell("watching for status events" +
                        (arguments.transactionId.empty() ? "" : " of " + arguments.transactionId) + ", Ctrl-C ends");
  for (unsigned seen = 0; !arguments.count || seen < *arguments.count;) {
    const StreamEvent event = events.next();
    session.progress.clear();
    switch (event.kind) {
      case StreamEvent::Kind::Row:
        show(session, event.data);
        ++seen;
        break;
      case StreamEvent::Kind::Lost:
        session.console.error("Events are missing here: " + plain(event.data.value("rows", Json("some"))) + ".",
                              "The daemon dropped them because they were not read fast enough.");
        break;
      case StreamEvent::Kind::End:
        throw Failure(ExitCode::NotReachable, "The daemon has ended the event stream.",
                      "When it runs again, watch anew; events in between are not repeated.");
    }
    if (session.loop.expired()) throw TimedOut();  // also when events come without a pause
  }
}

ExitCode run(Session& session, const Arguments& arguments) {
  try {
    watch(session, arguments);
  } catch (const Interrupted&) {
    // The way to end it.
  } catch (const TimedOut&) {
    throw Failure(ExitCode::TimedOut,
                  "The time of --timeout, " + counted(session.timeoutSeconds, "second") + ", is over.");
  }
  return ExitCode::Done;
}

}  // namespace

void addWatch(Verbs& verbs) {
  const auto arguments = std::make_shared<Arguments>();
  Verb verb = verbs.add("watch", "Show status events, a line each, as they come. Ctrl-C ends it.",
                        /*defaultTimeoutSeconds=*/0, [arguments] {
                          checkSendable(filterOf(*arguments));
                          return [arguments](Session& session) { return run(session, *arguments); };
                        });
  verb.text("TRANSID", arguments->transactionId, "Only those of the request with this transaction id");
  verb.number("--count N", arguments->count, {1, UINT_MAX}, "End after this many events");
  verb.footer(
      "Events sent before it listens are not repeated.\n"
      "Examples:\n"
      "  vmqctl watch\n"
      "  vmqctl watch t1 --count 1 --timeout 60");
}

}  // namespace vmqctl
