// How a daemon starts and ends, and what stands in its way.

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <filesystem>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"
#include "tests/support/eventually.h"

namespace {

using nlohmann::json;
using std::chrono::steady_clock;
using ::testing::HasSubstr;
namespace fs = std::filesystem;

/// A run of vmqd that is expected to end by itself.
struct Ended {
  int exit_code;
  std::string output;
};
Ended run(const std::vector<std::string>& arguments) {
  const TemporaryDirectory directory;
  DaemonProcess process(arguments, directory / "log");
  const int exit_code = process.wait();
  return {exit_code, readWholeFile(directory / "log")};
}

TEST(CommandLine, HelpSaysEverything) {
  const Ended help = run({"--help"});
  EXPECT_EQ(0, help.exit_code);
  for (const char* const said :
       {"--config FILE", "--check", "--version", "allowed_uids", "environment.NAME", "SIGTERM", "Exit codes"}) {
    EXPECT_THAT(help.output, HasSubstr(said));
  }
}

TEST(CommandLine, VersionIsTheProjects) {
  const Ended version = run({"--version"});
  EXPECT_EQ(0, version.exit_code);
  EXPECT_EQ("vmqd " VMQ_VERSION "\n", version.output);
}

TEST(CommandLine, MistakesEndWithCode2) {
  EXPECT_EQ(2, run({}).exit_code);
  EXPECT_EQ(2, run({"--config"}).exit_code);
  EXPECT_EQ(2, run({"--config", "/dev/null", "--unknown"}).exit_code);
  EXPECT_EQ(2, run({"--config", "/dev/null", "more"}).exit_code);
  EXPECT_EQ(2, run({"--config", "/does/not/exist"}).exit_code);
  EXPECT_THAT(run({"--unknown"}).output, HasSubstr("--config"));
}

TEST(CheckOption, FindsAGoodConfigurationInOrder) {
  const TestDaemon daemon({"trace = error,tasks/=all"}, /*start=*/false);
  const Ended check = run({"--config", daemon.config(), "--check"});
  EXPECT_EQ(0, check.exit_code);
  EXPECT_EQ("vmqd: " + daemon.config() + " is in order\n", check.output);
  EXPECT_FALSE(fs::exists(daemon.socket()));
}

TEST(CheckOption, OpensNoTraceLog) {
  const TemporaryDirectory directory;
  const TestDaemon daemon({"trace_log = " + (directory / "trace")}, /*start=*/false);
  EXPECT_EQ(0, run({"--config", daemon.config(), "--check"}).exit_code);
  EXPECT_FALSE(fs::exists(directory / "trace"));
}

TEST(Configuration, MistakesAreNamedAndEndWithCode2) {
  struct Mistake {
    std::string line;
    std::string complaint;
  };
  const Mistake mistakes[] = {
      {"sokket = /x", ":6: sokket: is not a known key"},
      {"node = again", ":6: node: is set twice"},
      {"maximum_connections = many", ":6: maximum_connections: must be a number from 4 to 10000"},
      {"trace = loud", ":6: trace: "},
      {"trace = error,tasks/=", ":6: trace: "},
  };
  for (const Mistake& mistake : mistakes) {
    const TestDaemon daemon({mistake.line}, /*start=*/false);
    for (const auto& options : {std::vector<std::string>{"--config", daemon.config(), "--check"},
                                std::vector<std::string>{"--config", daemon.config()}}) {
      const Ended failed = run(options);
      EXPECT_EQ(2, failed.exit_code);
      EXPECT_THAT(failed.output, HasSubstr("vmqd: error: " + daemon.config() + mistake.complaint));
    }
    EXPECT_FALSE(fs::exists(daemon.socket()));
  }
}

TEST(Configuration, ATraceLogThatCannotBeOpenedIsNamed) {
  const TestDaemon daemon({"trace_log = /does/not/exist/log"}, /*start=*/false);
  const Ended failed = run({"--config", daemon.config()});
  EXPECT_EQ(2, failed.exit_code);
  EXPECT_THAT(failed.output, HasSubstr(daemon.config() + ":6: trace_log: "));
}

TEST(Environment, IsSetFromTheConfiguration) {
  const TemporaryDirectory directory;
  const TestDaemon daemon({"trace = none", "trace_log = " + (directory / "trace"), "command_timeout_seconds = 77",
                           "environment.TEST_VALUE = a value = with more"});
  const auto value = [&](const std::string& name) {
    return daemon.query("ECHO", R"({"TEXT":"env:)" + name + R"("})")["rows"][0]["BYTES"].get<std::string>();
  };
  EXPECT_EQ(daemon.home(), value("CORVELHOME"));
  EXPECT_EQ(daemon.depot(), value("QORDEPLOY_AGENTDEPOT"));
  EXPECT_EQ("none", value("KBB_RAS1"));
  EXPECT_EQ(directory / "trace", value("KBB_RAS1_LOG"));
  EXPECT_EQ("77", value("TIMEOUT"));
  EXPECT_EQ("a value = with more", value("TEST_VALUE"));
  EXPECT_EQ("(unset)", value("NOTIFY_SOCKET"));
  EXPECT_EQ("testnode", daemon.query("ECHO", R"({"TEXT":"node"})")["rows"][0]["BYTES"]);
}

TEST(Node, IsTheHostNameByDefault) {
  TestDaemon daemon({}, /*start=*/false);
  daemon.directory().writeFile("vmqd.conf", "socket = " + daemon.socket() + "\nhome = " + daemon.home() +
                                                "\nlibrary = " VMQ_TEST_COMPONENT "\n");
  daemon.start();
  char host[256];
  ASSERT_EQ(0, gethostname(host, sizeof host));
  EXPECT_EQ(host, daemon.get("/v1")["node"]);
  EXPECT_EQ("", daemon.get("/v1")["depot"]);
}

TEST(Readiness, IsToldOnceTheDaemonCanBeAsked) {
  TestDaemon daemon({}, /*start=*/false);
  daemon.launch();
  EXPECT_EQ("READY=1", daemon.process().nextNotification());
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
  daemon.process().signal(SIGTERM);
  EXPECT_EQ("STOPPING=1", daemon.process().nextNotification());
  EXPECT_EQ(std::nullopt, daemon.process().nextNotification());
  EXPECT_EQ(0, daemon.process().wait());
}

TEST(Socket, HasMode0600) {
  const TestDaemon daemon;
  struct stat status;
  ASSERT_EQ(0, stat(daemon.socket().c_str(), &status));
  EXPECT_EQ(static_cast<mode_t>(S_IFSOCK | 0600), status.st_mode);
  EXPECT_EQ(geteuid(), status.st_uid);
}

TEST(Stop, IsCleanOnEitherSignal) {
  for (const int signal : {SIGTERM, SIGINT}) {
    TestDaemon daemon;
    HttpClient idle(daemon.socket());
    daemon.process().signal(signal);
    EXPECT_EQ(0, daemon.process().wait());
    EXPECT_FALSE(fs::exists(daemon.socket()));
    EXPECT_TRUE(idle.hungUp());
    EXPECT_THAT(daemon.log(), HasSubstr(std::string("vmqd: stopping: ") + (signal == SIGINT ? "SIGINT" : "SIGTERM")));
    EXPECT_THAT(daemon.log(), HasSubstr("vmqd: stopped\n"));
  }
}

TEST(Stop, EndsOpenStreams) {
  TestDaemon daemon({"stop_seconds = 3600"});
  std::vector<std::unique_ptr<HttpClient>> watchers;
  for (int count = 0; count < 10; ++count) {
    watchers.push_back(std::make_unique<HttpClient>(daemon.socket()));
    ASSERT_EQ(200, watchers.back()->watch("/v1/tables/EVENTS/events").status);
    ASSERT_EQ("open", watchers.back()->nextEvent()->name);
  }
  const auto begin = steady_clock::now();
  EXPECT_EQ(0, daemon.stop());
  EXPECT_LT(steady_clock::now() - begin, std::chrono::seconds(30));
  for (const auto& watcher : watchers) EXPECT_EQ(std::nullopt, watcher->nextEvent());
}

TEST(Stop, LetsARunningQueryEnd) {
  TestDaemon daemon({"stop_seconds = 3600"});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  std::thread asking([&] {
    const HttpReply reply = client.post("/v1/tables/GATE/query", gate.query());
    EXPECT_EQ("passed", parsedJson(reply.body)["rows"][0]["TEXT"]);
  });
  gate.waitForQuery();
  daemon.process().signal(SIGTERM);
  EXPECT_EQ("STOPPING=1", daemon.process().nextNotification());
  gate.open();
  asking.join();
  EXPECT_EQ(0, daemon.process().wait());
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: stopped\n"));
}

TEST(Stop, DoesNotWaitForeverForAQuery) {
  TestDaemon daemon({"stop_seconds = 0"});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.sendRequest("POST", "/v1/tables/GATE/query", gate.query()));
  gate.waitForQuery();
  EXPECT_EQ(0, daemon.stop());
  EXPECT_TRUE(client.hungUp());
  EXPECT_FALSE(fs::exists(daemon.socket()));
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: warning: stopped; queries that still run, and will not be answered: 1\n"));
}

