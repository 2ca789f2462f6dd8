// The command line itself, and daemons that are not there.

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include "tests/apps/vmqctl/scripted_daemon.h"
#include "tests/apps/vmqctl/vmqctl_process.h"
#include "tests/support/temporary_directory.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;

struct Case {
  std::vector<std::string> arguments;
  std::string error;
};

TEST(Usage, MistakesAreToldInASentenceAndEndWithTwo) {
  const std::string longId(85, 'x');
  const Case cases[] = {
      {{}, "No verb is given. See vmqctl --help."},
      {{"pause"}, "There is no verb pause. See vmqctl --help."},
      {{"strat", "ux", "--no-wait"}, "There is no verb strat. See vmqctl --help."},
      {{"--force"}, "The following argument was not expected: --force. See vmqctl --help."},
      {{"start"}, "PRODUCT is required. See vmqctl start --help."},
      {{"start", ""}, "PRODUCT: must not be empty. See vmqctl start --help."},
      {{"start", "ux", "lz"}, "The following argument was not expected: lz. See vmqctl start --help."},
      {{"start", "ux", "--force"}, "The following argument was not expected: --force. See vmqctl start --help."},
      {{"start", "ux", "a", "--force", "b]"},
       "The following arguments were not expected: a --force b]. See vmqctl start --help."},
      {{"start", "ux", "--target", ""}, "--target: must not be empty. See vmqctl start --help."},
      {{"start", "ux", "--instance", ""}, "--instance: must not be empty. See vmqctl start --help."},
      {{"start", "ux", "--target", "a", "--instance", "b"}, "--target excludes --instance. See vmqctl start --help."},
      {{"stop", "ux", "--instance", "inst1"},
       "stop takes no --instance: it always finds the instance by its managed system name. Name that with --target."},
      {{"restart", "ux", "--instance", "inst1"},
       "restart takes no --instance: it always finds the instance by its managed system name. Name that with "
       "--target."},
      {{"start", "ux", "--transid", longId}, "--transid: longer than 84 bytes. See vmqctl start --help."},
      {{"start", "ux", "--transid", ""}, "--transid: must not be empty. See vmqctl start --help."},
      {{"start", "ux", "--timeout", "-1"},
       "--timeout: must be a whole number of seconds from 0 to 4294967295. See vmqctl start --help."},
      {{"start", "ux", "--timeout", "5s"},
       "--timeout: must be a whole number of seconds from 0 to 4294967295. See vmqctl start --help."},
      {{"start", "ux", "--timeout", "4294967296"},
       "--timeout: must be a whole number of seconds from 0 to 4294967295. See vmqctl start --help."},
      {{"start", "ux", "--transid", "\xFF"}, "A value of the request is not UTF-8 text. Give it in UTF-8."},
      {{"start", "ux", "--dry-run", "--target", "\xFF"}, "A value of the request is not UTF-8 text. Give it in UTF-8."},
      {{"start", std::string(65536, 'x')}, "The value of PRODUCT has 65536 bytes; a request holds at most 65535."},
      {{"watch", "\xFF"}, "A value of the request is not UTF-8 text. Give it in UTF-8."},
      {{"inventory", "\xFF"}, "A value of the request is not UTF-8 text. Give it in UTF-8."},
      {{"set-config", "ux", ""}, "FILE: must not be empty. See vmqctl set-config --help."},
      {{"set-da-config", "--script", "a.sh,b.sh"},
       "--script: must not hold a comma, which would make two names of it. See vmqctl set-da-config --help."},
      {{"deploy", "b", "u x", "--version", "1"},
       "PRODUCT: must not hold blanks, at which command lines are split. See vmqctl deploy --help."},
      {{"deploy", "b", "ux", "--version", "1\t2"},
       "--version: must not hold blanks, at which command lines are split. See vmqctl deploy --help."},
      {{"start", "ux", "-o", "xml"}, "--output: xml not in {table,json}. See vmqctl start --help."},
      {{"query"}, "TABLE is required. See vmqctl query --help."},
      {{"query", "KINAGT", "PRODUCT"},
       "\"PRODUCT\" is not of the form COLUMN=VALUE. The operators are =, !=, <, <=, > and >=; quote <, > and ! for "
       "the "
       "shell."},
      {{"query", "KINAGT", "A=1", "A=2"}, "The column A is given twice. Give each column once."},
      {{"watch", "a", "b"}, "The following argument was not expected: b. See vmqctl watch --help."},
      {{"watch", ""}, "TRANSID: must not be empty. See vmqctl watch --help."},
      {{"watch", "--count", "0"}, "--count: must be a whole number from 1 to 4294967295. See vmqctl watch --help."},
      {{"status", "--socket", ""}, "--socket: must not be empty. See vmqctl status --help."},
      {{"status", "--socket", std::string(108, 'x')},
       "The path of the socket is too long: " + std::string(108, 'x') + ". Give --socket a path of at most 107 bytes."},
      {{"start\x1b[2J"}, "There is no verb start\\x1b[2J. See vmqctl --help."},
  };
  for (const Case& each : cases) {
    const VmqctlResult result = runVmqctl(each.arguments);
    EXPECT_EQ(result.code, 2) << each.error;
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err, "vmqctl: " + each.error + "\n");
  }
}

