// start, stop and restart against a daemon that says what each test wants.

#include <gmock/gmock.h>

#include <chrono>
#include <csignal>

#include "apps/vmqctl/messages.h"
#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::MatchesRegex;

const std::string asking = "asking vmqd for START of ux, transaction t1\n";
const std::string accepted = "accepted, waiting for its status event, 600 s at most\n";
const std::string watchT1(const std::string& socket) {
  return "Watch for its status event with: vmqctl watch --socket " + socket +
         " t1 (an event that was sent meanwhile is not repeated).\n";
}

class RequestTest : public testing::Test {
 protected:
  std::vector<std::string> line(std::vector<std::string> arguments) const {
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return arguments;
  }
  VmqctlResult run(std::vector<std::string> arguments) { return runVmqctl(line(std::move(arguments))); }
  VmqctlResult start() { return run({"start", "ux", "--transid", "t1"}); }

  /// An event stream that stays open and silent.
  void openSilentStream() {
    daemon_.on(eventsRequest, [](Exchange& exchange) {
      exchange.openStream();
      exchange.awaitClose();
    });
  }
  void answerWith(const std::string& text, int status = 200) {
    daemon_.on(commandRequest, [=](Exchange& exchange) { exchange.reply(status, text); });
  }

  Gate asked_;
  ScriptedDaemon daemon_;
};

TEST_F(RequestTest, StartWaitsForItsStatusEvent) {
  endRequestsWith(daemon_, statusRow("t1", "START"));
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT  RETVAL  RETMSGID\n"
            "START    ux                  t1       done         0\n");
  EXPECT_EQ(result.err, asking + accepted);
}

TEST_F(RequestTest, EventStreamIsOpenBeforeTheRequestIsSent) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.send("HTTP/1.1 200 OK\r\nContent-Type: text/event-stream\r\nConnection: close\r\n\r\n: wait\n\n");
    // A client that does not wait for the open event has time enough to show it.
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    daemon_.note("open");
    exchange.event("open", R"({"table":"KAGDYST"})");
    if (asked_.wait()) exchange.event("row", statusRow("t1", "START"));
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    exchange.reply(200, answer());
    asked_.open();
  });
  EXPECT_EQ(start().code, 0);
  EXPECT_THAT(daemon_.log(), ElementsAre(eventsRequest + "?TRANSID=t1", "open", commandRequest));
}

TEST_F(RequestTest, EventThatComesBeforeTheAnswerIsNotMissed) {
  Gate sent;
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    if (!asked_.wait()) return;
    exchange.event("row", statusRow("t1", "START"));
    sent.open();
    exchange.awaitClose();
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    asked_.open();
    if (sent.wait()) exchange.reply(200, answer());
  });
  EXPECT_EQ(start().code, 0);
}

struct Sent {
  std::vector<std::string> arguments;
  std::string predicates;
};

TEST_F(RequestTest, EachVerbSendsItsPredicates) {
  const Sent cases[] = {
      {{"start", "ux"}, R"("COMMAND":"START","TRANSID":"t1","PRODUCT":"ux")"},
      {{"start", "ux", "--target", "i:n:UX"},
       R"("COMMAND":"START","TRANSID":"t1","PRODUCT":"ux","TARGETMSN":"i:n:UX")"},
      {{"start", "ux", "--instance", "inst1"},
       R"("COMMAND":"START","TRANSID":"t1","PRODUCT":"ux","TARGETMSN":"inst1","OPTIONAL":"INSTANCE")"},
      {{"stop", "ux"}, R"("COMMAND":"STOP","TRANSID":"t1","PRODUCT":"ux")"},
      {{"stop", "ux", "--target", "i:n:UX"}, R"("COMMAND":"STOP","TRANSID":"t1","PRODUCT":"ux","TARGETMSN":"i:n:UX")"},
      {{"restart", "ux"}, R"("COMMAND":"RESTART","TRANSID":"t1","PRODUCT":"ux")"},
      {{"restart", "ux", "--target", "i:n:UX"},
       R"("COMMAND":"RESTART","TRANSID":"t1","PRODUCT":"ux","TARGETMSN":"i:n:UX")"},
      {{"start", "a \"b\"\n"}, R"("COMMAND":"START","TRANSID":"t1","PRODUCT":"a \"b\"\n")"},
  };
  for (const Sent& each : cases) {
    std::string body;
    daemon_.on(commandRequest, [&](Exchange& exchange) {
      body = exchange.body();
      exchange.reply(200, answer());
    });
    std::vector<std::string> arguments = each.arguments;
    arguments.insert(arguments.end(), {"--transid", "t1", "--no-wait"});
    EXPECT_EQ(run(arguments).code, 0);
    EXPECT_EQ(body, R"({"predicates":{)" + each.predicates + "}}");
  }
}

