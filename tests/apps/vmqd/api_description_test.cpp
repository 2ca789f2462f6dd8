// docs/api.yaml against a running daemon: everything that it describes is what the daemon does.

#include "tests/apps/vmqd/api_description.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "apps/vmqd/refusal.h"
#include "apps/vmqd/routes.h"
#include "tests/apps/vmqd/test_daemon.h"

namespace {

using nlohmann::json;
using ::testing::IsEmpty;
using ::testing::Not;

const ApiDescription& description() {
  static const ApiDescription& it = *new ApiDescription(VMQ_SOURCE_DIR "/docs/api.yaml");
  return it;
}

std::string upperCase(std::string text) {
  for (char& c : text) c = static_cast<char>(std::toupper(c));
  return text;
}

std::string lowerCase(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(c));
  return text;
}

/// "METHOD path" of every operation described.
std::set<std::string> describedOperations() {
  std::set<std::string> operations;
  for (const auto& path : description().paths()) {
    for (const auto& member : path.second) {
      const std::string method = upperCase(member.first.as<std::string>());
      if (method != "PARAMETERS") operations.insert(method + " " + path.first.as<std::string>());
    }
  }
  return operations;
}

TEST(ApiDescriptionFile, HasTheRoutesOfTheDaemonAndNoOthers) {
  std::set<std::string> known;
  for (const vmqd::Route& route : vmqd::routes())
    known.insert(std::string(route.method) + " " + std::string(route.path));
  EXPECT_EQ(known, describedOperations());
}

/// Brings one status about on one path, whose parameters have the names of the description.
class Provocation {
 public:
  HttpReply reply(int status, const std::string& method, const std::string& path) {
    switch (status) {
      case 200:
        return good(method, path);
      case 400:
        return bad(method, path);
      case 403:
        return asAnotherUser(method, on(path, "ECHO"));
      case 404:
        return ask(daemon_, method, on(path, "NONE"), "{}");
      case 422:
        return ask(daemon_, method, on(path, /*operation=*/"1"), "469762055");
      case 405:
        return ask(daemon_, "DELETE", on(path, "ECHO"), "");
      case 413:
        return tooLarge(method, on(path, "ECHO"));
      case 500:
        return failing(method, path);
      case 503:
        return crowded(method, on(path, "ECHO"));
      default:
        throw std::runtime_error("nobody knows how to bring about " + std::to_string(status));
    }
  }

 private:
  static constexpr const char* queryBody = R"({"predicates":{"COUNT":2}})";

