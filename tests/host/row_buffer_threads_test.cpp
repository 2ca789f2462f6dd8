// A reader and a deliverer at the same buffer.

#include <gtest/gtest.h>

#include <chrono>
#include <thread>
#include <vector>

#include "row_buffer.h"

namespace {

using namespace std::chrono_literals;
using vmqhost::RowBuffer;

TEST(BufferThreads, WakeTheReaderForARow) {
  RowBuffer buffer(10);
  std::thread deliverer([&] { buffer.rowsArrived("x", 1, 1); });
  EXPECT_EQ(buffer.take(std::chrono::milliseconds::max()).row, "x");
  deliverer.join();
}

TEST(BufferThreads, WakeEveryReaderAtTheEnd) {
  RowBuffer buffer(10);
  std::vector<std::thread> readers;
  for (int i = 0; i < 3; ++i) {
    readers.emplace_back([&] { EXPECT_EQ(buffer.take(60s).kind, RowBuffer::Item::kClosed); });
  }
  buffer.close();
  for (std::thread& reader : readers) reader.join();
}

TEST(BufferThreads, AccountForEveryRowInOrder) {
  constexpr uint32_t kRows = 20000;
  RowBuffer buffer(50);
  std::thread deliverer([&] {
    for (uint32_t i = 0; i < kRows; ++i) buffer.rowsArrived(reinterpret_cast<const char*>(&i), sizeof i, 1);
    buffer.close();
  });
  uint64_t expected = 0;
  while (true) {
    const RowBuffer::Item item = buffer.take(60s);
    if (item.kind == RowBuffer::Item::kClosed) break;
    if (item.kind == RowBuffer::Item::kLost) {
      expected += item.lost;
      continue;
    }
    ASSERT_EQ(item.kind, RowBuffer::Item::kRow);
    uint32_t number = 0;
    item.row.copy(reinterpret_cast<char*>(&number), sizeof number);
    ASSERT_EQ(number, expected++);
  }
  EXPECT_EQ(expected, kRows);
  deliverer.join();
}

}  // namespace