TEST(Stop, TakesNoMoreRequestsOnOpenConnections) {
  TestDaemon daemon({"stop_seconds = 3600"});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  HttpClient other(daemon.socket());
  ASSERT_EQ(200, other.get("/v1/health").status);
  std::thread asking([&] { EXPECT_EQ(200, client.post("/v1/tables/GATE/query", gate.query()).status); });
  gate.waitForQuery();
  daemon.process().signal(SIGTERM);
  EXPECT_EQ("STOPPING=1", daemon.process().nextNotification());
  HttpReply reply;
  EXPECT_TRUE(eventually([&] {  // it is told a moment before it is done
    reply = other.get("/v1/health");
    return reply.status != 200;
  }));
  EXPECT_EQ(503, reply.status);
  EXPECT_EQ("busy", errorCode(reply));
  gate.open();
  asking.join();
  EXPECT_EQ(0, daemon.process().wait());
}

TEST(Stop, TakesNoMoreClients) {
  TestDaemon daemon({"stop_seconds = 3600"});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  std::thread asking([&] { (void)client.post("/v1/tables/GATE/query", gate.query()); });
  gate.waitForQuery();
  daemon.process().signal(SIGTERM);
  const auto refused = [&] {
    try {
      HttpClient late(daemon.socket());
      return false;
    } catch (const std::system_error& error) {
      return error.code().value() == ECONNREFUSED;
    }
  };
  EXPECT_TRUE(eventually(refused));
  gate.open();
  asking.join();
  EXPECT_EQ(0, daemon.process().wait());
}

