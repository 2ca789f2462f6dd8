// install to set-da-config and inventory: what each verb sends, and what it makes of the answer.

#include <gmock/gmock.h>

#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"
#include "tests/support/temporary_directory.h"

namespace {

using testing::EndsWith;
using testing::HasSubstr;

struct Sent {
  const char* verb;
  std::vector<std::string> arguments;
  std::string predicates;  ///< behind COMMAND and TRANSID
};

std::string body(const std::string& command, const std::string& predicates) {
  return R"({"predicates":{"COMMAND":")" + command + R"(","TRANSID":"t1")" + predicates + "}}";
}

class ProductVerbs : public testing::Test {
 protected:
  VmqctlResult run(std::vector<std::string> arguments) {
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return runVmqctl(std::move(arguments));
  }
  /// The body of the request that the verb sends.
  std::string sentBy(std::vector<std::string> arguments) {
    std::string sent;
    daemon_.on(commandRequest, [&](Exchange& exchange) {
      sent = exchange.body();
      exchange.reply(200, answer());
    });
    const VmqctlResult result = run(std::move(arguments));
    EXPECT_EQ(result.code, 0) << result.err;
    return sent;
  }
  /// An answer that carries a configuration.
  void configurationIs(const std::string& context) {
    daemon_.on(commandRequest, [context](Exchange& exchange) {
      exchange.reply(200, R"({"table":"KAGREQT","rows":[{"CONTEXT":")" + context +
                              R"(","RETVAL":0,"RETMSGID":"","RETMSGPARM":""}]})");
    });
  }

  ScriptedDaemon daemon_;
  TemporaryDirectory directory_;
};

TEST_F(ProductVerbs, SendTheirParameters) {
  const std::string file = directory_.writeFile("c.cfg", "INSTANCE=i1\nA=1\n");
  const std::string configuration = R"(,"CONTEXT":"INSTANCE=i1\nA=1\n")";
  const struct {
    std::vector<std::string> arguments;
    const char* command;
    std::string predicates;
  } cases[] = {
      {{"install", "ux", "--version", "06.20", "--command", "./i.sh -q"},
       "INSTALL",
       R"(,"PRODUCT":"ux","VERSION":"06.20","CONTEXT":"./i.sh -q")"},
      {{"install", "ux", "--version", "1", "--command", "i", "--set-rms"},
       "INSTALL",
       R"(,"PRODUCT":"ux","VERSION":"1","CONTEXT":"i","OPTIONAL":"SETRMS")"},
      {{"install", "ux", "--version", "1", "--command", "i", "--restart"},
       "INSTALL",
       R"(,"PRODUCT":"ux","VERSION":"1","CONTEXT":"i","OPTIONAL":"REQUIRES_RESTART")"},
      {{"uninstall", "ux"}, "UNINSTALL", R"(,"PRODUCT":"ux")"},
      {{"uninstall", "zz", "--version", "1", "--command", "u"},
       "UNINSTALL",
       R"(,"PRODUCT":"zz","VERSION":"1","CONTEXT":"u")"},
      {{"set-config", "ux", file}, "SETCONFIG", R"(,"PRODUCT":"ux")" + configuration},
      {{"set-config", "ux", file, "--target", "i1"},
       "SETCONFIG",
       R"(,"PRODUCT":"ux","TARGETMSN":"i1")" + configuration},
      {{"remove-instance", "ux", "i1"}, "REMOVEINSTANCE", R"(,"PRODUCT":"ux","TARGETMSN":"i1")"},
      {{"remove-instance", "ux", "i1", "--config", file},
       "REMOVEINSTANCE",
       R"(,"PRODUCT":"ux","TARGETMSN":"i1")" + configuration},
      {{"set-da-config", "--model", "m.mdl", "--script", "a.sh", "--script", "b.sh", "--target", "i:h:DA", "--port",
        "1920"},
       "SETCONFIG",
       R"(,"PRODUCT":"um","TARGETMSN":"i:h:DA","DACONFIG":"m.mdl","DASCRIPT":"a.sh,b.sh","CONTEXT":"PORT=1920")"},
  };
  for (auto [arguments, command, predicates] : cases) {
    arguments.insert(arguments.end(), {"--transid", "t1", "--no-wait"});
    EXPECT_EQ(sentBy(arguments), body(command, predicates)) << arguments.front();
  }
  EXPECT_EQ(sentBy({"get-config", "ux", "--target", "i1", "--transid", "t1"}),
            body("GETCONFIG", R"(,"PRODUCT":"ux","TARGETMSN":"i1")"));
  EXPECT_EQ(sentBy({"complete-install", "--transid", "t1"}), body("COMPLETE_INSTALL", ""));
}

