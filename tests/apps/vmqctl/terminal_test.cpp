// What a person sees on a terminal: a turning line that leaves nothing behind.

#include <gmock/gmock.h>

#include <csignal>
#include <regex>

#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"

namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

const std::string erased = "\r\033[K";

/// What stands on the lines of a terminal in the end: what "\r" and "erase to the end of the line" leave.
std::string leftOnScreen(const std::string& written) {
  std::string screen;
  std::string line;
  std::size_t column = 0;
  for (std::size_t i = 0; i < written.size(); ++i) {
    const char c = written[i];
    if (c == '\n') {
      screen += line + "\n";
      line.clear();
      column = 0;
    } else if (c == '\r') {
      column = 0;
    } else if (written.compare(i, 3, "\033[K") == 0) {
      line.resize(column);
      i += 2;
    } else {
      line.resize(std::max(line.size(), column + 1));
      line[column++] = c;
    }
  }
  return screen + line;
}

class TerminalTest : public testing::Test {
 protected:
  VmqctlProcess start(VmqctlOptions options, const std::string& transid = "t1") {
    return VmqctlProcess({"start", "ux", "--transid", transid, "--socket", daemon_.socket()}, std::move(options));
  }
  /// Accepts the request and lets the test say when it ends, and with what.
  void acceptRequests() {
    daemon_.on(eventsRequest, [&](Exchange& exchange) {
      exchange.openStream();
      if (ended_.wait()) exchange.event("row", row_);
      exchange.awaitClose();
    });
    daemon_.on(commandRequest, [](Exchange& exchange) { exchange.reply(200, answer()); });
  }

  std::string row_ = statusRow("t1", "START");
  Gate ended_;
  ScriptedDaemon daemon_;
};

const std::string doneTable =
    "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT  RETVAL  RETMSGID\n"
    "START    ux                  t1       done         0\n";

TEST_F(TerminalTest, LineTurnsWhileItWaitsAndIsGoneInTheEnd) {
  acceptRequests();
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  VmqctlProcess process = start(options);
  process.awaitErrors("\r/ accepted");  // it has turned
  process.awaitErrors("\r- accepted");
  ended_.open();
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, doneTable);
  EXPECT_THAT(result.err, HasSubstr("accepted, waiting for its status event, 600 s at most (0 s)\033[K"));
  EXPECT_THAT(result.err, EndsWith(erased));
  EXPECT_THAT(result.err, Not(HasSubstr("\n")));
  EXPECT_EQ(leftOnScreen(result.err), "");
}

TEST_F(TerminalTest, ResultStandsAloneWhenBothGoToTheTerminal) {
  acceptRequests();
  VmqctlOptions options;
  options.terminal = Terminal::ForBoth;
  VmqctlProcess process = start(options);
  process.awaitOutput("\r- accepted");
  ended_.open();
  // The terminal itself puts "\r" before each "\n".
  EXPECT_EQ(leftOnScreen(process.finish().out), doneTable);
}

TEST_F(TerminalTest, ErrorStandsOnALineOfItsOwnWithARedName) {
  acceptRequests();
  row_ = statusRow("t1", "START", 1024, "VMQ1024E", "x");
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  VmqctlProcess process = start(options);
  process.awaitErrors("\r- accepted");
  ended_.open();
  EXPECT_THAT(process.finish().err, HasSubstr(erased + "\033[1;31mvmqctl:\033[0m START of ux failed: VMQ1024E "));
}

TEST_F(TerminalTest, NoColorIsHonoured) {
  acceptRequests();
  row_ = statusRow("t1", "START", 1024, "VMQ1024E", "x");
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  options.environment = {"NO_COLOR=1"};
  VmqctlProcess process = start(options);
  process.awaitErrors("\r- accepted");
  ended_.open();
  const std::string written = process.finish().err;
  EXPECT_THAT(written, HasSubstr(erased + "vmqctl: START of ux failed: VMQ1024E "));
  EXPECT_FALSE(std::regex_search(written, std::regex("\033\\[[0-9;]*m")));
}

TEST_F(TerminalTest, DumbTerminalGetsPlainLines) {
  acceptRequests();
  ended_.open();
  for (const char* term : {"TERM=dumb", "TERM="}) {
    VmqctlOptions options;
    options.terminal = Terminal::ForErrors;
    options.environment = {term};
    const VmqctlResult result = start(options).finish();
    EXPECT_EQ(result.code, 0);
    EXPECT_EQ(result.err,
              "asking vmqd for START of ux, transaction t1\r\n"
              "accepted, waiting for its status event, 600 s at most\r\n");
  }
}

TEST_F(TerminalTest, CtrlCTakesTheLineAwayAndSaysHowToGoOn) {
  acceptRequests();
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  options.columns = 200;
  VmqctlProcess process = start(options);
  process.awaitErrors("\r- accepted");
  process.signal(SIGINT);
  const VmqctlResult result = process.finish();
  ended_.open();
  EXPECT_EQ(result.code, 130);
  EXPECT_THAT(result.err, HasSubstr(erased +
                                    "\033[1;31mvmqctl:\033[0m Interrupted; the daemon goes on with START of ux. "
                                    "Watch for its status event with: vmqctl watch --socket " +
                                    daemon_.socket() + " t1 ("));
}

TEST_F(TerminalTest, LineNeverWraps) {
  acceptRequests();
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  options.columns = 20;
  VmqctlProcess process = start(options);
  process.awaitErrors("\r- accepted");
  ended_.open();
  EXPECT_THAT(process.finish().err, HasSubstr("\r- accepted, waiting\033[K"));  // 19 columns
}

TEST_F(TerminalTest, TableFitsTheTerminal) {
  daemon_.on("POST /v1/tables/T/query", [](Exchange& exchange) {
    exchange.reply(200, R"({"rows":[{"A":"0123456789012345678901234567890123456789","B":"b"}]})");
  });
  VmqctlOptions options;
  options.terminal = Terminal::ForBoth;
  options.columns = 30;
  EXPECT_EQ(runVmqctl({"query", "T", "--socket", daemon_.socket()}, options).out,
            "A                            B\r\n"
            "012345678901234567890123...  b\r\n");
}

TEST_F(TerminalTest, TerminalWithoutUtf8GetsAscii) {
  daemon_.on("POST /v1/tables/T/query",
             [](Exchange& exchange) { exchange.reply(200, "{\"rows\":[{\"A\":\"\xC3\xBC\"}]}"); });
  VmqctlOptions options;
  options.terminal = Terminal::ForBoth;
  options.environment = {"LC_ALL=C"};
  EXPECT_EQ(runVmqctl({"query", "T", "--socket", daemon_.socket()}, options).out, "A\r\n\\u{fc}\r\n");
  options.terminal = Terminal::None;
  EXPECT_EQ(runVmqctl({"query", "T", "--socket", daemon_.socket()}, options).out, "A\n\xC3\xBC\n");
}

TEST_F(TerminalTest, WhatIsDoneAtOnceDoesNotFlicker) {
  daemon_.on("POST /v1/tables/T/query", [](Exchange& exchange) { exchange.reply(200, R"({"rows":[{"A":1}]})"); });
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  EXPECT_EQ(runVmqctl({"query", "T", "--socket", daemon_.socket()}, options).err, "");
}

}  // namespace
