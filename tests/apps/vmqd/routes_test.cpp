// Every route of a running daemon, asked well and badly.

#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"

namespace {

using nlohmann::json;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

TEST(ServiceRoute, TellsWhatRunsWhere) {
  const TestDaemon daemon;
  const HttpReply reply = HttpClient(daemon.socket()).get("/v1");
  EXPECT_EQ(200, reply.status);
  EXPECT_EQ("application/json", reply.headers.at("content-type"));
  const json expected = {{"version", VMQ_VERSION},
                         {"node", "testnode"},
                         {"home", daemon.home()},
                         {"depot", daemon.depot()},
                         {"maximum_packet_bytes", 4194304}};
  EXPECT_EQ(expected, parsedJson(reply.body));
}

TEST(HealthRoute, CountsWatchers) {
  const TestDaemon daemon;
  const json health = daemon.get("/v1/health");
  EXPECT_EQ("ok", health["status"]);
  EXPECT_GE(health["uptime_seconds"], 0);
  EXPECT_LT(health["uptime_seconds"], 60);
  EXPECT_EQ(0, health["watchers"]);
  HttpClient watcher(daemon.socket());
  EXPECT_EQ(200, watcher.watch("/v1/tables/ECHO/events").status);
  EXPECT_EQ(1, daemon.get("/v1/health")["watchers"]);
}

TEST(TablesRoute, DescribesTablesInTheOrderOfRegistration) {
  const TestDaemon daemon;
  const json tables = daemon.get("/v1/tables")["tables"];
  ASSERT_EQ(4u, tables.size());
  EXPECT_EQ("ECHO", tables[0]["table"]);
  EXPECT_EQ("GATE", tables[1]["table"]);
  EXPECT_EQ("EVENTS", tables[2]["table"]);
  EXPECT_EQ("FAILS", tables[3]["table"]);
  const json expected = parsedJson(R"({"application":"TEST","table":"ECHO","row_bytes":200,"columns":[
      {"name":"TEXT","type":"character","width":64,"offset":0},
      {"name":"NUMBER","type":"integer","width":4,"offset":64},
      {"name":"BYTES","type":"character","width":128,"offset":68},
      {"name":"COUNT","type":"integer","width":4,"offset":196}]})");
  EXPECT_EQ(expected, tables[0]);
}

TEST(QueryRoute, AnswersWithEveryColumn) {
  const TestDaemon daemon;
  const HttpReply reply =
      HttpClient(daemon.socket()).post("/v1/tables/ECHO/query", R"({"predicates":{"TEXT":"hello","NUMBER":-7}})");
  EXPECT_EQ(200, reply.status);
  EXPECT_EQ("application/json", reply.headers.at("content-type"));
  EXPECT_EQ(R"({"table":"ECHO","rows":[{"TEXT":"hello","NUMBER":-7,"BYTES":"","COUNT":0}]})", reply.body);
}

TEST(QueryRoute, NeedsNoPredicates) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::string expected = R"({"table":"ECHO","rows":[{"TEXT":"","NUMBER":0,"BYTES":"","COUNT":0}]})";
  EXPECT_EQ(expected, client.post("/v1/tables/ECHO/query", "{}").body);
  EXPECT_EQ(expected, client.post("/v1/tables/ECHO/query", R"({"predicates":{}})").body);
}

TEST(QueryRoute, AnswersWithTheRowsThatSatisfyThePredicates) {
  const TestDaemon daemon;
  const auto numbers = [&](const std::string& predicates) {
    std::vector<int> result;
    const json reply = daemon.query("ECHO", predicates);
    for (const auto& row : reply["rows"]) result.push_back(row["NUMBER"]);
    return result;
  };
  EXPECT_THAT(numbers(R"({"COUNT":4})"), ElementsAre(0, 1, 2, 3));
  EXPECT_THAT(numbers(R"({"COUNT":4,"NUMBER":2})"), ElementsAre(2));
  EXPECT_THAT(numbers(R"({"COUNT":4,"NUMBER":"2"})"), ElementsAre(2));
  EXPECT_THAT(numbers(R"({"COUNT":4,"NUMBER":{"ne":2}})"), ElementsAre(0, 1, 3));
  EXPECT_THAT(numbers(R"({"COUNT":4,"NUMBER":{"ge":1},"NUMBER":{"lt":3}})"), ElementsAre(1, 2));
  EXPECT_THAT(numbers(R"({"COUNT":4,"NUMBER":{"gt":3}})"), ElementsAre());
}

