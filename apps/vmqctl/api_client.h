#pragma once
// What vmqd offers, as routines. All of them throw a Failure that names what went wrong, and Interrupted or TimedOut.

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
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

/// What a remote procedure answers.
struct RpcReply {
  std::string body;
  bool littleEndian = true;  ///< its integers
};

/// What the daemon says of a file in the depot.
struct DepotFile {
  std::uint64_t bytes = 0;
  std::string sha256;  ///< 64 hexadecimal digits
};

/// One thread.
class ApiClient {
 public:
  explicit ApiClient(HttpLoop& loop) : loop_(loop) {}

  /// The answer to a GET.
  Json get(const std::string& target);

  /// The rows of a table. With the request table this runs a command.
  std::vector<Json> query(const std::string& table, const Predicates& predicates);

  /// Calls a procedure of an interface, version 1, with this packet, which is in the byte order of this machine. While
  /// the daemon has no room for it, waits and tries again. The packet is never sent a second time after it may have
  /// been taken.
  RpcReply call(const std::string& interface, unsigned operation, std::string_view packet);

  /// A file of the depot by its path in there; none when there is no such file. Waits as call() does.
  std::optional<DepotFile> depotFile(const std::string& name);

  EventStream events(const std::string& table, const Predicates& predicates) { return {loop_, table, predicates}; }

 private:
  struct Answer {
    long status = 0;
    std::string body;
    std::string representation;  ///< of an RPC reply
    std::chrono::seconds retryAfter{};
  };

  Json exchange(const HttpRequest& request);
  Answer answerTo(const HttpRequest& request);
  /// The same, but waits and tries again while the daemon is busy.
  Answer patientAnswerTo(const HttpRequest& request);

  HttpLoop& loop_;
};

}  // namespace vmqctl
