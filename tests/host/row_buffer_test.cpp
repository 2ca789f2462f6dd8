// The buffer of a requester that may stop reading.

#include "row_buffer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <thread>

#include "tests/support/failing_allocation.h"

namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using vmqhost::RowBuffer;

class Buffer : public testing::Test {
 protected:
  unsigned put(const std::string& rows) {
    return buffer_.rowsArrived(rows.data(), /*row_bytes=*/1, static_cast<unsigned>(rows.size()));
  }

  /// Takes everything there is: rows as they are, losses as "lost 3", "closed" at the end of a closed buffer.
  std::vector<std::string> takeAll() {
    std::vector<std::string> told;
    while (true) {
      const std::string item = takeOne();
      if (item != "timed out") told.push_back(item);
      if (item == "timed out" || item == "closed") return told;
    }
  }
  std::string takeOne() {
    const RowBuffer::Item item = buffer_.take(0ms);
    switch (item.kind) {
      case RowBuffer::Item::kRow:
        return item.row;
      case RowBuffer::Item::kLost:
        return "lost " + std::to_string(item.lost);
      case RowBuffer::Item::kTimedOut:
        return "timed out";
      case RowBuffer::Item::kClosed:
        return "closed";
    }
    return "?";
  }

  RowBuffer buffer_{3};
};

TEST_F(Buffer, GivesRowsInTheOrderTheyCame) {
  EXPECT_EQ(put("ab"), 0u);
  EXPECT_EQ(put("c"), 0u);
  EXPECT_THAT(takeAll(), ElementsAre("a", "b", "c"));
}

TEST_F(Buffer, SplitsRowsOfAnyWidth) {
  EXPECT_EQ(buffer_.rowsArrived("ab\0d", 2, 2), 0u);
  EXPECT_THAT(takeAll(), ElementsAre("ab", std::string("\0d", 2)));
}

TEST_F(Buffer, TimesOutWhenNothingComes) {
  EXPECT_EQ(takeOne(), "timed out");
  EXPECT_EQ(buffer_.take(20ms).kind, RowBuffer::Item::kTimedOut);
  EXPECT_EQ(buffer_.take(-5ms).kind, RowBuffer::Item::kTimedOut);
}

TEST_F(Buffer, TellsRowsThatDidNotFitAfterThoseThatDid) {
  EXPECT_EQ(put("abcde"), unsigned{ENOBUFS});
  EXPECT_THAT(takeAll(), ElementsAre("a", "b", "c", "lost 2"));
}

TEST_F(Buffer, TellsALossOnce) {
  put("abcd");
  EXPECT_EQ(takeAll().size(), 4u);
  EXPECT_THAT(takeAll(), ElementsAre());
}

TEST_F(Buffer, TellsTheRequestOfEachLoss) {
  EXPECT_EQ(put("abc"), 0u);
  EXPECT_EQ(put("d"), unsigned{ENOBUFS});
  EXPECT_EQ(put("e"), unsigned{ENOBUFS});
  takeOne();
  EXPECT_EQ(put("f"), 0u);
}

TEST_F(Buffer, TellsALossAtThePlaceWhereTheRowsAreMissing) {
  put("abcde");               // d and e are lost
  EXPECT_EQ(takeOne(), "a");  // room for one
  put("fgh");                 // f fits, g and h are lost
  EXPECT_EQ(takeOne(), "b");
  put("i");
  EXPECT_THAT(takeAll(), ElementsAre("c", "lost 2", "f", "lost 2", "i"));
}

TEST_F(Buffer, CountsALossOnUntilTheNextRowFits) {
  put("abcd");
  put("ef");
  EXPECT_EQ(takeOne(), "a");
  put("g");
  EXPECT_THAT(takeAll(), ElementsAre("b", "c", "lost 3", "g"));
}

TEST_F(Buffer, WithoutRoomLosesEverything) {
  RowBuffer none(0);
  EXPECT_EQ(none.rowsArrived("ab", 1, 2), unsigned{ENOBUFS});
  EXPECT_EQ(none.take(0ms).lost, 2u);
}

TEST_F(Buffer, GivesWhatIsLeftWhenItIsClosed) {
  put("abcd");
  buffer_.close();
  EXPECT_EQ(put("z"), 0u);  // nobody will read it, so nobody misses it
  EXPECT_THAT(takeAll(), ElementsAre("a", "b", "c", "lost 1", "closed"));
  EXPECT_EQ(takeOne(), "closed");
}

TEST_F(Buffer, CountsARowAsLostThatThereIsNoMemoryFor) {
  RowBuffer buffer(100);
  const std::string row(5000, 'x');
  const auto arrive = [&] { return buffer.rowsArrived(row.data(), 5000, 1); };
  EXPECT_EQ(arrive(), 0u);
  {
    const FailingAllocation failing(5000);
    EXPECT_EQ(arrive(), unsigned{ENOBUFS});
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(arrive(), 0u);
  EXPECT_EQ(buffer.take(0ms).row, row);
  EXPECT_EQ(buffer.take(0ms).lost, 1u);
  EXPECT_EQ(buffer.take(0ms).row, row);
}

}  // namespace