TEST(QueryRoute, HandsThePredicatesOverInTheOrderSent) {
  const TestDaemon daemon;
  EXPECT_EQ(
      "TEXT 1 predicates;NUMBER 2 5;BYTES 1 z;NUMBER 1 4;",
      daemon.query("ECHO", R"({"TEXT":"predicates","NUMBER":{"ne":5},"BYTES":"z","NUMBER":4})")["rows"][0]["BYTES"]);
}

TEST(QueryRoute, ReplacesBytesThatAreNotUtf8) {
  const TestDaemon daemon;
  EXPECT_EQ("\u00e9\uFFFD\u0001\"", daemon.query("ECHO", R"({"TEXT":"hex:c3a9ff0122"})")["rows"][0]["BYTES"]);
}

TEST(QueryRoute, PassesUtf8On) {
  const TestDaemon daemon;
  EXPECT_EQ("\u00e9\u20ac\U0001F600",
            daemon.query("ECHO", R"({"TEXT":"\u00e9\u20ac\ud83d\ude00"})")["rows"][0]["TEXT"]);
}

TEST(QueryRoute, AnswersWithManyRows) {
  const TestDaemon daemon;
  const json rows = daemon.query("ECHO", R"({"COUNT":20000})")["rows"];
  ASSERT_EQ(20000u, rows.size());
  EXPECT_EQ(19999, rows[19999]["NUMBER"]);
}

TEST(QueryRoute, ReadsBodiesThatComeInPieces) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n"));
  for (const char c : std::string(R"({"predicates":{"TEXT":"piecemeal"}})")) {
    ASSERT_TRUE(client.send(std::string("1\r\n") + c + "\r\n"));
  }
  ASSERT_TRUE(client.send("0\r\n\r\n"));
  EXPECT_EQ("piecemeal", parsedJson(client.receive().body)["rows"][0]["TEXT"]);
}

TEST(QueryRoute, ReadsABodyOfTheLargestSize) {
  const TestDaemon daemon({"maximum_request_bytes = 2000"});
  HttpClient client(daemon.socket());
  std::string body = R"({"predicates":{"TEXT":"t"}})";
  body.resize(2000, ' ');
  EXPECT_EQ(200, client.post("/v1/tables/ECHO/query", body).status);
  EXPECT_EQ(413, client.post("/v1/tables/ECHO/query", body + " ").status);
}

struct BadRequest {
  std::string method;
  std::string path;
  std::string body;
  int status;
  std::string code;
  std::string named;  ///< what the message names
};

