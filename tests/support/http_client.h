#pragma once
// A plain HTTP client on a Unix socket: shows exactly what a server sends, and can send what no library would.

#include <chrono>
#include <map>
#include <optional>
#include <string>

struct HttpReply {
  int status = 0;
  std::map<std::string, std::string> headers;  ///< by name in lower case
  std::string body;
};

/// One connection, kept from request to request. Throws std::runtime_error when the system fails, when the server hangs
/// up, and when it does not answer for 60 seconds.
class HttpClient {
 public:
  explicit HttpClient(const std::string& socket);
  ~HttpClient();
  HttpClient(const HttpClient&) = delete;
  HttpClient& operator=(const HttpClient&) = delete;

  HttpReply get(const std::string& path) { return request("GET", path); }
  HttpReply post(const std::string& path, const std::string& body) { return request("POST", path, body); }
  /// `headers`: whole lines, each with "\r\n".
  HttpReply request(const std::string& method, const std::string& path, const std::string& body = "",
                    const std::string& headers = "");

  /// The first half of request(); receive() is the second.
  bool sendRequest(const std::string& method, const std::string& path, const std::string& body = "",
                   const std::string& headers = "");
  /// Sends bytes as they are. False when the server has hung up.
  bool send(const std::string& bytes);
  /// Reads one whole reply.
  HttpReply receive();
  /// Reads the header of a reply; what follows is for nextEvent().
  HttpReply receiveHeader();
  /// Reads the header of a reply, or of an interim one (100), and gives its status.
  int receiveInterim();

  struct Event {
    std::string name;  ///< empty for a comment
    std::string data;  ///< of a comment: its text
    bool operator==(const Event&) const = default;
  };
  /// GET of an event stream, up to its header.
  HttpReply watch(const std::string& path);
  /// The next event or comment; nothing at the end of the stream.
  std::optional<Event> nextEvent();

  /// Ends the sending half: the server reads an end of file, and can still reply.
  void endSending();
  /// True when the server has hung up; waits for that.
  bool hungUp();
  [[nodiscard]] int descriptor() const { return descriptor_; }

 private:
  bool fill();
  std::string takeLine();
  HttpReply takeHeader();
  std::string takeBytes(size_t count);
  bool takeChunk(std::string* out);

  int descriptor_;
  std::string received_;  // not taken yet
  std::string events_;    // of the stream, unchunked, not taken yet
};