TEST_F(RequestTest, NoWaitEndsWhenTheRequestIsAccepted) {
  answerWith(answer());
  const VmqctlResult result = run({"stop", "ux", "--transid", "t1", "--no-wait", "--target", "inst1:node1:UX"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN       TRANSID  RESULT    RETVAL  RETMSGID\n"
            "STOP     ux       inst1:node1:UX  t1       accepted       0\n");
  EXPECT_EQ(result.err, "asking vmqd for STOP of ux (inst1:node1:UX), transaction t1\n");
  EXPECT_THAT(daemon_.log(), ElementsAre(commandRequest));  // nobody listens for an event
}

TEST_F(RequestTest, RefusedRequestIsNotWaitedFor) {
  openSilentStream();
  answerWith(answer(1006, "VMQ1006E", "START"));
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT   RETVAL  RETMSGID\n"
            "START    ux                  t1       refused    1006  VMQ1006E\n");
  EXPECT_EQ(result.err, asking + "vmqctl: START of ux was refused: VMQ1006E " +
                            std::string(vmqctl::findMessage("VMQ1006E")->text) + " (parameters: START)\n");
}

TEST_F(RequestTest, FailedCommandIsExplained) {
  endRequestsWith(daemon_, statusRow("t1", "START", 1024, "VMQ1024E", "/h/bin/CorvelAgent  -h /h start ux"));
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT  RETVAL  RETMSGID\n"
            "START    ux                  t1       failed    1024  VMQ1024E\n");
  EXPECT_EQ(result.err, asking + accepted + "vmqctl: START of ux failed: VMQ1024E " +
                            std::string(vmqctl::findMessage("VMQ1024E")->text) +
                            " (parameters: /h/bin/CorvelAgent  -h /h start ux) What the command printed is in the "
                            "trace of vmqd, in the lines STDOUT and STDERR.\n");
}

// A restart whose stop failed and whose start succeeded.
TEST_F(RequestTest, SuccessThatCarriesAMessageIsASuccessAndShowsIt) {
  endRequestsWith(daemon_, statusRow("t1", "RESTART", 0, "VMQ1024E", "stop ux"));
  const VmqctlResult result = run({"restart", "ux", "--transid", "t1"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(result.out, HasSubstr("RESTART  ux                  t1       done         0  VMQ1024E\n"));
  EXPECT_THAT(result.err, HasSubstr("vmqctl: RESTART of ux is done, but a step of it failed: VMQ1024E "));
}

TEST_F(RequestTest, HostileParametersAreShownEscaped) {
  endRequestsWith(daemon_, statusRow("t1", "START", 1024, "VMQ1024E", R"(\u001b[2Jx\ny)"));
  EXPECT_THAT(start().err, HasSubstr("(parameters: \\x1b[2Jx\\ny)"));
}

TEST_F(RequestTest, JsonHoldsTheAnswerAndTheEvent) {
  endRequestsWith(daemon_, statusRow("t1", "START", 1034, "VMQ1034E", "ux"));
  const VmqctlResult result = run({"start", "ux", "--transid", "t1", "-o", "json", "--target", "m"});
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.out,
            "{\n"
            "  \"result\": \"failed\",\n"
            "  \"command\": \"START\",\n"
            "  \"product\": \"ux\",\n"
            "  \"target\": \"m\",\n"
            "  \"transid\": \"t1\",\n"
            "  \"retval\": 1034,\n"
            "  \"message_id\": \"VMQ1034E\",\n"
            "  \"message\": \"" +
                std::string(vmqctl::findMessage("VMQ1034E")->text) +
                "\",\n"
                "  \"parameters\": \"ux\",\n"
                "  \"answer\": {\n"
                "    \"ORIGINNODE\": \"node1\",\n"
                "    \"RETVAL\": 0,\n"
                "    \"RETMSGID\": \"\",\n"
                "    \"RETMSGPARM\": \"\"\n"
                "  },\n"
                "  \"event\": {\n"
                "    \"ORIGINNODE\": \"node1\",\n"
                "    \"TRANSID\": \"t1\",\n"
                "    \"COMMAND\": \"START\",\n"
                "    \"RETVAL\": 1034,\n"
                "    \"RETMSGID\": \"VMQ1034E\",\n"
                "    \"RETMSGPARM\": \"ux\",\n"
                "    \"TARGETMSN\": \"\"\n"
                "  }\n"
                "}\n");
}

TEST_F(RequestTest, JsonWithoutAnEventSaysNull) {
  answerWith(answer());
  EXPECT_THAT(run({"start", "ux", "--no-wait", "-o", "json"}).out,
              testing::AllOf(HasSubstr("\"result\": \"accepted\""), HasSubstr("\"event\": null")));
}

TEST_F(RequestTest, TransactionIdIsMadeWhenNoneIsGivenAndNeverTwice) {
  std::vector<std::string> made;
  for (int i = 0; i < 2; ++i) {
    std::string body;
    daemon_.on(commandRequest, [&](Exchange& exchange) {
      body = exchange.body();
      exchange.reply(200, answer(1006));  // ends it at once
    });
    openSilentStream();
    EXPECT_EQ(run({"start", "ux"}).code, 1);
    const std::size_t at = body.find("vmqctl-");
    ASSERT_NE(at, std::string::npos) << body;
    made.push_back(body.substr(at, body.find('"', at) - at));
    EXPECT_THAT(made.back(), MatchesRegex("vmqctl-[0-9]{8}T[0-9]{6}Z-[0-9a-f]{16}"));
    EXPECT_THAT(daemon_.log(), testing::Contains(eventsRequest + "?TRANSID=" + made.back()));
  }
  EXPECT_NE(made[0], made[1]);
}

TEST_F(RequestTest, KeepAliveCommentsAndUnknownEventsArePassedOver) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    exchange.send(": keep-alive\n\n");
    exchange.event("news", "not even JSON? it is: 1");
    if (asked_.wait()) exchange.event("row", statusRow("t1", "START"));
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    exchange.reply(200, answer());
    asked_.open();
  });
  EXPECT_EQ(start().code, 0);
}