  static bool isQuery(const std::string& path) { return path.find("/query") != std::string::npos; }
  static bool isCall(const std::string& path) { return path.find("/rpc/") != std::string::npos; }
  static bool isDepot(const std::string& path) { return path.find("/depot/") != std::string::npos; }
  /// The path with the value in place of its last parameter.
  static std::string on(std::string path, const std::string& value) {
    const size_t interface = path.find("{interface}");
    if (interface != std::string::npos) path.replace(interface, 11, "5a000000-0000-0000-0000-000000000001");
    const size_t parameter = path.find('{');
    if (parameter != std::string::npos) path.replace(parameter, path.find('}') + 1 - parameter, value);
    return path;
  }
  HttpReply good(const std::string& method, const std::string& path) const {
    if (isQuery(path)) return ask(daemon_, method, on(path, "ECHO"), queryBody);
    if (isCall(path)) return ask(daemon_, method, on(path, "0"), "text");
    if (isDepot(path)) daemon_.directory().writeFile("depot/a/file", "text");
    return ask(daemon_, method, on(path, isDepot(path) ? "a/file" : "EVENTS"), "");
  }
  /// Streams are read up to their first event.
  static HttpReply ask(HttpClient& client, const std::string& method, const std::string& path,
                       const std::string& body) {
    if (isCall(path)) {
      return client.request(method, path + "?version=3", body, "Data-Representation: 10000000\r\n");
    }
    if (path.find("/events") == std::string::npos || method != "GET") return client.request(method, path, body);
    HttpReply reply = client.watch(path);
    if (reply.status == 200) reply.body = client.nextEvent()->data;
    return reply;
  }
  static HttpReply ask(const TestDaemon& daemon, const std::string& method, const std::string& path,
                       const std::string& body) {
    HttpClient client(daemon.socket());
    return ask(client, method, path, body);
  }
  HttpReply bad(const std::string& method, const std::string& path) const {
    if (isQuery(path)) return ask(daemon_, method, on(path, "ECHO"), "[]");
    if (isCall(path)) return HttpClient(daemon_.socket()).request(method, on(path, "0"), "without a label");
    if (isDepot(path)) return ask(daemon_, method, on(path, "../file"), "");
    return ask(daemon_, method, on(path, "ECHO") + "?NONE=1", "");
  }
  HttpReply failing(const std::string& method, const std::string& path) const {
    if (isQuery(path)) return ask(daemon_, method, on(path, "FAILS"), R"({"predicates":{"TEXT":"create"}})");
    if (isDepot(path)) {
      std::filesystem::create_symlink("/proc/self/mem", daemon_.depot() + "/unreadable");
      return ask(daemon_, method, on(path, "unreadable"), "");
    }
    return ask(daemon_, method, on(path, "FAILS") + "?TEXT=create", "");
  }
  HttpReply tooLarge(const std::string& method, const std::string& path) const {
    HttpClient client(daemon_.socket());
    (void)client.send(method + " " + path + " HTTP/1.1\r\nHost: x\r\nContent-Length: 99999999\r\n\r\n");
    return client.receive();
  }
  HttpReply crowded(const std::string& method, const std::string& path) const {
    const TestDaemon small({"maximum_connections = 4"});
    std::vector<std::unique_ptr<HttpClient>> clients;
    for (int count = 0; count < 4; ++count) {
      clients.push_back(std::make_unique<HttpClient>(small.socket()));
      (void)clients.back()->get("/v1");
    }
    return ask(small, method, path, "");
  }
  /// REQUIRES: root. The kernel notes the effective user at the time of the connection.
  HttpReply asAnotherUser(const std::string& method, const std::string& path) const {
    chmod(daemon_.directory().path().c_str(), 0755);
    chmod(daemon_.socket().c_str(), 0666);
    if (seteuid(54321) != 0) throw std::runtime_error("cannot change the user");
    std::unique_ptr<HttpClient> client;
    try {
      client = std::make_unique<HttpClient>(daemon_.socket());
    } catch (const std::exception&) {
    }
    if (seteuid(0) != 0 || !client) throw std::runtime_error("cannot connect as another user");
    return client->request(method, path);
  }

  const TestDaemon daemon_;
};

TEST(ApiDescriptionFile, TellsTheStatusAndShapeOfEachReply) {
  Provocation provocation;
  for (const auto& path : description().paths()) {
    for (const auto& operation : path.second) {
      const std::string method = upperCase(operation.first.as<std::string>());
      if (method == "PARAMETERS") continue;
      for (const auto& response : operation.second["responses"]) {
        const int status = response.first.as<int>();
        SCOPED_TRACE(method + " " + path.first.as<std::string>() + " " + std::to_string(status));
        if (status == 403 && geteuid() != 0) continue;  // peers_test asserts what such a user can see of it
        const HttpReply reply = provocation.reply(status, method, path.first.as<std::string>());
        EXPECT_EQ(status, reply.status) << reply.body;
        const YAML::Node described = description().resolved(response.second);
        const std::string type = reply.headers.at("content-type");
        ASSERT_TRUE(described["content"][type]) << type;
        const YAML::Node schema = status == 200 && type == "text/event-stream" ? description().schema("Opened")
                                                                               : described["content"][type]["schema"];
        if (type == "application/octet-stream") {
          EXPECT_EQ("binary", schema["format"].as<std::string>());
        } else {
          EXPECT_EQ("", description().mismatch(parsedJson(reply.body), schema)) << reply.body;
        }
        for (const auto& header : described["headers"]) {
          EXPECT_EQ(1u, reply.headers.count(lowerCase(header.first.as<std::string>())));
        }
      }
    }
  }
}

