// Clients that are slow, greedy or broken: each is answered or dropped within its limits, and others are served.

#include <gmock/gmock.h>
#include <poll.h>
#include <sys/resource.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"
#include "tests/support/eventually.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr const char* hastyClients = "client_seconds = 2";
constexpr const char* callOfLength =
    "POST /v1/rpc/5a000000-0000-0000-0000-000000000001/0?version=3 HTTP/1.1\r\nHost: x\r\n"
    "Data-Representation: 10000000\r\nContent-Length: ";

/// True when the daemon has hung up, whatever it has sent before.
bool isDropped(HttpClient& client) {
  try {
    return client.hungUp();
  } catch (const std::exception&) {
    return false;
  }
}

bool isServed(const TestDaemon& daemon) {
  try {
    return daemon.query("ECHO", R"({"TEXT":"x"})")["rows"][0]["TEXT"] == "x";
  } catch (const std::exception&) {
    return false;
  }
}

/// Asks all the time, on one connection, while it lives. (On another one when the machine has kept it from asking for
/// as long as the daemon waits.)
class GoodClient {
 public:
  explicit GoodClient(const TestDaemon& daemon)
      : socket_(daemon.socket()), client_(std::make_unique<HttpClient>(socket_)), thread_([this] { askAllTheTime(); }) {
    EXPECT_TRUE(eventually([this] { return asked_ > 0; }));
  }
  ~GoodClient() {
    ending_ = true;
    thread_.join();
  }

 private:
  void askAllTheTime() {
    while (!ending_) {
      const auto before = last_reply_;
      try {
        EXPECT_EQ(200, client_->post("/v1/tables/ECHO/query", "{}").status);
      } catch (const std::exception& error) {
        if (Clock::now() - before < 1900ms) {
          ADD_FAILURE() << error.what();
          return;
        }
        client_ = std::make_unique<HttpClient>(socket_);
      }
      last_reply_ = Clock::now();
      ++asked_;
    }
  }

  const std::string socket_;
  std::unique_ptr<HttpClient> client_;
  Clock::time_point last_reply_ = Clock::now();
  std::atomic<bool> ending_{false};
  std::atomic<int> asked_{0};
  std::thread thread_;
};

// ---- those who keep the daemon waiting -----------------------------------------------------------------------------

TEST(ClientThatSendsNothing, IsDropped) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  const auto began = Clock::now();
  HttpClient idle(daemon.socket());
  EXPECT_TRUE(isDropped(idle));
  EXPECT_GE(Clock::now() - began, 1900ms);
}

TEST(ClientThatSendsNothing, IsDroppedAfterAReplyToo) {
  const TestDaemon daemon({"client_seconds = 3"});
  HttpClient idle(daemon.socket());
  ASSERT_EQ(200, idle.get("/v1/health").status);
  std::this_thread::sleep_for(500ms);
  const auto began = Clock::now();
  ASSERT_EQ(200, idle.get("/v1/health").status);
  EXPECT_TRUE(isDropped(idle));
  EXPECT_GE(Clock::now() - began, 2900ms) << "each request has the whole time";
}

TEST(SlowSenders, AreDroppedWhereverTheyAre) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  const std::string post = "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\n";
  std::map<std::string, std::unique_ptr<HttpClient>> slow;
  for (const std::string& begun :
       {std::string("GET /v1/health HTTP/1.1\r\nX: "), post + "Content-Length: 100000\r\n\r\n",
        post + "Transfer-Encoding: chunked\r\n\r\nfffff\r\n"}) {
    slow[begun] = std::make_unique<HttpClient>(daemon.socket());
    ASSERT_TRUE(slow[begun]->send(begun));
  }
  const auto end = Clock::now() + 30s;
  while (!slow.empty() && Clock::now() < end) {
    std::this_thread::sleep_for(20ms);
    std::erase_if(slow, [](const auto& client) { return !client.second->send("x"); });
  }
  for (const auto& [begun, client] : slow) ADD_FAILURE() << "takes a byte after the other behind " << begun;
}

TEST(AnnouncedPacket, ThatNeverComesGivesItsMemoryBack) {
  const TestDaemon daemon({hastyClients, "maximum_packet_bytes = 10000", "packet_memory_bytes = 10000"});
  HttpClient announcing(daemon.socket());
  ASSERT_TRUE(announcing.send(std::string(callOfLength) + "10000\r\nExpect: 100-continue\r\n\r\n"));
  ASSERT_EQ(100, announcing.receiveInterim());
  const auto status = [&] {
    HttpClient good(daemon.socket());
    return callOperation(good, 0, "packet").status;
  };
  ASSERT_EQ(503, status());
  EXPECT_TRUE(isDropped(announcing));
  const auto served = [&] { return status() == 200; };
  EXPECT_TRUE(eventually(served));
}