// ---- what goes wrong ----

TEST_F(RequestTest, StreamThatEndsEarlyIsTold) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    (void)asked_.wait();
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    exchange.reply(200, answer());
    asked_.open();
  });
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 7);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err, asking + accepted +
                            "vmqctl: The daemon ended its event stream before the status event of START of ux came, so "
                            "its outcome is not known. Look at the agent itself; a daemon that was stopped forgets the "
                            "requests that it had not begun.\n");
}

TEST_F(RequestTest, StreamThatBreaksInTheMiddleOfAnEventIsToldTheSame) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.send("HTTP/1.1 200 OK\r\nContent-Type: text/event-stream\r\nTransfer-Encoding: chunked\r\n\r\n");
    const std::string open = "event: open\ndata: {}\n\n";
    exchange.send("16\r\n" + open + "\r\n");
    if (asked_.wait()) exchange.send("ff\r\nevent: row\ndata: {\"RETVAL\":0");
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    exchange.reply(200, answer());
    asked_.open();
  });
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 7);
  EXPECT_THAT(result.err, HasSubstr("so its outcome is not known."));
}

TEST_F(RequestTest, StreamThatEndsBeforeItIsOpenSendsNothing) {
  daemon_.on(eventsRequest, [](Exchange& exchange) {
    exchange.send("HTTP/1.1 200 OK\r\nContent-Type: text/event-stream\r\nConnection: close\r\n\r\n");
  });
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 7);
  EXPECT_THAT(result.err, HasSubstr("ended its event stream before it was open."));
  EXPECT_THAT(daemon_.log(), ElementsAre(eventsRequest + "?TRANSID=t1"));
}

TEST_F(RequestTest, LostEventIsTold) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    if (asked_.wait()) exchange.event("lost", R"({"rows":1})");
    exchange.awaitClose();
  });
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    exchange.reply(200, answer());
    asked_.open();
  });
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err, asking + accepted +
                            "vmqctl: The daemon had to drop the status event of START of ux, so its outcome is not "
                            "known. Look at the agent itself.\n");
}

TEST_F(RequestTest, ConnectionThatBreaksBeforeTheAnswerLeavesItOpenWhetherTheRequestWasTaken) {
  openSilentStream();
  daemon_.on(commandRequest, [](Exchange&) {});
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 7);
  EXPECT_EQ(result.err, asking + "vmqctl: The daemon on " + daemon_.socket() +
                            " closed the connection before its answer was whole. It may have taken START of ux all the "
                            "same. " +
                            watchT1(daemon_.socket()));
}