TEST(ApiDescriptionFile, TellsTheShapeOfEvents) {
  const TestDaemon daemon({"event_buffer_rows = 1"});
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/EVENTS/events").status);
  const std::map<std::string, std::string> schemas = {{"open", "Opened"}, {"row", "Row"}, {"lost", "Lost"}};
  (void)daemon.query("EVENTS", R"({"COUNT":20000})");
  std::set<std::string> seen;
  while (seen.size() < schemas.size()) {
    const auto event = watcher.nextEvent();
    ASSERT_TRUE(event && schemas.count(event->name) == 1) << event->name;
    EXPECT_EQ("", description().mismatch(parsedJson(event->data), description().schema(schemas.at(event->name))));
    seen.insert(event->name);
  }
}

TEST(ApiDescriptionFile, DescribesTheQueriesThatAreAccepted) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::map<std::string, int> bodies = {
      {"{}", 200},
      {R"({"predicates":{}})", 200},
      {R"({"predicates":{"TEXT":"a","NUMBER":1,"COUNT":{"ge":0}}})", 200},
      {R"({"predicates":{"TEXT":{"ne":"a"},"NUMBER":{"lt":"5"}}})", 200},
      {"[]", 400},
      {R"({"predicates":1})", 400},
      {R"({"other":1})", 400},
      {R"({"predicates":{"TEXT":null}})", 400},
      {R"({"predicates":{"TEXT":1.5}})", 400},
      {R"({"predicates":{"TEXT":{}}})", 400},
      {R"({"predicates":{"TEXT":{"eq":1,"ne":2}}})", 400},
      {R"({"predicates":{"TEXT":{"like":"a"}}})", 400},
      {R"({"predicates":{"TEXT":{"eq":[]}}})", 400},
  };
  for (const auto& [body, status] : bodies) {
    SCOPED_TRACE(body);
    const std::string mismatch = description().mismatch(parsedJson(body), description().schema("Query"));
    EXPECT_EQ(status == 200, mismatch.empty()) << mismatch;
    EXPECT_EQ(status, client.post("/v1/tables/ECHO/query", body).status);
  }
}

TEST(ApiDescriptionFile, HasAnExampleThatItsOwnSchemaAccepts) {
  const YAML::Node query = description().schema("Query");
  // YAML does not tell numbers from text, so what is compared here is the shape alone.
  std::function<json(const YAML::Node&)> asJson = [&](const YAML::Node& node) -> json {
    if (!node.IsMap()) return node.as<std::string>();
    json object = json::object();
    for (const auto& member : node) object[member.first.as<std::string>()] = asJson(member.second);
    return object;
  };
  EXPECT_EQ("", description().mismatch(asJson(query["example"]), query));
}

TEST(ApiDescriptionFile, KnowsEveryErrorCode) {
  std::set<std::string> described;
  for (const auto& code : description().schema("Error")["properties"]["error"]["properties"]["code"]["enum"]) {
    described.insert(code.as<std::string>());
  }
  using namespace vmqd::errors;
  std::set<std::string> codes;
  for (const vmqd::ErrorCode& code : {badJson, badRequest, unknownColumn, unknownOperator, notAllowed, unknownTable,
                                      unknownRoute, notFound, methodNotAllowed, bodyTooLarge, fault, internal, busy}) {
    codes.insert(std::string(code.name));
  }
  EXPECT_EQ(codes, described);
}

// The checks above are only worth something if they fail where they should.
TEST(Mismatches, AreFound) {
  const auto& api = description();
  EXPECT_EQ("$ is no object", api.mismatch(parsedJson("[]"), api.schema("Health")));
  EXPECT_EQ("$ lacks status", api.mismatch(parsedJson(R"({"uptime_seconds":1,"watchers":0})"), api.schema("Health")));
  EXPECT_EQ("$.watchers is no integer",
            api.mismatch(parsedJson(R"({"status":"ok","uptime_seconds":1,"watchers":"0"})"), api.schema("Health")));
  EXPECT_EQ("$.status is none of the values listed",
            api.mismatch(parsedJson(R"({"status":"bad","uptime_seconds":1,"watchers":0})"), api.schema("Health")));
  EXPECT_EQ("$ has an undescribed member x",
            api.mismatch(parsedJson(R"({"status":"ok","uptime_seconds":1,"watchers":0,"x":1})"), api.schema("Health")));
  EXPECT_EQ("$.rows[0].A is 0 of the choices",
            api.mismatch(parsedJson(R"({"table":"T","rows":[{"A":null}]})"), api.schema("Rows")));
}

}  // namespace