TEST(Usage, VersionIsPrinted) {
  const VmqctlResult result = runVmqctl({"--version"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "vmqctl " VMQ_VERSION "\n");
  EXPECT_EQ(result.err, "");
}

TEST(Usage, HelpListsTheVerbsAndTheExitCodes) {
  const VmqctlResult result = runVmqctl({"--help"});
  EXPECT_EQ(result.code, 0);
  for (const char* text :
       {"start", "stop", "push", "deploy", "query", "watch", "status", "--version", "130 interrupted"}) {
    EXPECT_THAT(result.out, HasSubstr(text));
  }
  EXPECT_EQ(result.err, "");
}

TEST(Usage, HelpOfEachVerbHasAnExampleAndTheCommonOptions) {
  for (const std::string verb : {"start", "stop", "restart", "push", "deploy", "query", "watch", "status"}) {
    const VmqctlResult result = runVmqctl({verb, "--help"});
    EXPECT_EQ(result.code, 0);
    EXPECT_THAT(result.out,
                AllOf(HasSubstr("Usage: vmqctl " + verb), HasSubstr("\n  vmqctl " + verb), HasSubstr("--socket PATH"),
                      HasSubstr("-o,--output table|json"), HasSubstr("--timeout SECONDS")));
  }
}

// What is opened must not take the place of a stream that is closed.
TEST(Usage, ClosedStandardStreamsAreNoStreams) {
  ScriptedDaemon daemon;
  daemon.on("POST /v1/tables/T/query", [](Exchange& exchange) { exchange.reply(200, R"({"rows":[{"A":1}]})"); });
  const TemporaryDirectory directory;
  for (const char* closed : {">&-", "2>&-", "<&- >&- 2>&-"}) {
    VmqctlOptions options;
    options.program = directory.writeScript("run", std::string("exec " VMQCTL_PROGRAM " \"$@\" ") + closed);
    EXPECT_EQ(runVmqctl({"query", "T", "--socket", daemon.socket()}, options).code, 0) << closed;
  }
}

// ---- daemons that are not there ----

class Reachability : public testing::Test {
 protected:
  /// A socket at this place: bound, and listening when so asked.
  void bindSocket(bool listens) {
    const int descriptor = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    socket_.copy(address.sun_path, sizeof address.sun_path - 1);
    ASSERT_EQ(bind(descriptor, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    if (listens) {
      ASSERT_EQ(listen(descriptor, 1), 0);
      listener_ = descriptor;
    } else {
      (void)close(descriptor);  // leaves the file
    }
  }
  ~Reachability() override {
    if (listener_ >= 0) (void)close(listener_);  // nothing was sent
  }

  TemporaryDirectory directory_;
  const std::string socket_ = directory_ / "vmqd.sock";
  int listener_ = -1;
};

const std::string checkHint =
    " Check that it runs (systemctl status vmqd) and that --socket or VMQ_SOCKET names its socket.\n";

TEST_F(Reachability, NoSocketIsTold) {
  for (const std::vector<std::string>& verb :
       {std::vector<std::string>{"status"}, {"start", "ux"}, {"start", "ux", "--no-wait"}, {"query", "T"}, {"watch"}}) {
    std::vector<std::string> arguments = verb;
    arguments.insert(arguments.end(), {"--socket", socket_});
    const VmqctlResult result = runVmqctl(arguments);
    EXPECT_EQ(result.code, 7) << verb.front();
    EXPECT_EQ(result.out, "");
    EXPECT_THAT(result.err,
                HasSubstr("vmqctl: No daemon answers on " + socket_ + ": No such file or directory." + checkHint));
  }
}

TEST_F(Reachability, SocketThatADaemonLeftBehindIsTold) {
  bindSocket(/*listens=*/false);
  const VmqctlResult result = runVmqctl({"status", "--socket", socket_});
  EXPECT_EQ(result.code, 7);
  EXPECT_EQ(result.err, "vmqctl: No daemon answers on " + socket_ + ": Connection refused." + checkHint);
}

TEST_F(Reachability, SocketThatTheUserMayNotUseIsTold) {
  bindSocket(/*listens=*/true);
  ASSERT_EQ(chmod(socket_.c_str(), geteuid() == 0 ? 0600 : 0), 0);
  VmqctlOptions options;
  options.program = copyOfVmqctl(directory_);
  options.asNobody = true;
  const VmqctlResult result = runVmqctl({"status", "--socket", socket_}, options);
  EXPECT_EQ(result.code, 4);
  EXPECT_EQ(result.err, "vmqctl: The socket " + socket_ +
                            " may not be used by this user. Run vmqctl as root or as a user in the daemon's "
                            "allowed_uids.\n");
}

}  // namespace