TEST(Stop, DoesNotWaitForAClientThatDoesNotRead) {
  TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::string body = R"({"predicates":{"COUNT":100000}})";
  ASSERT_TRUE(client.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: " +
                          std::to_string(body.size()) + "\r\n\r\n" + body));
  (void)client.receiveHeader();  // the rest fills up the socket
  EXPECT_EQ(0, daemon.stop());
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: stopped\n"));
}

TEST(SecondDaemon, IsRefusedWithoutHarmToTheFirst) {
  const TestDaemon daemon;
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/EVENTS/events").status);
  const Ended second = run({"--config", daemon.config()});
  EXPECT_EQ(1, second.exit_code);
  EXPECT_EQ("vmqd: error: another vmqd is running on " + daemon.socket() + "\n", second.output);
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
  EXPECT_EQ("open", watcher.nextEvent()->name);
}

TEST(KilledDaemon, IsFollowedByANewOneOnTheSameSocket) {
  TestDaemon daemon;
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/EVENTS/events").status);
  for (int round = 0; round < 3; ++round) {
    daemon.kill();
    EXPECT_TRUE(fs::exists(daemon.socket()));
    daemon.start();
    EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
  }
}

TEST(Start, NeedsTheDirectoryOfItsSocket) {
  TestDaemon daemon({}, /*start=*/false);
  daemon.directory().writeFile("vmqd.conf", "socket = /does/not/exist/s\nhome = " + daemon.home() + "\n");
  const Ended failed = run({"--config", daemon.config()});
  EXPECT_EQ(1, failed.exit_code);
  EXPECT_EQ("vmqd: error: the directory of the socket, /does/not/exist: No such file or directory\n", failed.output);
}