struct Garbage {
  const char* answer;
  const char* told;
};

TEST_F(RequestTest, AnswersThatAreNotUnderstoodAreTold) {
  openSilentStream();
  const Garbage cases[] = {
      {"", "is not understood: it is not JSON."},
      {"<html>", "is not understood: it is not JSON."},
      {"{\"rows\":[", "is not understood: it is not JSON."},
      {"[]", "is not understood: it has no rows."},
      {"{}", "is not understood: it has no rows."},
      {"{\"rows\":{}}", "is not understood: it has no rows."},
      {"{\"rows\":[1]}", "is not understood: a row of it is not a JSON object."},
      {"{\"rows\":[]}", "The daemon answered START of ux without a row. It may have taken START of ux all the same."},
      {"{\"rows\":[{}]}", "The daemon's answer has no number in RETVAL, so the outcome is not known."},
      {"{\"rows\":[{\"RETVAL\":\"0\"}]}", "has no number in RETVAL"},
      {"{\"rows\":[{\"RETVAL\":1e99}]}", "has no number in RETVAL"},
  };
  for (const Garbage& each : cases) {
    answerWith(each.answer);
    const VmqctlResult result = start();
    EXPECT_EQ(result.code, 1) << each.answer;
    EXPECT_THAT(result.err, HasSubstr(each.told)) << each.answer;
    EXPECT_EQ(result.out, "") << each.answer;
  }
}

TEST_F(RequestTest, EventsThatAreNotUnderstoodAreTold) {
  for (const char* data : {"garbage", "{", "1", "{\"RETVAL\":null}"}) {
    endRequestsWith(daemon_, data);
    const VmqctlResult result = start();
    EXPECT_EQ(result.code, 1) << data;
    EXPECT_THAT(result.err, testing::AnyOf(HasSubstr("is not understood"), HasSubstr("no number in RETVAL"))) << data;
  }
}

TEST_F(RequestTest, EndlessEventIsRefused) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    exchange.send("data: " + std::string(3 << 20, 'x'));
    exchange.awaitClose();
  });
  answerWith(answer());
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("is not understood: an event of it is too long."));
}

TEST_F(RequestTest, SomethingElseThatListensIsNotTakenForTheDaemon) {
  daemon_.on(eventsRequest, [](Exchange& exchange) { exchange.send("SSH-2.0-hello\r\n"); });
  const VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("The answer on " + daemon_.socket() + " is not understood: it is not HTTP."));
}

TEST_F(RequestTest, UserWhomTheDaemonDoesNotAdmitIsTold) {
  const std::string message = "The user with id 1000 is not allowed.";
  for (const std::string& request : {eventsRequest, commandRequest}) {
    openSilentStream();
    daemon_.on(request, [&](Exchange& exchange) { exchange.reply(403, refusal("not_allowed", message)); });
    const VmqctlResult result = start();
    EXPECT_EQ(result.code, 4);
    EXPECT_EQ(result.err,
              asking + "vmqctl: " + message + " Run vmqctl as root or as a user in the daemon's allowed_uids.\n");
    EXPECT_EQ(result.out, "");
  }
}

TEST_F(RequestTest, OtherRefusalsShowTheDaemonsOwnWords) {
  openSilentStream();
  answerWith(refusal("internal", "The query failed."), 500);
  VmqctlResult result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err, asking + "vmqctl: The query failed. Look at the daemon's trace log.\n");

  answerWith("<html>gateway</html>", 502);
  result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err, asking + "vmqctl: The daemon on " + daemon_.socket() + " answers with HTTP status 502.\n");

  daemon_.on(eventsRequest, [](Exchange& e) { e.reply(503, refusal("busy", "There are too many watchers.")); });
  result = start();
  EXPECT_EQ(result.code, 1);
  EXPECT_EQ(result.err, asking + "vmqctl: There are too many watchers. Try again when other clients have ended.\n");
}

// ---- time ----

