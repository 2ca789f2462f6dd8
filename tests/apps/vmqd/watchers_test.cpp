// Clients that watch a table of a running daemon, and clients that crowd it.

#include <gmock/gmock.h>

#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"
#include "tests/support/eventually.h"

namespace {

using nlohmann::json;
using ::testing::ElementsAre;
using Event = HttpClient::Event;

constexpr const char* events = "/v1/tables/EVENTS/events";

class WatchersTest : public ::testing::Test {
 protected:
  /// A watcher whose stream has begun.
  std::unique_ptr<HttpClient> watch(const std::string& predicates = "") {
    auto client = std::make_unique<HttpClient>(daemon.socket());
    const HttpReply reply = client->watch(events + predicates);
    EXPECT_EQ(200, reply.status) << reply.body;
    EXPECT_EQ("text/event-stream", reply.headers.at("content-type"));
    EXPECT_EQ((Event{"open", R"({"table":"EVENTS"})"}), client->nextEvent());
    return client;
  }
  void send(const std::string& text, int count = 1) const {
    (void)daemon.query("EVENTS", R"({"TEXT":")" + text + R"(","COUNT":)" + std::to_string(count) + "}");
  }
  static Event row(const std::string& text, int number, int count = 1) {
    return {"row", R"({"TEXT":")" + text + R"(","NUMBER":)" + std::to_string(number) + R"(,"BYTES":"","COUNT":)" +
                       std::to_string(count) + "}"};
  }

  TestDaemon daemon;
};

TEST_F(WatchersTest, SeeEachEvent) {
  const auto watcher = watch();
  send("a");
  send("b", 2);
  EXPECT_EQ(row("a", 0), watcher->nextEvent());
  EXPECT_EQ(row("b", 0, 2), watcher->nextEvent());
  EXPECT_EQ(row("b", 1, 2), watcher->nextEvent());
}

TEST_F(WatchersTest, SeeOnlyWhatPassesTheirPredicates) {
  const auto of_b = watch("?TEXT=b");
  const auto not_first = watch("?NUMBER.ge=1&NUMBER.ne=2&COUNT=4");
  const auto all = watch("");
  send("a");
  send("b", 4);
  send("c");
  EXPECT_EQ(row("b", 0, 4), of_b->nextEvent());
  EXPECT_EQ(row("b", 1, 4), not_first->nextEvent());
  EXPECT_EQ(row("b", 3, 4), not_first->nextEvent());
  EXPECT_EQ(row("a", 0), all->nextEvent());
  send("b");
  for (int number = 1; number < 4; ++number) EXPECT_EQ(row("b", number, 4), of_b->nextEvent());
  EXPECT_EQ(row("b", 0), of_b->nextEvent());
}

TEST_F(WatchersTest, NameTheirPredicatesPercentEncoded) {
  const auto watcher = watch("?TEXT=%E2%82%AC%20%26%3D+x");
  send("other");
  send("\u20ac &= x");
  EXPECT_EQ(row("\u20ac &= x", 0), watcher->nextEvent());
}

TEST_F(WatchersTest, DoNotSeeWhatWasBefore) {
  send("before");
  const auto watcher = watch();
  send("after");
  EXPECT_EQ(row("after", 0), watcher->nextEvent());
}

TEST_F(WatchersTest, AreToldWhatTheyHaveLost) {
  TestDaemon small({"event_buffer_rows = 5"});
  HttpClient watcher(small.socket());
  ASSERT_EQ(200, watcher.watch(events).status);
  ASSERT_EQ((Event{"open", R"({"table":"EVENTS"})"}), watcher.nextEvent());
  // Far more than its buffer and the sockets hold, while it does not read; nobody waits for it.
  const int sent = 50000;
  const json rows = small.query("EVENTS", R"({"COUNT":50000})");
  EXPECT_EQ(50000u, rows["rows"].size());
  int seen = 0;
  int lost = 0;
  int gaps = 0;
  while (seen + lost < sent) {
    const auto event = watcher.nextEvent();
    ASSERT_TRUE(event);
    const json data = parsedJson(event->data);
    if (event->name == "lost") {
      lost += data["rows"].get<int>();
      ++gaps;
    } else {
      ASSERT_EQ("row", event->name);
      ASSERT_EQ(seen + lost, data["NUMBER"]);  // where rows are missing, it has been told how many
      ++seen;
    }
  }
  EXPECT_EQ(sent, seen + lost);
  EXPECT_GE(gaps, 1);
  EXPECT_GE(seen, 5);
  (void)small.query("EVENTS", R"({"TEXT":"again"})");
  EXPECT_EQ(row("again", 0, 1).name, watcher.nextEvent()->name);
}

TEST_F(WatchersTest, ThatDoNotReadHoldUpNobodyElse) {
  const auto sleeping = watch("");
  const auto awake = watch("?TEXT=seen");
  for (int round = 0; round < 5; ++round) send("noise", 2000);
  send("seen");
  EXPECT_EQ(row("seen", 0), awake->nextEvent());
}

TEST_F(WatchersTest, AreForgottenWhenTheyLeave) {
  {
    const auto watcher = watch();
    EXPECT_EQ(1, daemon.get("/v1/health")["watchers"]);
  }
  EXPECT_TRUE(eventually([&] { return daemon.get("/v1/health")["watchers"] == 0; }));
}

TEST_F(WatchersTest, MayEndTheirSending) {
  const auto watcher = watch();
  watcher->endSending();
  send("a");
  EXPECT_EQ(row("a", 0), watcher->nextEvent());
}

TEST_F(WatchersTest, OfATableThatIsQueriedSeeNothingOfTheQuery) {
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch("/v1/tables/ECHO/events").status);
  (void)watcher.nextEvent();
  (void)daemon.query("ECHO", R"({"COUNT":3})");
  EXPECT_EQ(0, daemon.stop());
  EXPECT_EQ(std::nullopt, watcher.nextEvent());
}

