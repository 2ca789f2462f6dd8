// One watcher's stream, on a table of this process.

#include "apps/vmqd/event_stream.h"

#include <gmock/gmock.h>
#include <sys/eventfd.h>
#include <sys/socket.h>

#include <chrono>
#include <cstring>
#include <memory>
#include <string>
#include <thread>

#include "apps/vmqd/refusal.h"
#include "linked_list.h"
#include "table_manager.h"
#include "tests/support/process_resources.h"

namespace vmqd {
namespace {

using namespace std::chrono_literals;

struct Row {
  char text[4];
  int32_t number;
};

class StreamRequest : public bxira {
 public:
  using bxira::bxira;
  void PrintSelf() override {}
  void TakeSample() override {}
  unsigned NumColumns() override { return 2; }
  unsigned GetColumnInfo(ColumnInfo* info, int index) override {
    *info = index == 0 ? ColumnInfo{"text", 0, 4, COLUMN_CHARACTER} : ColumnInfo{"number", 4, 4, COLUMN_INTEGER};
    return 0;
  }
  unsigned ColumnIsException(char* column, char* row, _IntfOper oper, char* value) override {
    const auto* const cells = reinterpret_cast<const Row*>(row);
    return *column == 'T' ? IsException(oper, cells->text, 4, value) : IsException(oper, cells->number, value);
  }
};

class StreamManager : public TableManager {
 public:
  StreamManager() : TableManager("TEST", "STREAM") { (void)RegisterWithManager(this); }
  bxira* CreateBxira(RequestDetail* detail, ContextInfo* context) override {
    return refuses ? nullptr : new StreamRequest(detail, context, this);
  }
  void send(const char* text, int32_t number) {
    Row row{{' ', ' ', ' ', ' '}, number};
    std::memcpy(row.text, text, std::strlen(text));
    (void)BSS1_GetLock(lock());
    LinkedListIter open(requests);
    while (bxira* const each = open.next()) {
      if (each->CheckForException(reinterpret_cast<char*>(&row)) != 0)
        (void)each->InsertRow(reinterpret_cast<char*>(&row));
      (void)each->Dispatch();
    }
    (void)BSS1_ReleaseLock(lock());
  }
  bool refuses = false;
};

StreamManager& manager() {
  static StreamManager& it = *new StreamManager;  // managers live as long as the process
  return it;
}

class EventStreamTest : public ::testing::Test {
 protected:
  EventStreamTest() : table_(describe()), stop_(eventfd(0, 0)) {
    int pair[2];
    EXPECT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM, 0, pair));
    client = Descriptor(pair[0]);
    server_ = Descriptor(pair[1]);
  }

  void open(const std::string& text = "", unsigned buffer_rows = 10, std::chrono::milliseconds keep_alive = 60s) {
    Predicates predicates(table_);
    if (!text.empty()) predicates.add("TEXT", INTF_EQ, text);
    const EventStream::Settings settings{buffer_rows, keep_alive, server_.get(), stop_.get()};
    stream_ = std::make_unique<EventStream>(predicates, settings, slots.take());
    EXPECT_EQ("event: open\ndata: {\"table\":\"STREAM\"}\n\n", read());
  }
  void close() { stream_.reset(); }
  /// The next piece; "" at the end.
  std::string read(size_t capacity = 4096) {
    std::string buffer(capacity, '\0');
    buffer.resize(stream_->read(buffer.data(), capacity));
    return buffer;
  }
  void stop() { (void)eventfd_write(stop_.get(), 1); }

  WatcherSlots slots{2};
  Descriptor client;

 private:
  static vmqhost::TableDescription describe() {
    (void)manager();
    return vmqhost::listTables().front();
  }
  const Table table_;
  Descriptor server_;
  Descriptor stop_;
  std::unique_ptr<EventStream> stream_;
};

TEST_F(EventStreamTest, TellsEachRow) {
  open();
  manager().send("a", 1);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", read());
}

