// Requests that are opened, sampled and closed while events arrive.

#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <thread>

#include "row_buffer.h"
#include "table_client.h"
#include "tests/host/sample_table.h"

namespace {

using namespace std::chrono_literals;
using vmqhost::OpenRequest;
using vmqhost::RowBuffer;

TEST(TableThreads, OpenAndCloseRequestsWhileEventsArrive) {
  SampleManager& table = SampleManager::registered("BUSY");
  table.sample = {sampleRow("sampled", 0, "")};
  std::atomic<bool> done = false;
  std::thread executor([&] {
    while (!done) table.deliver(sampleRow("event", 1, ""));
  });
  std::vector<std::thread> clients;
  for (int client = 0; client < 3; ++client) {
    clients.emplace_back([&] {
      for (int i = 0; i < 200; ++i) {
        Collector collector;  // gone as soon as the request is: a late delivery would show
        const auto request = OpenRequest::open(sampleDetail(table.table()), collector);
        ASSERT_NE(request, nullptr);
        request->sample();
      }
    });
  }
  for (std::thread& client : clients) client.join();
  done = true;
  executor.join();
  EXPECT_EQ(table.requests.length(), 0u);
}

TEST(TableThreads, LoseNoSampledRowToAnEventOfTheSameRequest) {
  SampleManager& table = SampleManager::registered("MIXED");
  table.sample = {sampleRow("sampled", 0, "")};
  RowBuffer buffer(100000);
  const auto request = OpenRequest::open(sampleDetail(table.table()), buffer);
  constexpr int kRounds = 1000;
  std::thread executor([&] {
    for (int i = 0; i < kRounds; ++i) table.deliver(sampleRow("event", 1, ""));
  });
  for (int i = 0; i < kRounds; ++i) request->sample();
  executor.join();
  int sampled = 0;
  int events = 0;
  for (RowBuffer::Item item; (item = buffer.take(0ms)).kind == RowBuffer::Item::kRow;) {
    ++(item.row == table.sample[0] ? sampled : events);
  }
  EXPECT_EQ(sampled, kRounds);
  EXPECT_EQ(events, kRounds);
}

TEST(TableThreads, DeliverEventsWhileASampleTakesLong) {
  SampleManager& table = SampleManager::registered("LONG");
  std::mutex sampling;
  // cppcheck-suppress localMutex ; the routine below locks it on other threads
  sampling.lock();
  std::atomic<bool> started = false;
  table.while_sampling = [&](SampleRequest&) {
    started = true;
    const std::lock_guard waits_for_the_test(sampling);
  };
  RowBuffer slow(10);
  RowBuffer other(10);
  const auto sampled = OpenRequest::open(sampleDetail(table.table()), slow);
  const auto watching = OpenRequest::open(sampleDetail(table.table()), other);
  std::thread client([&] { sampled->sample(); });
  while (!started) std::this_thread::yield();
  table.deliver(sampleRow("event", 1, ""));
  EXPECT_EQ(other.take(10s).kind, RowBuffer::Item::kRow);
  sampling.unlock();
  client.join();
}

TEST(TableThreads, RegisterAndFindTablesAtTheSameTime) {
  static unsigned round = 0;
  const std::string name = "RACED" + std::to_string(++round);
  std::vector<std::thread> threads;
  std::atomic<unsigned> accepted = 0;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      auto manager = std::make_unique<SampleManager>(name);
      if (TableManager::RegisterWithManager(manager.get()) == 0) {
        (void)manager.release();  // lives as long as the process now
        ++accepted;
      }
      EXPECT_NE(vmqhost::findTable("TEST", name), nullptr);
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(accepted, 1u);
}

TEST(HandleThreads, UseAndDropTheSameHandle) {
  SampleManager& table = SampleManager::registered("HANDLES");
  Collector collector;
  const auto request = OpenRequest::open(sampleDetail(table.table()), collector);
  const RES1_Handle handle = request->request().handle();
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      for (int turn = 0; turn < 1000; ++turn) {
        EXPECT_EQ(bxira::UseHandle(handle), 0u);
        EXPECT_EQ(bxira::CurrentHandle(), handle);
        EXPECT_EQ(RES1_Drop(handle), 0u);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_NE(RES1_Drop(handle), 0u);
  EXPECT_EQ(table.requests.length(), 1u);
}

}  // namespace
