#pragma once
// Reads a text/event-stream: named events between blank lines, fed in pieces of any size.

#include <deque>
#include <optional>
#include <string>
#include <string_view>

namespace vmqctl {

struct ServerSentEvent {
  std::string name;  ///< "message" when the stream gave none
  std::string data;  ///< the data lines, joined by "\n"

  bool operator==(const ServerSentEvent&) const = default;
};

/// One thread at a time.
class EventStreamParser {
 public:
  /// An event whose lines are together longer than this is not one of ours.
  static constexpr std::size_t maximumEventBytes = 1 << 20;

  /// Takes the next piece of the stream. Returns false, for good, once an event has grown beyond maximumEventBytes.
  [[nodiscard]] bool feed(std::string_view piece);

  /// The oldest event not taken yet; none when the pieces so far hold no further whole one.
  /// An event that the stream's end cuts off is never delivered.
  [[nodiscard]] std::optional<ServerSentEvent> take();

 private:
  void endLine();
  void dispatch();

  std::deque<ServerSentEvent> events_;
  std::string line_;
  std::string name_;
  std::string data_;
  bool hasData_ = false;
  bool atStart_ = true;       ///< a byte order mark may stand before the first line
  bool afterReturn_ = false;  ///< a line feed right after a carriage return belongs to it
  bool tooLong_ = false;
};

}  // namespace vmqctl