TEST_F(RequestTest, TimeOutBeforeTheStreamIsOpenSendsNothing) {
  daemon_.on(eventsRequest, [](Exchange& exchange) { exchange.awaitClose(); });
  const VmqctlResult result = run({"start", "ux", "--transid", "t1", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_EQ(result.err, asking +
                            "vmqctl: The daemon did not open its event stream within 1 second; START of ux was not "
                            "sent. Look at the daemon with: vmqctl status.\n");
  EXPECT_THAT(daemon_.log(), ElementsAre(eventsRequest + "?TRANSID=t1"));
}

TEST_F(RequestTest, TimeOutBeforeTheAnswerSaysHowToGoOn) {
  openSilentStream();
  daemon_.on(commandRequest, [](Exchange& exchange) { exchange.awaitClose(); });
  const VmqctlResult result = run({"start", "ux", "--transid", "t1", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_EQ(result.err, asking +
                            "vmqctl: The daemon did not answer START of ux within 1 second; it may have taken it. " +
                            watchT1(daemon_.socket()));
}

TEST_F(RequestTest, TimeOutBeforeTheEventSaysHowToGoOn) {
  openSilentStream();
  answerWith(answer());
  const VmqctlResult result = run({"start", "ux", "--transid", "t1", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_EQ(result.err,
            asking + "accepted, waiting for its status event, 1 s at most\n" +
                "vmqctl: No status event of START of ux came within 1 second; the daemon goes on with it. " +
                watchT1(daemon_.socket()));
  EXPECT_EQ(result.out, "");
}

TEST_F(RequestTest, TimeOutOfZeroIsNoLimit) {
  endRequestsWith(daemon_, statusRow("t1", "START"));
  const VmqctlResult result = run({"start", "ux", "--transid", "t1", "--timeout", "0"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.err, asking + "accepted, waiting for its status event\n");
}

TEST_F(RequestTest, SlowAnswerIsWaitedFor) {
  openSilentStream();
  daemon_.on(commandRequest, [](Exchange& exchange) {
    exchange.send("HTTP/1.1 200 OK\r\nContent-Length: 100\r\n\r\n{\"rows\":");
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
    exchange.send(R"([{"RETVAL":1006,"RETMSGID":"VMQ1006E","RETMSGPARM":""}]})" + std::string(100, ' '));
  });
  EXPECT_EQ(start().code, 1);
}

// ---- Ctrl-C ----

TEST_F(RequestTest, InterruptWhileWaitingForTheEventSaysHowToGoOn) {
  openSilentStream();
  answerWith(answer());
  VmqctlProcess process(line({"start", "ux", "--transid", "t1"}));
  process.awaitErrors("accepted");
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 130);
  EXPECT_EQ(result.err, asking + accepted + "vmqctl: Interrupted; the daemon goes on with START of ux. " +
                            watchT1(daemon_.socket()));
}

TEST_F(RequestTest, InterruptBeforeTheAnswerDoesNotSayThatTheDaemonHasTakenIt) {
  openSilentStream();
  daemon_.on(commandRequest, [&](Exchange& exchange) {
    asked_.open();
    exchange.awaitClose();
  });
  VmqctlProcess process(line({"start", "ux", "--transid", "t1"}));
  ASSERT_TRUE(asked_.wait());
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 130);
  EXPECT_EQ(result.err, asking + "vmqctl: Interrupted; if the daemon has taken START of ux, it goes on with it. " +
                            watchT1(daemon_.socket()));
}

TEST_F(RequestTest, InterruptBeforeTheRequestSaysThatNothingWasStarted) {
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    asked_.open();
    exchange.awaitClose();
  });
  VmqctlProcess process(line({"start", "ux", "--transid", "t1"}));
  ASSERT_TRUE(asked_.wait());
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 130);
  EXPECT_EQ(result.err, asking + "vmqctl: Interrupted before START of ux was sent; nothing has been started.\n");
}

TEST_F(RequestTest, TerminationIsAnInterruptToo) {
  openSilentStream();
  answerWith(answer());
  VmqctlProcess process(line({"start", "ux", "--transid", "t1"}));
  process.awaitErrors("accepted");
  process.signal(SIGTERM);
  EXPECT_EQ(process.finish().code, 130);
}

TEST_F(RequestTest, HintQuotesWhatAShellWouldTakeApart) {
  openSilentStream();
  answerWith(answer());
  VmqctlProcess process(line({"start", "ux", "--transid", "it's $1"}));
  process.awaitErrors("accepted");
  process.signal(SIGINT);
  EXPECT_THAT(process.finish().err, HasSubstr("vmqctl watch --socket " + daemon_.socket() + R"( 'it'"'"'s $1' ()"));
}

}  // namespace
