#pragma once
// What vmqd offers, as routines. All of them throw a Failure that names what went wrong, and Interrupted or TimedOut.

#include <string>
#include <vector>

#include "apps/vmqctl/event_stream_parser.h"
#include "apps/vmqctl/http_loop.h"
#include "apps/vmqctl/predicates.h"

namespace vmqctl {

struct StreamEvent {
  enum class Kind {
    Row,   ///< data is a row
    Lost,  ///< data["rows"] rows are missing here
    End,   ///< the daemon has ended the stream; nothing follows
  };
  Kind kind;
  Json data;
};

/// The rows of a table as they come. Nothing is missed from the end of the constructor on.
class EventStream {
 public:
  /// Opens the stream and waits until the daemon says that it is open.
  EventStream(HttpLoop& loop, const std::string& table, const Predicates& predicates);

  /// Waits for the next event.
  StreamEvent next();

 private:
  /// None at the end of the stream.
  std::optional<ServerSentEvent> nextOfAnyName();

  HttpLoop& loop_;
  Transfer transfer_;
  EventStreamParser parser_;
};

/// One thread.
class ApiClient {
 public:
  explicit ApiClient(HttpLoop& loop) : loop_(loop) {}

  /// The answer to a GET.
  Json get(const std::string& target);

  /// The rows of a table. With the request table this runs a command.
  std::vector<Json> query(const std::string& table, const Predicates& predicates);

  EventStream events(const std::string& table, const Predicates& predicates) { return {loop_, table, predicates}; }

 private:
  Json exchange(const HttpRequest& request);

  HttpLoop& loop_;
};

}  // namespace vmqctl
