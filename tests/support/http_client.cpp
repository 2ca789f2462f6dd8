#include "tests/support/http_client.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cctype>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <system_error>

namespace {

constexpr int patienceMilliseconds = 60000;

[[noreturn]] void fail(const char* what) {
  throw std::system_error(errno, std::generic_category(), what);
}

std::string lowerCase(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

}  // namespace

HttpClient::HttpClient(const std::string& socket) : descriptor_(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
  if (descriptor_ < 0) fail("socket");
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (socket.size() >= sizeof address.sun_path) throw std::runtime_error("too long for a socket: " + socket);
  std::memcpy(address.sun_path, socket.data(), socket.size());
  if (connect(descriptor_, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    const int error = errno;
    close(descriptor_);
    errno = error;
    fail("connect");
  }
}

HttpClient::~HttpClient() {
  close(descriptor_);
}

bool HttpClient::send(const std::string& bytes) {
  for (size_t sent = 0; sent < bytes.size();) {
    const ssize_t count = ::send(descriptor_, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
    if (count < 0 && (errno == EPIPE || errno == ECONNRESET)) return false;
    if (count < 0) fail("send");
    sent += static_cast<size_t>(count);
  }
  return true;
}

bool HttpClient::sendRequest(const std::string& method, const std::string& path, const std::string& body,
                             const std::string& headers) {
  std::string text = method + " " + path + " HTTP/1.1\r\nHost: localhost\r\n" + headers;
  if (!body.empty() || method == "POST") text += "Content-Length: " + std::to_string(body.size()) + "\r\n";
  return send(text + "\r\n" + body);
}

HttpReply HttpClient::request(const std::string& method, const std::string& path, const std::string& body,
                              const std::string& headers) {
  (void)sendRequest(method, path, body, headers);  // a server may have replied before it hung up
  return receive();
}

/// Reads what there is, or waits for it. False at the end.
bool HttpClient::fill() {
  pollfd watched{descriptor_, POLLIN, 0};
  const int ready = poll(&watched, 1, patienceMilliseconds);
  if (ready < 0) fail("poll");
  if (ready == 0) throw std::runtime_error("no answer");
  char block[65536];
  const ssize_t count = recv(descriptor_, block, sizeof block, 0);
  if (count < 0 && errno == ECONNRESET) return false;
  if (count < 0) fail("recv");
  received_.append(block, static_cast<size_t>(count));
  return count > 0;
}

std::string HttpClient::takeLine() {
  size_t end;
  while ((end = received_.find("\r\n")) == std::string::npos) {
    if (!fill()) throw std::runtime_error("the server has hung up");
  }
  const std::string line = received_.substr(0, end);
  received_.erase(0, end + 2);
  return line;
}

std::string HttpClient::takeBytes(size_t count) {
  while (received_.size() < count) {
    if (!fill()) throw std::runtime_error("the server has hung up");
  }
  const std::string bytes = received_.substr(0, count);
  received_.erase(0, count);
  return bytes;
}

bool HttpClient::takeChunk(std::string* out) {
  const size_t size = std::stoul(takeLine(), nullptr, 16);
  *out += takeBytes(size);
  (void)takeLine();
  return size > 0;
}

HttpReply HttpClient::takeHeader() {
  HttpReply reply;
  const std::string status = takeLine();
  if (status.compare(0, 9, "HTTP/1.1 ") != 0) throw std::runtime_error("no HTTP: " + status);
  reply.status = std::stoi(status.substr(9));
  for (std::string line; !(line = takeLine()).empty();) {
    const size_t colon = line.find(": ");
    if (colon == std::string::npos) throw std::runtime_error("no header: " + line);
    reply.headers[lowerCase(line.substr(0, colon))] = line.substr(colon + 2);
  }
  return reply;
}

HttpReply HttpClient::receiveHeader() {
  HttpReply reply = takeHeader();
  return reply.status == 100 ? receiveHeader() : reply;
}

int HttpClient::receiveInterim() {
  return takeHeader().status;
}

HttpReply HttpClient::receive() {
  HttpReply reply = receiveHeader();
  if (reply.headers.count("content-length") != 0) {
    reply.body = takeBytes(std::stoul(reply.headers["content-length"]));
  } else {
    while (takeChunk(&reply.body)) {
    }
  }
  return reply;
}

HttpReply HttpClient::watch(const std::string& path) {
  (void)send("GET " + path + " HTTP/1.1\r\nHost: localhost\r\n\r\n");
  HttpReply reply = receiveHeader();
  if (reply.headers.count("content-length") != 0) {
    reply.body = takeBytes(std::stoul(reply.headers["content-length"]));
  }
  return reply;
}

std::optional<HttpClient::Event> HttpClient::nextEvent() {
  size_t end;
  while ((end = events_.find("\n\n")) == std::string::npos) {
    if (!takeChunk(&events_)) return std::nullopt;
  }
  const std::string block = events_.substr(0, end);
  events_.erase(0, end + 2);
  if (block.compare(0, 2, ": ") == 0) return Event{"", block.substr(2)};
  const size_t line = block.find("\ndata: ");
  if (block.compare(0, 7, "event: ") != 0 || line == std::string::npos) throw std::runtime_error("no event: " + block);
  return Event{block.substr(7, line - 7), block.substr(line + 7)};
}

void HttpClient::endSending() {
  if (shutdown(descriptor_, SHUT_WR) != 0) fail("shutdown");
}

bool HttpClient::hungUp() {
  return received_.empty() && !fill();
}