TEST(WatcherLimit, LeavesRoomForQueries) {
  const TestDaemon daemon({"maximum_connections = 4"});
  std::vector<std::unique_ptr<HttpClient>> watchers;
  for (int count = 0; count < 3; ++count) {
    watchers.push_back(std::make_unique<HttpClient>(daemon.socket()));
    ASSERT_EQ(200, watchers.back()->watch(events).status);
  }
  HttpClient fourth(daemon.socket());
  const HttpReply reply = fourth.watch(events);
  EXPECT_EQ(503, reply.status);
  EXPECT_EQ("busy", errorCode(reply));
  EXPECT_EQ(3, parsedJson(fourth.get("/v1/health").body)["watchers"]);
}

TEST(ConnectionLimit, IsToldToThoseBeyondIt) {
  const TestDaemon daemon({"maximum_connections = 4"});
  std::vector<std::unique_ptr<HttpClient>> clients;
  for (int count = 0; count < 4; ++count) {
    clients.push_back(std::make_unique<HttpClient>(daemon.socket()));
    ASSERT_EQ(200, clients.back()->get("/v1/health").status);
  }
  HttpClient fifth(daemon.socket());
  const HttpReply reply = fifth.get("/v1/health");
  EXPECT_EQ(503, reply.status);
  EXPECT_EQ("busy", errorCode(reply));
  EXPECT_TRUE(fifth.hungUp());
  clients.clear();
  const auto served = [&] { return HttpClient(daemon.socket()).get("/v1/health").status == 200; };
  EXPECT_TRUE(eventually(served));
}

TEST(ManyClients, AreServedAtATime) {
  const TestDaemon daemon;
  std::atomic<int> right{0};
  std::vector<std::thread> threads;
  for (int client = 0; client < 20; ++client) {
    threads.emplace_back([&, client] {
      HttpClient connection(daemon.socket());
      for (int request = 0; request < 50; ++request) {
        const int number = client * 1000 + request;
        const HttpReply reply =
            connection.post("/v1/tables/ECHO/query", R"({"predicates":{"NUMBER":)" + std::to_string(number) + "}}");
        if (parsedJson(reply.body)["rows"][0]["NUMBER"] == number) ++right;
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(20 * 50, right);
}

TEST(ManyClients, ComeAndGoWhileOthersWatch) {
  const TestDaemon daemon;
  HttpClient watcher(daemon.socket());
  ASSERT_EQ(200, watcher.watch(events).status);
  ASSERT_EQ("open", watcher.nextEvent()->name);
  std::vector<std::thread> threads;
  for (int client = 0; client < 8; ++client) {
    threads.emplace_back([&daemon] {
      for (int round = 0; round < 10; ++round) {
        HttpClient other(daemon.socket());
        ASSERT_EQ(200, other.watch(events).status);
        (void)daemon.query("EVENTS", R"({"TEXT":"x"})");
      }
    });
  }
  for (int count = 0; count < 80; ++count) ASSERT_EQ("row", watcher.nextEvent()->name);
  for (auto& thread : threads) thread.join();
}

TEST(BlockedQueries, HoldUpNobodyElse) {
  const TestDaemon daemon;
  Gate gate(daemon.directory() / "gate");
  HttpClient blocked(daemon.socket());
  std::thread asking([&] {
    EXPECT_EQ("passed", parsedJson(blocked.post("/v1/tables/GATE/query", gate.query()).body)["rows"][0]["TEXT"]);
  });
  gate.waitForQuery();
  EXPECT_EQ(200, HttpClient(daemon.socket()).get("/v1/health").status);
  EXPECT_EQ("x", daemon.query("ECHO", R"({"TEXT":"x"})")["rows"][0]["TEXT"]);
  gate.open();
  asking.join();
}

}  // namespace
