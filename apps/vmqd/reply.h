#pragma once
// What a route is asked and what it answers, whatever carries it.

#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace vmqd {

/// The header that labels a packet with how numbers and texts are written in it.
inline constexpr const char* representationHeader = "Data-Representation";

struct Argument {
  std::string_view name;
  std::string_view value;
};

/// Valid while it is being answered.
struct Request {
  std::string_view method;
  std::string_view path;
  std::array<std::string_view, 2> parameters;  ///< what stands in the path where the route has its "{...}"s
  std::vector<Argument> arguments;             ///< of the query string, decoded, in the order sent
  std::string_view body;
  std::string_view representation;  ///< the header of that name; empty when there is none
  int client = -1;                  ///< descriptor of the connection
};

/// A reply without a known end.
class ReplyStream {
 public:
  virtual ~ReplyStream() = default;
  /// Waits until there is something, and stores at most `capacity` bytes of it. Returns how many, 0 at the end.
  virtual size_t read(char* buffer, size_t capacity) = 0;
};

inline constexpr const char* jsonType = "application/json";

struct Reply {
  explicit Reply(std::string& reused) : text(reused) { text.clear(); }

  unsigned status = 200;
  std::string& text;  ///< in a buffer that the connection keeps
  const char* content_type = jsonType;
  std::vector<std::pair<const char*, std::string>> headers;  ///< beside the usual ones
  std::unique_ptr<ReplyStream> stream;  ///< if there is one, the text/event-stream that is sent instead of `text`
};

}  // namespace vmqd
