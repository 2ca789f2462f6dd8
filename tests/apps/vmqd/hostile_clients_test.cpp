// Clients that are slow, greedy or broken: each is answered or dropped within its limits, and others are served.

#include <gmock/gmock.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstring>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"

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

/// Asks all the time, on one connection, while it lives.
class GoodClient {
 public:
  explicit GoodClient(const TestDaemon& daemon)
      : thread_([this, socket = daemon.socket()] {
          try {
            HttpClient client(socket);
            while (!ending_) {
              if (client.post("/v1/tables/ECHO/query", "{}").status != 200) ++refused_;
              ++asked_;
            }
          } catch (const std::exception& error) {
            ADD_FAILURE() << error.what();
            ++asked_;
          }
        }) {
    while (asked_ == 0) std::this_thread::yield();
  }
  ~GoodClient() {
    ending_ = true;
    thread_.join();
    EXPECT_EQ(refused_, 0);
  }

 private:
  std::atomic<bool> ending_{false};
  std::atomic<int> asked_{0};
  std::atomic<int> refused_{0};
  std::thread thread_;
};

// ---- those who keep the daemon waiting -----------------------------------------------------------------------------

TEST(ClientThatSendsNothing, IsDropped) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  HttpClient idle(daemon.socket());
  const auto began = Clock::now();
  EXPECT_TRUE(isDropped(idle));
  EXPECT_GE(Clock::now() - began, 1900ms);
}

TEST(ClientThatSendsNothing, IsDroppedAfterAReplyToo) {
  const TestDaemon daemon({hastyClients});
  HttpClient idle(daemon.socket());
  ASSERT_EQ(200, idle.get("/v1/health").status);
  std::this_thread::sleep_for(1s);
  ASSERT_EQ(200, idle.get("/v1/health").status);
  const auto began = Clock::now();
  EXPECT_TRUE(isDropped(idle));
  EXPECT_GE(Clock::now() - began, 1900ms) << "each request has the whole time";
}

/// Sends a byte every 20 ms for as long as the daemon takes it.
bool isDroppedWhileDripping(HttpClient& client) {
  const auto end = Clock::now() + 30s;
  while (Clock::now() < end) {
    if (!client.send("x")) return true;
    std::this_thread::sleep_for(20ms);
  }
  return false;
}

TEST(SlowSender, OfAHeaderIsDropped) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  HttpClient slow(daemon.socket());
  ASSERT_TRUE(slow.send("GET /v1/health HTTP/1.1\r\nX: "));
  EXPECT_TRUE(isDroppedWhileDripping(slow));
}

TEST(SlowSender, OfABodyIsDropped) {
  const TestDaemon daemon({hastyClients});
  const GoodClient good(daemon);
  HttpClient slow(daemon.socket());
  ASSERT_TRUE(slow.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nContent-Length: 100000\r\n\r\n"));
  EXPECT_TRUE(isDroppedWhileDripping(slow));
}

TEST(SlowSender, OfABodyOfUnannouncedLengthIsDropped) {
  const TestDaemon daemon({hastyClients});
  HttpClient slow(daemon.socket());
  ASSERT_TRUE(
      slow.send("POST /v1/tables/ECHO/query HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\nfffff\r\n"));
  EXPECT_TRUE(isDroppedWhileDripping(slow));
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
  const auto end = Clock::now() + 30s;
  while (!served() && Clock::now() < end) std::this_thread::yield();
  EXPECT_TRUE(served());
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
  std::this_thread::sleep_for(4500ms);
  (void)daemon.query("EVENTS", R"({"TEXT":"late"})");
  EXPECT_EQ("row", watcher.nextEvent()->name);
}

TEST(LongQuery, IsNotTheClientsTime) {
  const TestDaemon daemon({hastyClients});
  Gate gate(daemon.directory() / "gate");
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.sendRequest("POST", "/v1/tables/GATE/query", gate.query()));
  gate.waitForQuery();
  std::this_thread::sleep_for(4500ms);
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

/// A connection that says nothing; -1 when the queue of the socket is full.
int connectSilently(const std::string& path) {
  const int client = socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
  if (connect(client, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0) return client;
  close(client);
  return -1;
}

TEST(IdleConnections, ByTheThousandAreBoundedAndDropped) {
  const TestDaemon daemon({"client_seconds = 2", "maximum_connections = 40"});
  const GoodClient good(daemon);
  std::vector<int> idle;
  for (int count = 0; count < 2000; ++count) {
    const int client = connectSilently(daemon.socket());
    if (client >= 0) idle.push_back(client);
  }
  const auto end = Clock::now() + 60s;
  while (!isServed(daemon) && Clock::now() < end) std::this_thread::sleep_for(20ms);
  EXPECT_TRUE(isServed(daemon)) << "with " << idle.size() << " silent clients";
  for (const int client : idle) close(client);
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
