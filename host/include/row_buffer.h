#pragma once
// A bounded buffer between the thread that delivers rows and the one that reads them.

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <string>

#include "bxira.h"

namespace vmqhost {

/// Collects rows without ever making the deliverer wait: when it is full, new rows are dropped and counted.
/// Thread-safe.
class RowBuffer : public RowRequester {
 public:
  explicit RowBuffer(unsigned maximum_rows) : maximum_rows_(maximum_rows) {}

  /// Returns 0, or ENOBUFS when rows were dropped.
  unsigned rowsArrived(const char* rows, unsigned row_bytes, unsigned count) override;

  /// What take() found.
  struct Item {
    enum Kind { kRow, kLost, kTimedOut, kClosed } kind = kTimedOut;
    std::string row;    ///< for kRow
    uint64_t lost = 0;  ///< for kLost: how many rows are missing between the row before and the row after
  };
  /// The oldest item; waits for one until the time-out. Rows that were dropped are told once, at the place in the order
  /// where they are missing.
  Item take(std::chrono::milliseconds timeout);

  /// Wakes every waiting reader; from now on take() gives what is left and then kClosed.
  void close();

 private:
  bool keep(const char* row, unsigned row_bytes);

  const unsigned maximum_rows_;
  std::mutex mutex_;
  std::condition_variable changed_;
  std::deque<Item> items_;    // kRow and, never two in a row, kLost; these four guarded by mutex_
  unsigned rows_ = 0;         // how many of them are kRow
  uint64_t lost_at_end_ = 0;  // dropped after the last of them
  bool closed_ = false;
};

}  // namespace vmqhost
