// watch: status events as they come.

#include <climits>
#include <memory>

#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

struct Arguments {
  std::string transactionId;
  unsigned count = 0;  ///< 0 for no limit
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

/// Returns once `count` events have come; throws else.
void watch(Session& session, const Arguments& arguments) {
  Predicates filter;
  if (!arguments.transactionId.empty()) filter.push_back({"TRANSID", "eq", arguments.transactionId});
  EventStream events(session.loop, "KAGDYST", filter);
  session.progress.tell("watching for status events" +
                        (arguments.transactionId.empty() ? "" : " of " + arguments.transactionId) + ", Ctrl-C ends");
  for (unsigned seen = 0; arguments.count == 0 || seen < arguments.count;) {
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
                  "The " + std::to_string(session.timeoutSeconds) + " seconds of --timeout are over.");
  }
  return ExitCode::Done;
}

}  // namespace

void addWatch(CLI::App& app, Invocation& invocation) {
  const auto arguments = std::make_shared<Arguments>();
  CLI::App* sub = app.add_subcommand("watch", "Show status events, a line each, as they come. Ctrl-C ends it.");
  sub->add_option("TRANSID", arguments->transactionId, "Only those of the request with this transaction id")
      ->type_name("")
      ->check(notEmpty);
  sub->add_option("--count", arguments->count, "End after this many events")
      ->type_name("N")
      ->check(CLI::Range(1U, UINT_MAX).description(""));
  addCommonOptions(*sub, invocation, /*defaultTimeoutSeconds=*/0);
  sub->footer(
      "Events sent before it listens are not repeated.\n"
      "Examples:\n"
      "  vmqctl watch\n"
      "  vmqctl watch t1 --count 1 --timeout 60");
  sub->callback([&invocation, arguments] {
    invocation.action = {0, [arguments = *arguments](Session& session) { return run(session, arguments); }};
  });
}

}  // namespace vmqctl