// The parser of the command line takes brackets for lists.
TEST_F(ProductVerbs, NamesInBracketsAreNames) {
  EXPECT_EQ(sentBy({"set-da-config", "--model", "[m]", "--script", "[ab]", "--script=[c d]", "--script", "{}",
                    "--transid", "t1", "--no-wait"}),
            body("SETCONFIG", R"(,"PRODUCT":"um","DACONFIG":"[m]","DASCRIPT":"[ab],[c d],{}")"));
}

TEST_F(ProductVerbs, DryRunShowsTheRequestAndSendsNothing) {
  const VmqctlResult result = run({"uninstall", "ux", "--transid", "t1", "--dry-run"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "{\n  \"predicates\": {\n    \"COMMAND\": \"UNINSTALL\",\n    \"TRANSID\": \"t1\",\n    \"PRODUCT\": "
            "\"ux\"\n  }\n}\n");
  EXPECT_EQ(result.err, "not sent: POST /v1/tables/KAGREQT/query\n");
  EXPECT_TRUE(daemon_.log().empty());
}

TEST_F(ProductVerbs, ConfigurationIsShownAsItIs) {
  configurationIs("INSTANCE=i1\\nA=1\\n");
  const VmqctlResult result = run({"get-config", "ux", "--transid", "t1"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "INSTANCE=i1\nA=1\n");
  EXPECT_EQ(result.err, "asking vmqd for GETCONFIG of ux, transaction t1\n");
}

TEST_F(ProductVerbs, MissingConfigurationIsTold) {
  configurationIs("");
  const VmqctlResult result = run({"get-config", "ux"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_THAT(result.err, EndsWith("There is no configuration.\n"));
}

TEST_F(ProductVerbs, ConfigurationThatFillsItsColumnIsDoubted) {
  configurationIs(std::string(3072, 'x'));
  const VmqctlResult result = run({"get-config", "ux"});
  EXPECT_EQ(result.out, std::string(3072, 'x') + "\n");
  EXPECT_THAT(result.err,
              EndsWith("The configuration fills its column and may go on: what an answer holds ends here.\n"));
  EXPECT_THAT(run({"get-config", "ux", "-o", "json"}).err,
              EndsWith("The configuration fills its column and may go on: what an answer holds ends here.\n"));
}

TEST_F(ProductVerbs, ConfigurationThatFitsItsColumnIsNotDoubted) {
  configurationIs(std::string(3071, 'x'));
  for (const char* format : {"table", "json"}) {
    EXPECT_THAT(run({"get-config", "ux", "-o", format}).err, testing::Not(HasSubstr("may go on"))) << format;
  }
}

// They send no status event that could be watched for.
TEST_F(ProductVerbs, WhatRunsAtOnceIsAskedForAgainWhenItWasNotAnswered) {
  daemon_.on(commandRequest, [](Exchange& exchange) { exchange.awaitClose(); });
  VmqctlResult result = run({"get-config", "ux", "--timeout", "1"});
  EXPECT_EQ(result.code, 6);
  EXPECT_THAT(result.err,
              EndsWith("The daemon did not answer GETCONFIG of ux within 1 second; it may have taken it. Ask "
                       "again, with a longer --timeout.\n"));
  daemon_.on(commandRequest, [](Exchange&) {});
  result = run({"complete-install"});
  EXPECT_EQ(result.code, 7);
  EXPECT_THAT(result.err, EndsWith("It may have taken COMPLETE_INSTALL all the same. Ask again.\n"));
}

TEST_F(ProductVerbs, ProductThatTheInventoryDoesNotListIsTold) {
  const std::string told = "The inventory does not list zz; say with --command what installed it.\n";
  const std::string row = statusRow("t1", "UNINSTALL", 1033, "VMQ1033E");
  endRequestsWith(daemon_, row);
  const VmqctlResult result = run({"uninstall", "zz", "--transid", "t1"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, EndsWith(told));
  EXPECT_THAT(run({"uninstall", "zz", "--transid", "t1", "--command", "u"}).err, testing::Not(HasSubstr(told)));
  endRequestsWith(daemon_, statusRow("t1", "UNINSTALL", 1033, "VMQ1033E", "/h/bin/uninstall.sh -i zz lx8266"));
  EXPECT_THAT(run({"uninstall", "zz", "--transid", "t1"}).err, testing::Not(HasSubstr(told)));
}

TEST_F(ProductVerbs, FailureSaysWhereTheOutputIs) {
  daemon_.on(commandRequest, [](Exchange& exchange) {
    exchange.reply(200, answer(1008, "VMQ1008E", "GETCONFIG,ux,3,/x/vmq_xa -g  -pc ux"));
  });
  const VmqctlResult result = run({"get-config", "ux"});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("(parameters: GETCONFIG,ux,3,/x/vmq_xa -g  -pc ux)"));
  EXPECT_THAT(result.err,
              EndsWith("What the command printed is in the trace of vmqd, in the lines STDOUT and STDERR.\n"));
}

TEST_F(ProductVerbs, RestartInstallSaysThatTheInstallerRunsOn) {
  endRequestsWith(daemon_, statusRow("t1", "INSTALL"));
  const VmqctlResult result =
      run({"install", "ux", "--version", "1", "--command", "i", "--restart", "--transid", "t1"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(result.err,
              EndsWith("The installer runs on by itself. Ask for its outcome with: vmqctl complete-install.\n"));
}

TEST_F(ProductVerbs, InventoryListsProducts) {
  daemon_.on("POST /v1/tables/KINAGT/query", [](Exchange& exchange) {
    EXPECT_EQ(exchange.body(), R"({"predicates":{"PRODUCT":"ux","PRODDESC":"RUNNING"}})");
    exchange.reply(200, R"({"table":"KINAGT","rows":[{"PRODUCT":"ux","VERSION":"062000000","PRODDESC":"RUNNING",)"
                        R"("RELEASE":"100","PLATFORM":"lx8266"}]})");
  });
  const VmqctlResult result = run({"inventory", "ux", "--running"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out,
            "PRODUCT  VERSION    RELEASE  PLATFORM  PRODDESC\n"
            "ux       062000000  100      lx8266    RUNNING\n");
}

TEST_F(ProductVerbs, MistakesAreToldAndNothingIsSent) {
  const std::string missing = directory_ / "missing";
  const struct {
    std::vector<std::string> arguments;
    std::string error;
  } cases[] = {
      {{"install", "ux", "--version", "1"}, "--command is required. See vmqctl install --help."},
      {{"install", "ux", "--version", "1", "--command", "i", "--set-rms", "--restart"},
       "--set-rms excludes --restart. See vmqctl install --help."},
      {{"set-config", "ux", missing}, "Cannot open " + missing + ": No such file or directory."},
      {{"set-config", "ux", directory_.path().string()},
       "Cannot read " + directory_.path().string() + ": Is a directory."},
      {{"set-config", "ux", directory_.writeFile("empty", "")}, "The configuration is empty; nothing was sent."},
      {{"set-config", "ux", directory_.writeFile("long", std::string(65536, 'x'))},
       directory_ / "long is too long: a request holds at most 65535 bytes."},
      {{"set-config", "ux", directory_.writeFile("zero", std::string("a\0b", 3))},
       directory_ / "zero holds a zero byte, so it is no text."},
      {{"set-da-config"}, "There is nothing to configure: name a --model or a --script."},
      {{"set-da-config", "--model", "m", "--port", "0"},
       "--port: must be a whole number from 1 to 65535. See vmqctl set-da-config --help."},
      {{"remove-instance", "ux"}, "INSTANCE is required. See vmqctl remove-instance --help."},
  };
  for (const auto& [arguments, error] : cases) {
    const VmqctlResult result = run(arguments);
    EXPECT_EQ(result.code, 2) << error;
    EXPECT_EQ(result.err, "vmqctl: " + error + "\n");
  }
  EXPECT_TRUE(daemon_.log().empty());
}

}  // namespace