TEST_F(EventStreamTest, TellsSeveralRowsAtOnce) {
  open();
  manager().send("a", 1);
  manager().send("b", 2);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\nevent: row\ndata: {\"TEXT\":\"b\",\"NUMBER\":2}\n\n",
            read());
}

TEST_F(EventStreamTest, CanBeReadInSmallPieces) {
  open();
  manager().send("a", 1);
  std::string text;
  while (text.size() < std::strlen("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n")) text += read(3);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", text);
}

TEST_F(EventStreamTest, WaitsForRows) {
  open();
  std::thread sender([] { manager().send("a", 1); });
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", read());
  sender.join();
}

TEST_F(EventStreamTest, LeavesOutWhatItsPredicatesReject) {
  open("b");
  manager().send("a", 1);
  manager().send("b", 2);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"b\",\"NUMBER\":2}\n\n", read());
}

TEST_F(EventStreamTest, TellsWhereRowsAreMissing) {
  open("", /*buffer_rows=*/2);
  for (int number = 1; number <= 5; ++number) manager().send("a", number);
  EXPECT_EQ(
      "event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\nevent: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":2}\n\n"
      "event: lost\ndata: {\"rows\":3}\n\n",
      read());
  manager().send("a", 6);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":6}\n\n", read());
}

TEST_F(EventStreamTest, SendsACommentWhenNothingHappens) {
  open("", 10, /*keep_alive=*/5ms);
  EXPECT_EQ(": keep-alive\n\n", read());
  EXPECT_EQ(": keep-alive\n\n", read());
  manager().send("a", 1);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", read());
}

TEST_F(EventStreamTest, EndsWhenItIsStopped) {
  open();
  manager().send("a", 1);
  stop();
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", read());
  EXPECT_EQ("", read());
}

TEST_F(EventStreamTest, EndsWhenItsClientHangsUp) {
  open();
  std::thread leaving([this] { client = Descriptor(); });
  EXPECT_EQ("", read());
  leaving.join();
}

TEST_F(EventStreamTest, GoesOnForAClientThatHasOnlyEndedItsSending) {
  open("", 10, /*keep_alive=*/5ms);
  ASSERT_EQ(0, shutdown(client.get(), SHUT_WR));
  EXPECT_EQ(": keep-alive\n\n", read());
  manager().send("a", 1);
  EXPECT_EQ("event: row\ndata: {\"TEXT\":\"a\",\"NUMBER\":1}\n\n", read());
}

TEST_F(EventStreamTest, GivesEverythingBack) {
  const ProcessResources before = ProcessResources::now();
  open();
  EXPECT_EQ(1u, slots.taken());
  EXPECT_EQ(1u, manager().requests.length());
  close();
  EXPECT_EQ(0u, slots.taken());
  EXPECT_EQ(0u, manager().requests.length());
  EXPECT_EQ(before, ProcessResources::now());
}

TEST_F(EventStreamTest, ThatTheTableRefusesIsAnError) {
  manager().refuses = true;
  try {
    open();
    FAIL() << "opened";
  } catch (const Refusal& refusal) {
    EXPECT_EQ("internal", refusal.code().name);
    EXPECT_STREQ("The table could not be watched.", refusal.what());
  }
  manager().refuses = false;
  EXPECT_EQ(0u, slots.taken());
}

TEST(WatcherSlotsTest, AreLimited) {
  WatcherSlots slots(2);
  const auto first = slots.take();
  {
    const auto second = slots.take();
    try {
      const auto third = slots.take();
      FAIL() << "taken";
    } catch (const Refusal& refusal) {
      EXPECT_EQ("busy", refusal.code().name);
      EXPECT_EQ(503u, refusal.code().status);
      EXPECT_STREQ("There are already 2 watchers.", refusal.what());
    }
    EXPECT_EQ(2u, slots.taken());
  }
  const auto again = slots.take();
  EXPECT_EQ(2u, slots.taken());
}

}  // namespace
}  // namespace vmqd
