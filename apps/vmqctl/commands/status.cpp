// status: whether the daemon is well, and what it serves.

#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/commands/verbs.h"
#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

constexpr unsigned defaultTimeoutSeconds = 30;  // nothing here makes the daemon work

std::string orElse(const std::string& text, const char* instead) {
  return text.empty() ? instead : text;
}

Json member(const Json& object, const char* name) {
  return object.value(name, Json());
}

std::string tableNames(const Json& tables) {
  std::string names;
  for (const Json& entry : tables) {
    if (entry.is_object()) names += (names.empty() ? "" : " ") + textIn(entry, "table");
  }
  return names;
}

ExitCode run(Session& session) {
  session.progress.turn("asking vmqd how it is");
  const Json daemon = session.client.get("/v1");
  const Json health = session.client.get("/v1/health");
  const Json tables = member(session.client.get("/v1/tables"), "tables");
  session.progress.clear();

  const Stream& out = session.console.out();
  if (session.format == Format::AsJson) {
    Json whole = {{"socket", session.loop.socket()}};
    whole.update(daemon);
    whole["health"] = health;
    whole["tables"] = tables;
    session.console.data(jsonText(whole, /*oneLine=*/false, out));
  } else {
    session.console.data(record({{"socket", session.loop.socket()},
                                 {"version", textIn(daemon, "version")},
                                 {"node", textIn(daemon, "node")},
                                 {"home", orElse(textIn(daemon, "home"), "none: commands are disabled")},
                                 {"depot", orElse(textIn(daemon, "depot"), "the home")},
                                 {"health", textIn(health, "status")},
                                 {"uptime", plain(member(health, "uptime_seconds")) + " s"},
                                 {"watchers", plain(member(health, "watchers"))},
                                 {"tables", orElse(tableNames(tables), "none")}},
                                layoutFor(out)));
  }
  if (textIn(health, "status") == "ok") return ExitCode::Done;
  throw Failure(ExitCode::Failed, "The daemon does not call itself well.", "Look at its trace log.");
}

}  // namespace

void addStatus(Verbs& verbs) {
  Verb verb = verbs.add("status", "Show whether the daemon is well, and what it serves.", defaultTimeoutSeconds,
                        [] { return run; });
  verb.footer("Example:\n  vmqctl status -o json");
}

}  // namespace vmqctl