const BadRequest badRequests[] = {
    {"GET", "/", "", 404, "unknown_route", "\"/\""},
    {"GET", "/v1/", "", 404, "unknown_route", "/v1/"},
    {"GET", "/v2", "", 404, "unknown_route", "/v2"},
    {"GET", "/v1/tables/", "", 404, "unknown_route", "/v1/tables/"},
    {"GET", "/v1/tables/ECHO", "", 404, "unknown_route", "/v1/tables/ECHO"},
    {"POST", "/v1/tables//query", "{}", 404, "unknown_route", "/v1/tables//query"},
    {"POST", "/v1/tables/ECHO/x/query", "{}", 404, "unknown_route", "ECHO/x"},
    {"POST", "/v1/tables/ECHO%2Fx/query", "{}", 404, "unknown_route", "ECHO/x"},
    {"POST", "/v1/tables/ECHO/query/", "{}", 404, "unknown_route", "query/"},
    {"POST", "/V1/tables/ECHO/query", "{}", 404, "unknown_route", "/V1"},
    {"GET", "/v1/%FF", "", 404, "unknown_route", "\uFFFD"},
    {"POST", "/v1/tables/NONE/query", "{}", 404, "unknown_table", "\"NONE\""},
    {"POST", "/v1/tables/echo/query", "{}", 404, "unknown_table", "\"echo\""},
    {"POST", "/v1/tables/ECHO%00/query", "{}", 404, "unknown_route", ""},
    {"GET", "/v1/tables/NONE/events", "", 404, "unknown_table", "\"NONE\""},
    {"POST", "/v1", "{}", 405, "method_not_allowed", "\"/v1\""},
    {"DELETE", "/v1/health", "", 405, "method_not_allowed", "\"/v1/health\""},
    {"PUT", "/v1/tables", "x", 405, "method_not_allowed", "\"/v1/tables\""},
    {"GET", "/v1/tables/ECHO/query", "", 405, "method_not_allowed", "POST"},
    {"BREW", "/v1/tables/ECHO/query", "", 405, "method_not_allowed", "POST"},
    {"POST", "/v1/tables/NONE/events", "", 405, "method_not_allowed", "GET"},
    {"POST", "/v1/tables/ECHO/query", "", 400, "bad_json", "byte 1"},
    {"POST", "/v1/tables/ECHO/query", "{", 400, "bad_json", "byte 2"},
    {"POST", "/v1/tables/ECHO/query", "{\"predicates\":{\"TEXT\":\"\xff\"}}", 400, "bad_json", "byte 24"},
    {"POST", "/v1/tables/ECHO/query", "[]", 400, "bad_request", "body"},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":[]})", 400, "bad_request", "predicates"},
    {"POST", "/v1/tables/ECHO/query", R"({"rows":1})", 400, "bad_request", "\"rows\""},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":{"TEXT":true}})", 400, "bad_request", "\"TEXT\""},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":{"NUMBER":"x"}})", 400, "bad_request", "NUMBER"},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":{"TEXT":"a\u0000"}})", 400, "bad_request", "TEXT"},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":{"NONE":"x"}})", 400, "unknown_column", "\"NONE\""},
    {"POST", "/v1/tables/ECHO/query", R"({"predicates":{"TEXT":{"is":"x"}}})", 400, "unknown_operator", "\"is\""},
    {"POST", "/v1/tables/ECHO/query?TEXT=x", "{}", 400, "bad_request", "\"TEXT\""},
    {"GET", "/v1?verbose", "", 400, "bad_request", "\"verbose\""},
    {"GET", "/v1/tables?a=1&b=2", "", 400, "bad_request", "\"a\""},
    {"GET", "/v1/depot/file?size", "", 400, "bad_request", "\"size\""},
    {"GET", "/v1/tables/ECHO/events?NONE=1", "", 400, "unknown_column", "\"NONE\""},
    {"GET", "/v1/tables/ECHO/events?TEXT.is=1", "", 400, "unknown_operator", "\"is\""},
    {"GET", "/v1/tables/ECHO/events?TEXT.=1", "", 400, "unknown_operator", "\"\""},
    {"GET", "/v1/tables/ECHO/events?NUMBER=x", "", 400, "bad_request", "NUMBER"},
    {"GET", "/v1/tables/ECHO/events?NUMBER", "", 400, "bad_request", "NUMBER"},
    {"GET", "/v1/tables/ECHO/events?TEXT=a%00b", "", 400, "bad_request", "TEXT"},
    {"GET", "/v1/tables/ECHO/events?TEXT=%FF", "", 400, "bad_request", "TEXT"},
    {"POST", "/v1/tables/FAILS/query", R"({"predicates":{"TEXT":"create"}})", 500, "internal", "could not be queried"},
    {"POST", "/v1/tables/FAILS/query", R"({"predicates":{"TEXT":"sample"}})", 500, "internal", "told to fail"},
    {"POST", "/v1/tables/FAILS/query", R"({"predicates":{"TEXT":"insert"}})", 500, "internal", "status 22"},
    {"GET", "/v1/tables/FAILS/events?TEXT=create", "", 500, "internal", "could not be watched"},
};

TEST(BadRequests, AreRefusedWithACodeAndASentence) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());  // all on one connection: none of them ends it
  for (const BadRequest& bad : badRequests) {
    SCOPED_TRACE(bad.method + " " + bad.path + " " + bad.body);
    const HttpReply reply = client.request(bad.method, bad.path, bad.body);
    EXPECT_EQ(bad.status, reply.status);
    EXPECT_EQ("application/json", reply.headers.at("content-type"));
    const json error = parsedJson(reply.body);
    ASSERT_TRUE(error.is_object() && error.size() == 1 && error["error"].size() == 2) << reply.body;
    EXPECT_EQ(bad.code, error["error"]["code"]);
    EXPECT_THAT(error["error"]["message"].get<std::string>(), HasSubstr(bad.named));
    EXPECT_EQ('.', error["error"]["message"].get<std::string>().back());
  }
  EXPECT_EQ(200, client.get("/v1/health").status);
}

TEST(WrongMethods, AreToldTheRightOnes) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ("GET", client.request("POST", "/v1").headers.at("allow"));
  EXPECT_EQ("GET", client.request("DELETE", "/v1/tables/ECHO/events").headers.at("allow"));
  EXPECT_EQ("POST", client.request("GET", "/v1/tables/ECHO/query").headers.at("allow"));
  EXPECT_EQ(0u, client.get("/v1").headers.count("allow"));
}

