// watch, against a daemon that says what each test wants.

#include <gmock/gmock.h>

#include <csignal>

#include "apps/vmqctl/messages.h"
#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class WatchTest : public testing::Test {
 protected:
  /// A stream of these events, which stays open.
  void sendEvents(const std::vector<std::pair<std::string, std::string>>& events, bool stayOpen = true) {
    daemon_.on(eventsRequest, [=](Exchange& exchange) {
      exchange.openStream();
      for (const auto& [name, data] : events) exchange.event(name, data);
      if (stayOpen) exchange.awaitClose();
    });
  }
  std::vector<std::string> line(std::vector<std::string> arguments) const {
    arguments.insert(arguments.begin(), "watch");
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return arguments;
  }
  VmqctlResult watch(std::vector<std::string> arguments) { return runVmqctl(line(std::move(arguments))); }

  ScriptedDaemon daemon_;
};

TEST_F(WatchTest, EachEventIsALine) {
  sendEvents({{"row", statusRow("t1", "START")},
              {"row", statusRow("t2", "STOP", 1024, "VMQ1024E", "stop ux", "inst1:node1:UX")},
              {"row", statusRow("t3", "RESTART", 0, "VMQ1024E", "stop ux")}});
  const VmqctlResult result = watch({"--count", "3"});
  const std::string text(vmqctl::findMessage("VMQ1024E")->text);
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "t1: START on node1 done\n"
            "t2: STOP of inst1:node1:UX on node1 failed: VMQ1024E " +
                text +
                " (parameters: stop ux)\n"
                "t3: RESTART on node1 done, but a step of it failed: VMQ1024E " +
                text + " (parameters: stop ux)\n");
  EXPECT_EQ(result.err, "watching for status events, Ctrl-C ends\n");
  EXPECT_THAT(daemon_.log(), ElementsAre(eventsRequest));
}

TEST_F(WatchTest, EventsOfOneRequestAreAskedForByItsId) {
  sendEvents({{"row", statusRow("a b", "START")}});
  const VmqctlResult result = watch({"a b", "--count", "1"});
  EXPECT_EQ(result.out, "a b: START on node1 done\n");
  EXPECT_EQ(result.err, "watching for status events of a b, Ctrl-C ends\n");
  EXPECT_THAT(daemon_.log(), ElementsAre(eventsRequest + "?TRANSID=a%20b"));
}

TEST_F(WatchTest, LinesComeAtOnceAndCtrlCEndsItWell) {
  sendEvents({{"row", statusRow("t1", "START")}});
  VmqctlProcess process(line({}));
  process.awaitOutput("t1: START on node1 done\n");
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "t1: START on node1 done\n");
  EXPECT_EQ(result.err, "watching for status events, Ctrl-C ends\n");
}

TEST_F(WatchTest, CtrlCEndsItEvenWhileEventsComeWithoutAPause) {
  daemon_.on(eventsRequest, [](Exchange& exchange) {
    exchange.openStream();
    while (exchange.event("row", statusRow("t1", "START"))) {
    }
  });
  VmqctlProcess process(line({}));
  process.awaitOutput("t1: START on node1 done\n");
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out.back(), '\n');
}

// So it is for a job in the background of a script, which a Ctrl-C for another one must not end.
TEST_F(WatchTest, InterruptThatWasIgnoredFromTheStartStaysIgnored) {
  Gate interrupted;
  daemon_.on(eventsRequest, [&](Exchange& exchange) {
    exchange.openStream();
    if (interrupted.wait()) exchange.event("row", statusRow("t1", "START"));
    exchange.awaitClose();
  });
  VmqctlOptions options;
  options.program = "/bin/sh";
  VmqctlProcess process(
      {"-c", "trap '' INT; exec \"$@\"", "sh", VMQCTL_PROGRAM, "watch", "--count", "1", "--socket", daemon_.socket()},
      options);
  process.awaitErrors("watching");
  process.signal(SIGINT);
  interrupted.open();
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "t1: START on node1 done\n");
}

TEST_F(WatchTest, TimeOutEndsItEvenWhileEventsComeWithoutAPause) {
  daemon_.on(eventsRequest, [](Exchange& exchange) {
    exchange.openStream();
    while (exchange.event("row", statusRow("t1", "START"))) {
    }
  });
  EXPECT_EQ(watch({"--timeout", "1"}).code, 6);
}

TEST_F(WatchTest, JsonIsOneObjectOnEachLine) {
  sendEvents({{"row", statusRow("t1", "START")}, {"row", statusRow("t2", "STOP")}});
  EXPECT_EQ(watch({"--count", "2", "-o", "json"}).out,
            statusRow("t1", "START") + "\n" + statusRow("t2", "STOP") + "\n");
}

TEST_F(WatchTest, HostileEventStaysOneLine) {
  sendEvents({{"row", statusRow(R"(t\n1)", R"(\u001b[31mSTART)")}});
  EXPECT_EQ(watch({"--count", "1"}).out, "t\\n1: \\x1b[31mSTART on node1 done\n");
}

TEST_F(WatchTest, LostEventsAreToldAndItGoesOn) {
  sendEvents({{"lost", R"({"rows":3})"}, {"lost", "{}"}, {"row", statusRow("t1", "START")}});
  const VmqctlResult result = watch({"--count", "1"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "t1: START on node1 done\n");
  EXPECT_EQ(result.err,
            "watching for status events, Ctrl-C ends\n"
            "vmqctl: Events are missing here: 3. The daemon dropped them because they were not read fast enough.\n"
            "vmqctl: Events are missing here: some. The daemon dropped them because they were not read fast enough.\n");
}

TEST_F(WatchTest, StreamThatEndsIsTold) {
  sendEvents({{"row", statusRow("t1", "START")}}, /*stayOpen=*/false);
  const VmqctlResult result = watch({});
  EXPECT_EQ(result.code, 7);
  EXPECT_EQ(result.out, "t1: START on node1 done\n");
  EXPECT_EQ(result.err,
            "watching for status events, Ctrl-C ends\n"
            "vmqctl: The daemon has ended the event stream. When it runs again, watch anew; events in between are not "
            "repeated.\n");
}

TEST_F(WatchTest, TimeOutIsTold) {
  sendEvents({});
  const VmqctlResult result = watch({"--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_THAT(result.err, HasSubstr("vmqctl: The time of --timeout, 1 second, is over.\n"));
}

TEST_F(WatchTest, EventWithoutAReturnValueIsTold) {
  sendEvents({{"row", "{}"}});
  const VmqctlResult result = watch({});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("has no number in RETVAL"));
}

}  // namespace
