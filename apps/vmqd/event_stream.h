#pragma once
// One watcher: the events of a table as a text/event-stream.

#include <chrono>
#include <memory>
#include <string>

#include "apps/vmqd/descriptor.h"
#include "apps/vmqd/predicates.h"
#include "apps/vmqd/reply.h"
#include "apps/vmqd/watcher_slots.h"
#include "row_buffer.h"
#include "table_client.h"

namespace vmqd {

/// A bounded buffer of rows whose reader waits in poll(), where it also sees its client leave.
class PolledRowBuffer : public RowRequester {
 public:
  /// Throws std::runtime_error without a descriptor.
  explicit PolledRowBuffer(unsigned maximum_rows);

  unsigned rowsArrived(const char* rows, unsigned row_bytes, unsigned count) override;

  /// Readable since something arrived after the last call of take() began.
  [[nodiscard]] int descriptor() const { return arrivals_.get(); }
  /// The oldest item; kTimedOut when there is none. One thread at a time.
  vmqhost::RowBuffer::Item take();

 private:
  vmqhost::RowBuffer rows_;
  Descriptor arrivals_;
};

/// Begins with an "open" event; nothing that happens after the construction is missed or goes untold.
class EventStream : public ReplyStream {
 public:
  struct Settings {
    unsigned buffer_rows;
    std::chrono::milliseconds keep_alive;  ///< how long nothing may be sent before a comment is
    int client;                            ///< descriptor of the connection; a watch ends when it is hung up
    int stop;                              ///< readable when every watch is to end
  };
  /// Throws Refusal.
  EventStream(const Predicates& predicates, const Settings& settings, WatcherSlots::Slot slot);

  size_t read(char* buffer, size_t capacity) override;

 private:
  void collect(size_t wanted);
  bool append(const vmqhost::RowBuffer::Item& item);
  /// Waits for rows. False when the stream is at its end.
  bool wait();

  const Table& table_;
  const Settings settings_;
  const WatcherSlots::Slot slot_;
  PolledRowBuffer rows_;
  const std::unique_ptr<vmqhost::OpenRequest> request_;  // after what it delivers to
  std::string text_;                                     // not yet read, from taken_ on
  size_t taken_ = 0;
};

}  // namespace vmqd