TEST(HeadRequests, AreNotAllowed) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send("HEAD /v1 HTTP/1.1\r\nHost: x\r\n\r\n"));
  const HttpReply reply = client.receiveHeader();
  EXPECT_EQ(405, reply.status);
  EXPECT_EQ("GET", reply.headers.at("allow"));
}

TEST(LargeBodies, AreRefusedBeforeTheyCome) {
  const TestDaemon daemon;
  for (const char* const length : {"1048577", "99999999999", "18446744073709551615"}) {
    SCOPED_TRACE(length);
    HttpClient client(daemon.socket());
    ASSERT_TRUE(client.send(std::string("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: ") + length +
                            "\r\n\r\n"));
    const HttpReply reply = client.receive();
    EXPECT_EQ(413, reply.status);
    EXPECT_EQ("body_too_large", errorCode(reply));
    EXPECT_THAT(reply.body, HasSubstr("1048576"));
    EXPECT_TRUE(client.hungUp());
  }
}

TEST(LargeBodies, AreRefusedWhenTheyAreSentAnyway) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ("body_too_large", errorCode(client.post("/v1/tables/ECHO/query", std::string(8 << 20, ' '))));
}

TEST(LargeBodies, OfUnannouncedLengthAreRefusedAtTheirEnd) {
  const TestDaemon daemon({"maximum_request_bytes = 1024"});
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n"));
  ASSERT_TRUE(client.send("401\r\n" + std::string(1025, ' ') + "\r\n0\r\n\r\n"));
  const HttpReply reply = client.receive();
  EXPECT_EQ(413, reply.status);
  EXPECT_EQ("body_too_large", errorCode(reply));
}

TEST(LargeBodies, ThatDoNotEndAreCutOff) {
  const TestDaemon daemon({"maximum_request_bytes = 1024"});
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n"));
  const std::string chunk = "1000\r\n" + std::string(4096, ' ') + "\r\n";
  size_t sent = 0;
  while (client.send(chunk)) {
    sent += chunk.size();
    ASSERT_LT(sent, size_t{64} << 20) << "the daemon takes whatever comes";
  }
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
}

TEST(LargeHeaders, AreRefused) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  (void)client.send("GET /v1 HTTP/1.1\r\nHost: x\r\nX: " + std::string(40000, 'x') + "\r\n\r\n");
  EXPECT_EQ(431, client.receiveHeader().status);
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
}

TEST(WhatIsNoHttp, DoesTheDaemonNoHarm) {
  const TestDaemon daemon;
  const std::string garbage[] = {
      "\r\n\r\n\r\n",
      "hello\r\n\r\n",
      std::string(100, '\0'),
      "GET /v1 HTTP/9.9\r\n\r\n",
      "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: -1\r\n\r\n",
      "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: x\r\n\r\n",
      "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\nzz\r\n",
      "GET " + std::string(100000, '/') + " HTTP/1.1\r\n\r\n",
      "GET /v1",
  };
  for (const std::string& bytes : garbage) {
    HttpClient client(daemon.socket());
    (void)client.send(bytes);
    client.endSending();
    if (!client.hungUp()) (void)client.receiveHeader();  // whatever it is told
  }
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
}

TEST(ClientsThatLeave, DoTheDaemonNoHarm) {
  const TestDaemon daemon;
  for (const char* const begun :
       {"", "G", "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: 9\r\n\r\n{}",
        "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: 32\r\n\r\n"
        R"({"predicates":{"COUNT":"20000"}})"}) {
    HttpClient client(daemon.socket());
    ASSERT_TRUE(client.send(begun));
  }
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
}

TEST(Connections, ServeManyRequestsInOrder) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::string body = R"({"predicates":{"NUMBER":)";
  std::string pipelined;
  for (int number = 0; number < 100; ++number) {
    const std::string text = body + std::to_string(number) + "}}";
    pipelined += "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: " + std::to_string(text.size()) +
                 "\r\n\r\n" + text;
  }
  ASSERT_TRUE(client.send(pipelined));
  for (int number = 0; number < 100; ++number) {
    ASSERT_EQ(number, parsedJson(client.receive().body)["rows"][0]["NUMBER"]);
  }
}

TEST(Connections, AreAnsweredByHttp10Too) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send("GET /v1/health HTTP/1.0\r\n\r\n"));
  EXPECT_EQ(200, client.receive().status);
  EXPECT_TRUE(client.hungUp());
}

}  // namespace