TEST(Start, NeedsAComponent) {
  const auto failure = [](const std::string& library, const std::string& line = "") {
    const DaemonFixture daemon({"", library, {line}, /*start=*/false});
    const Ended failed = run({"--config", daemon.config()});
    EXPECT_EQ(1, failed.exit_code);
    EXPECT_FALSE(fs::exists(daemon.socket()));
    return failed.output;
  };
  EXPECT_EQ("vmqd: error: the component /does/not/exist.so: No such file or directory\n",
            failure("/does/not/exist.so"));
  EXPECT_THAT(failure("/etc/passwd"), HasSubstr("vmqd: error: the component does not load: "));
  EXPECT_EQ("vmqd: error: the component " VMQ_HOST_LIBRARY " has no Initialize_Mgmt_Functions\n",
            failure(VMQ_HOST_LIBRARY));
  EXPECT_EQ("vmqd: error: the component " VMQ_TEST_COMPONENT " did not start, status 7\n",
            failure(VMQ_TEST_COMPONENT, "environment.TEST_STATUS = 7"));
}

TEST(Start, RefusesAComponentThatEveryUserMayWrite) {
  const TemporaryDirectory directory;
  const std::string library = directory / "c.so";
  fs::copy_file(VMQ_TEST_COMPONENT, library);
  ASSERT_EQ(0, chmod(library.c_str(), 0777));
  const DaemonFixture daemon({"", library, {}, /*start=*/false});
  const Ended failed = run({"--config", daemon.config()});
  EXPECT_EQ(1, failed.exit_code);
  EXPECT_EQ("vmqd: error: every user may write to the component " + library + "\n", failed.output);
}

TEST(Start, WarnsWhenDepotAndHomeAreOnDifferentFileSystems) {
  TestDaemon daemon({}, /*start=*/false);
  const std::string text =
      "socket = " + daemon.socket() + "\nhome = " + daemon.home() + "\nlibrary = " VMQ_TEST_COMPONENT "\n";
  daemon.directory().writeFile("vmqd.conf", text + "depot = /proc/depot/that/is/not/there\n");
  daemon.start();
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: warning: the depot /proc/depot/that/is/not/there and the home " +
                                      daemon.home() + " are on different file systems"));
}

TEST(Start, WarnsWhenTheDirectoryOfTheWorkFileIsOnAnotherFileSystem) {
  TestDaemon daemon({}, /*start=*/false);
  fs::remove(daemon.home() + "/tmp");
  fs::create_symlink("/proc", daemon.home() + "/tmp");
  daemon.start();
  EXPECT_THAT(daemon.log(), HasSubstr(" are on different file systems"));
}

TEST(Start, WarnsWhenTheHomeHasNoDirectoryForTheWorkFile) {
  TestDaemon daemon({}, /*start=*/false);
  fs::remove(daemon.home() + "/tmp");
  daemon.start();
  EXPECT_THAT(daemon.log(), HasSubstr("vmqd: warning: the home has no directory " + daemon.home() +
                                      "/tmp: line ends of files that are pushed will not be converted\n"));
}

TEST(Start, WarnsWhenConnectionsMayRunOutOfDescriptors) {
  rlimit before{};
  ASSERT_EQ(0, getrlimit(RLIMIT_NOFILE, &before));
  const rlimit few{500, before.rlim_max};
  ASSERT_EQ(0, setrlimit(RLIMIT_NOFILE, &few));
  const TestDaemon daemon;
  ASSERT_EQ(0, setrlimit(RLIMIT_NOFILE, &before));
  EXPECT_THAT(daemon.log(),
              HasSubstr("vmqd: warning: maximum_connections may take 576 descriptors, but the process has "
                        "only 500\n"));
}

TEST(Start, DoesNotWarnWhenAllIsWell) {
  const TestDaemon daemon;
  EXPECT_EQ("vmqd: version " VMQ_VERSION " listening on " + daemon.socket() + "\n", daemon.log());
}

TEST(Daemon, IsNotEndedByABrokenPipe) {
  TestDaemon daemon;
  daemon.process().signal(SIGPIPE);
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
}

}  // namespace