TEST(ClientThatDoesNotRead, IsDropped) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  HttpClient greedy(daemon.socket());
  ASSERT_TRUE(
      greedy.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: 31\r\n\r\n"
                  R"({"predicates":{"COUNT":100000}})"));
  pollfd hangsUp{greedy.descriptor(), POLLRDHUP, 0};
  ASSERT_EQ(poll(&hangsUp, 1, /*milliseconds=*/60'000), 1) << "nothing is read, and nobody hangs up";
  EXPECT_THROW(greedy.receive(), std::runtime_error) << "the reply ends in its middle";
}

// ---- those who do not ----------------------------------------------------------------------------------------------

TEST(Watcher, IsNotDroppedForBeingSilent) {
  const TestDaemon daemon({hastyClients});
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/EVENTS/events").status);
  ASSERT_EQ("open", watcher.nextEvent()->name);
  std::this_thread::sleep_for(3s);
  (void)daemon.query("EVENTS", R"({"TEXT":"late"})");
  EXPECT_EQ("row", watcher.nextEvent()->name);
}

TEST(LongQuery, IsNotTheClientsTime) {
  const TestDaemon daemon({hastyClients});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.sendRequest("POST", "/v1/tables/GATE/query", gate.query()));
  gate.waitForQuery();
  std::this_thread::sleep_for(3s);
  gate.open();
  EXPECT_EQ(200, client.receive().status);
}

TEST(HalfClosedConnection, GetsItsReply) {
  const TestDaemon daemon;
  HttpClient half(daemon.socket());
  ASSERT_TRUE(half.send("GET /v1/health HTTP/1.1\r\nHost: x\r\n\r\n"));
  half.endSending();
  EXPECT_EQ(200, half.receive().status);
  EXPECT_TRUE(half.hungUp());
}

TEST(HalfClosedConnection, InTheMiddleOfARequestIsDropped) {
  const TestDaemon daemon;
  for (const char* const begun : {"", "GET /v1", "GET /v1 HTTP/1.1\r\nHost",
                                  "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: 9\r\n\r\n{"}) {
    HttpClient half(daemon.socket());
    if (*begun != '\0') {
      ASSERT_TRUE(half.send(begun));
    }
    half.endSending();
    EXPECT_TRUE(isDropped(half)) << begun;
  }
  EXPECT_TRUE(isServed(daemon));
}

// ---- many ----------------------------------------------------------------------------------------------------------

/// More descriptors for this process, whose daemon has been started with its own limit.
void allowDescriptors(rlim_t count) {
  rlimit limit{};
  ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &limit), 0);
  if (limit.rlim_cur >= count) return;
  limit.rlim_cur = count;
  ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &limit), 0) << std::strerror(errno);
}

TEST(IdleConnections, ByTheThousandAreBoundedAndDropped) {
  const TestDaemon daemon({hastyClients, "maximum_connections = 40"});
  ASSERT_NO_FATAL_FAILURE(allowDescriptors(2000));
  const GoodClient good(daemon);
  std::vector<std::unique_ptr<HttpClient>> idle;
  for (int count = 0; count < 1000; ++count) idle.push_back(std::make_unique<HttpClient>(daemon.socket()));
  EXPECT_TRUE(eventually([&] { return isServed(daemon); })) << "with a thousand silent clients";
}

TEST(BrokenRequests, FromManyHoldUpNobody) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  const std::string post = "POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: ";
  const auto posted = [&](const std::string& body) { return post + std::to_string(body.size()) + "\r\n\r\n" + body; };
  const std::vector<std::pair<std::string, int>> requests = {
      {"DELETE /v1/health HTTP/1.1\r\nHost: x\r\n\r\n", 405},
      {"GET /v1/tables/NONE HTTP/1.1\r\nHost: x\r\n\r\n", 404},
      {"GET /v1 HTTP/1.1\r\nHost: x\r\nX: " + std::string(100000, 'x') + "\r\n\r\n", 431},
      {posted("{\"predicates\":{\"TEXT\":"), 400},
      {posted(std::string(100000, '[')), 400},
      {posted("{\"predicates\":{\"NONE\":1}}"), 400},
      {posted("{\"predicates\":{\"TEXT\":{\"x\":[]}}}"), 400},
      {posted("[]"), 400},
      {post + "99999999999999999999\r\n\r\n", 413},
      {post + "2000000\r\n\r\n" + std::string(2000000, 'x'), 413},
  };
  std::vector<std::thread> hostile;
  for (int thread = 0; thread < 4; ++thread) {
    hostile.emplace_back([&] {
      for (int round = 0; round < 5; ++round) {
        for (const auto& [request, status] : requests) {
          HttpClient client(daemon.socket());
          (void)client.send(request);  // refused in the middle, perhaps
          EXPECT_EQ(status, client.receive().status) << request.substr(0, 100);
        }
      }
    });
  }
  for (std::thread& thread : hostile) thread.join();
}

}  // namespace
