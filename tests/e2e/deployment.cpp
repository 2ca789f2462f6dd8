#include "tests/e2e/deployment.h"

Watcher::Watcher(const std::string& socket, const std::string& query) : client_(socket) {
  const HttpReply reply = client_.watch("/v1/tables/KAGDYST/events" + (query.empty() ? "" : "?" + query));
  EXPECT_EQ(reply.status, 200);
  const auto first = client_.nextEvent();
  EXPECT_TRUE(first && first->name == "open") << "the watch does not open";
}

nlohmann::json Watcher::next() {
  while (const auto event = client_.nextEvent())
    if (event->name == "row") return parsedJson(event->data);
  return nullptr;
}

void Deployment::startDaemon(const std::vector<std::string>& lines) {
  daemon = std::make_unique<DaemonFixture>(DaemonFixture::Options{.home = home.path(), .library = "", .lines = lines});
}

void Deployment::startHurriedDaemon() {
  daemon = std::make_unique<DaemonFixture>(
      DaemonFixture::Options{.home = home.path(), .library = VMQ_HURRIED_COMPONENT, .lines = {}});
}

Outcome Deployment::vmqctl(const std::string& arguments) const {
  return runShell("VMQ_SOCKET=" + quoted(daemon->socket()) + " " VMQ_PROGRAMS "/vmqctl " + arguments + " </dev/null");
}

void Deployment::assembleBundles(const std::string& folder) {
  const Outcome outcome = runShell("VMQ_EXPORTER=" + quoted(VMQ_EXPORTER) +
                                   " " VMQ_SOURCE_DIR "/examples/bundles/assemble " + quoted(folder));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
}

void Deployment::sendBundles() const {
  const TemporaryDirectory folder;
  assembleBundles(folder / "bundles");
  const Outcome outcome = vmqctl("push " + quoted(folder / "bundles") + "/*");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
}

nlohmann::json Deployment::query(const std::string& table, const Json& predicates) {
  const HttpReply reply =
      HttpClient(daemon->socket()).post("/v1/tables/" + table + "/query", Json{{"predicates", predicates}}.dump());
  EXPECT_EQ(reply.status, 200) << reply.body;
  return parsedJson(reply.body)["rows"];
}

nlohmann::json Deployment::ask(const Json& request) {
  const Json rows = query("KAGREQT", request);
  EXPECT_EQ(rows.size(), 1U) << rows;
  return rows.at(0);
}

nlohmann::json Deployment::carryOut(const Json& request) {
  Watcher watcher(daemon->socket(), "TRANSID=" + request["TRANSID"].get<std::string>());
  EXPECT_THAT(ask(request), Succeeded()) << "not accepted";
  return watcher.next();
}

std::string Deployment::command(const std::string& rest) const {
  return home / "bin/CorvelAgent" + "  -h " + home.path() + " " + rest;
}
