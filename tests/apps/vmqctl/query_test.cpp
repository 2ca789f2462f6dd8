// query and status, against a daemon that says what each test wants.

#include <gmock/gmock.h>

#include <csignal>

#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class QueryTest : public testing::Test {
 protected:
  VmqctlResult run(std::vector<std::string> arguments) {
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return runVmqctl(arguments);
  }
  void answerWith(const std::string& text, int status = 200) {
    daemon_.on("POST /v1/tables/KINAGT/query", [=](Exchange& exchange) { exchange.reply(status, text); });
  }

  ScriptedDaemon daemon_;
};

TEST_F(QueryTest, RowsAreATableInTheDaemonsOrder) {
  answerWith(
      R"({"table":"KINAGT","rows":[{"PRODUCT":"ux","N":1,"ARCH":"lx8266"},{"PRODUCT":"a\u001b[2J\nx","N":22,"ARCH":""}]})");
  const VmqctlResult result = run({"query", "KINAGT"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "PRODUCT       N  ARCH\n"
            "ux            1  lx8266\n"
            "a\\x1b[2J\\nx  22\n");
  EXPECT_EQ(result.err, "");
}

TEST_F(QueryTest, RowsAreJson) {
  answerWith(R"({"table":"KINAGT","rows":[{"PRODUCT":"ux","N":1}]})");
  EXPECT_EQ(run({"query", "KINAGT", "-o", "json"}).out, "[\n  {\n    \"PRODUCT\": \"ux\",\n    \"N\": 1\n  }\n]\n");
}

TEST_F(QueryTest, NoRowsAreSaidBesideTheData) {
  answerWith(R"({"table":"KINAGT","rows":[]})");
  VmqctlResult result = run({"query", "KINAGT"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err, "no rows\n");
  result = run({"query", "KINAGT", "-o", "json"});
  EXPECT_EQ(result.out, "[]\n");
  EXPECT_EQ(result.err, "");
}

TEST_F(QueryTest, PredicatesAreSentInTheirOrder) {
  std::string body;
  daemon_.on("POST /v1/tables/K%20%2F/query", [&](Exchange& exchange) {
    body = exchange.body();
    exchange.reply(200, R"({"rows":[]})");
  });
  EXPECT_EQ(run({"query", "K /", "B=1", "A!=x y", "C<=\xC3\xBC"}).code, 0);
  EXPECT_EQ(body, "{\"predicates\":{\"B\":\"1\",\"A\":{\"ne\":\"x y\"},\"C\":{\"le\":\"\xC3\xBC\"}}}");
}

TEST_F(QueryTest, RefusalShowsTheDaemonsWordsAndWhatToDo) {
  answerWith(refusal("unknown_column", "The table KINAGT has no column \\\"X\\\"."), 400);
  const VmqctlResult result = run({"query", "KINAGT", "X=1"});
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err,
            "vmqctl: The table KINAGT has no column \"X\". The command \"vmqctl status -o json\" lists the columns of "
            "each table.\n");
}

TEST_F(QueryTest, ValueThatIsNotUtf8IsAUsageError) {
  const VmqctlResult result = run({"query", "KINAGT", "A=\xFF"});
  EXPECT_EQ(result.code, 2);
  EXPECT_EQ(result.err, "vmqctl: A value of the request is not UTF-8 text. Give it in UTF-8.\n");
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

TEST_F(QueryTest, TimeOutIsTold) {
  daemon_.on("POST /v1/tables/KINAGT/query", [](Exchange& exchange) { exchange.awaitClose(); });
  const VmqctlResult result = run({"query", "KINAGT", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_EQ(result.err, "vmqctl: The daemon did not answer within 1 second. Allow it more with --timeout.\n");
}

TEST_F(QueryTest, CtrlCEndsIt) {
  Gate asked;
  daemon_.on("POST /v1/tables/KINAGT/query", [&](Exchange& exchange) {
    asked.open();
    exchange.awaitClose();
  });
  VmqctlProcess process({"query", "KINAGT", "--socket", daemon_.socket()});
  ASSERT_TRUE(asked.wait());
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 130);
  EXPECT_EQ(result.err, "vmqctl: Interrupted while waiting for the daemon.\n");
}

TEST_F(QueryTest, OutputThatCannotBeWrittenIsAFailure) {
  answerWith(R"({"table":"KINAGT","rows":[{"PRODUCT":"ux"}]})");
  VmqctlOptions options;
  options.outputFile = "/dev/full";
  const VmqctlResult result = runVmqctl({"query", "KINAGT", "--socket", daemon_.socket()}, options);
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err, "vmqctl: The output cannot be written: No space left on device.\n");
}

TEST_F(QueryTest, SocketIsTakenFromTheEnvironmentAndTheOptionGoesFirst) {
  answerWith(R"({"rows":[]})");
  VmqctlOptions options;
  options.environment = {"VMQ_SOCKET=" + daemon_.socket()};
  EXPECT_EQ(runVmqctl({"query", "KINAGT"}, options).code, 0);
  options.environment = {"VMQ_SOCKET=/nowhere/else"};
  EXPECT_EQ(runVmqctl({"query", "KINAGT"}, options).code, 7);
  EXPECT_EQ(runVmqctl({"query", "KINAGT", "--socket", daemon_.socket()}, options).code, 0);
  EXPECT_EQ(runVmqctl({"--socket", daemon_.socket(), "query", "KINAGT"}, options).code, 0);
}

TEST_F(QueryTest, ProxiesOfTheEnvironmentAreNotAsked) {
  answerWith(R"({"rows":[]})");
  VmqctlOptions options;
  options.environment = {"http_proxy=http://127.0.0.1:9", "ALL_PROXY=http://127.0.0.1:9"};
  EXPECT_EQ(runVmqctl({"query", "KINAGT", "--socket", daemon_.socket()}, options).code, 0);
}

class StatusTest : public QueryTest {
 protected:
  void describe(const std::string& daemon, const std::string& health = "ok") {
    daemon_.on("GET /v1", [=](Exchange& exchange) { exchange.reply(200, daemon); });
    daemon_.on("GET /v1/health", [=](Exchange& exchange) {
      exchange.reply(200, R"({"status":")" + health + R"(","uptime_seconds":12,"watchers":3})");
    });
    daemon_.on("GET /v1/tables", [](Exchange& exchange) {
      exchange.reply(200, R"({"tables":[{"application":"VMQ","table":"KAGREQT","row_bytes":4196,"columns":[]},)"
                          R"({"application":"VMQ","table":"KINAGT","row_bytes":1,"columns":[]}]})");
    });
  }
};

TEST_F(StatusTest, ShowsTheDaemon) {
  describe(R"({"version":"0.1.0","node":"node1","home":"/opt/mon","depot":"/opt/mon/depot/"})");
  const VmqctlResult result = run({"status"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "socket    " + daemon_.socket() + "\n" +
                            "version   0.1.0\n"
                            "node      node1\n"
                            "home      /opt/mon\n"
                            "depot     /opt/mon/depot/\n"
                            "health    ok\n"
                            "uptime    12 s\n"
                            "watchers  3\n"
                            "tables    KAGREQT KINAGT\n");
  EXPECT_EQ(result.err, "");
}

TEST_F(StatusTest, SaysWhatIsMissing) {
  describe(R"({"version":"0.1.0","node":"node1","home":"","depot":""})");
  const VmqctlResult result = run({"status"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(result.out, HasSubstr("home      none: commands are disabled\n"
                                    "depot     the home\n"));
}

TEST_F(StatusTest, IsJson) {
  describe(R"({"version":"0.1.0","node":"node1","home":"","depot":""})");
  const VmqctlResult result = run({"status", "-o", "json"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out.substr(0, result.out.find("\"tables\"")), "{\n  \"socket\": \"" + daemon_.socket() + "\",\n" +
                                                                     "  \"version\": \"0.1.0\",\n"
                                                                     "  \"node\": \"node1\",\n"
                                                                     "  \"home\": \"\",\n"
                                                                     "  \"depot\": \"\",\n"
                                                                     "  \"health\": {\n"
                                                                     "    \"status\": \"ok\",\n"
                                                                     "    \"uptime_seconds\": 12,\n"
                                                                     "    \"watchers\": 3\n"
                                                                     "  },\n  ");
  EXPECT_THAT(result.out, HasSubstr("\"row_bytes\": 4196"));
}

TEST_F(StatusTest, DaemonThatIsNotWellIsAFailure) {
  describe(R"({"version":"0.1.0","node":"node1","home":"","depot":""})", "poorly");
  const VmqctlResult result = run({"status"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.out, HasSubstr("health    poorly\n"));
  EXPECT_EQ(result.err, "vmqctl: The daemon does not call itself well. Look at its trace log.\n");
}

TEST_F(StatusTest, AnswersThatAreNotUnderstoodAreTold) {
  describe("[]");
  EXPECT_EQ(run({"status"}).code, 1);
  describe("{}");
  daemon_.on("GET /v1/tables", [](Exchange& exchange) { exchange.reply(200, R"({"tables":[1,{}]})"); });
  const VmqctlResult result = run({"status"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(result.out, HasSubstr("tables    none\n"));
}

}  // namespace
