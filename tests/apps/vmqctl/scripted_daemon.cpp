#include "tests/apps/vmqctl/scripted_daemon.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <system_error>

void Gate::open() {
  const std::lock_guard lock(mutex_);
  open_ = true;
  changed_.notify_all();
}

bool Gate::wait() {
  std::unique_lock lock(mutex_);
  return changed_.wait_for(lock, std::chrono::seconds(20), [this] { return open_; });
}

bool Exchange::send(const std::string& bytes) const {
  for (std::size_t sent = 0; sent < bytes.size();) {
    const ssize_t count = ::send(descriptor_, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
    if (count < 0) return false;
    sent += static_cast<std::size_t>(count);
  }
  return true;
}

std::string Exchange::target() const {
  const std::size_t begin = head_.find(' ') + 1;
  return head_.substr(begin, head_.find(" HTTP/1.1\r\n") - begin);
}

void Exchange::reply(int status, const std::string& json, const std::string& headers) {
  reply(status, "application/json", headers, json);
}

void Exchange::replyPacket(const std::string& bytes, const std::string& representation) {
  reply(200, "application/octet-stream", "Data-Representation: " + representation + "\r\n", bytes);
}

void Exchange::reply(int status, const std::string& type, const std::string& headers, const std::string& body) {
  kept_ = send("HTTP/1.1 " + std::to_string(status) + " X\r\nContent-Type: " + type + "\r\n" + headers +
               "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body);
}

void Exchange::openStream() const {
  send("HTTP/1.1 200 OK\r\nContent-Type: text/event-stream\r\nConnection: close\r\n\r\n");
  event("open", R"({"table":"KAGDYST"})");
}

bool Exchange::event(const std::string& name, const std::string& data) const {
  return send("event: " + name + "\ndata: " + data + "\n\n");
}

void Exchange::awaitClose() const {
  char buffer[256];
  while (recv(descriptor_, buffer, sizeof buffer, 0) > 0) {
  }
}

ScriptedDaemon::ScriptedDaemon()
    : socket_(directory_ / "vmqd.sock"), listener_(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  socket_.copy(address.sun_path, sizeof address.sun_path - 1);
  if (listener_ < 0 || bind(listener_, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
      listen(listener_, 16) != 0) {
    throw std::system_error(errno, std::generic_category(), socket_);
  }
  acceptor_ = std::thread([this] { accept(); });
}

ScriptedDaemon::~ScriptedDaemon() {
  (void)shutdown(listener_, SHUT_RDWR);  // ends accept()
  acceptor_.join();                      // no thread is added after this
  {
    const std::lock_guard lock(mutex_);
    for (const int connection : connections_) (void)shutdown(connection, SHUT_RDWR);
  }
  for (std::thread& thread : threads_) thread.join();
  (void)close(listener_);
}

void ScriptedDaemon::on(const std::string& request, Handler handler) {
  const std::lock_guard lock(mutex_);
  handlers_[request] = std::move(handler);
}

void ScriptedDaemon::onAsked(const std::string& request, Handler handler) {
  const std::lock_guard lock(mutex_);
  asked_[request] = std::move(handler);
}

std::vector<std::string> ScriptedDaemon::log() {
  const std::lock_guard lock(mutex_);
  return log_;
}

void ScriptedDaemon::note(const std::string& text) {
  const std::lock_guard lock(mutex_);
  log_.push_back(text);
}

std::size_t ScriptedDaemon::connections() {
  const std::lock_guard lock(mutex_);
  return threads_.size();  // each has one
}

void ScriptedDaemon::accept() {
  for (;;) {
    const int connection = accept4(listener_, nullptr, nullptr, SOCK_CLOEXEC);
    if (connection < 0) return;
    const std::lock_guard lock(mutex_);
    connections_.push_back(connection);
    threads_.emplace_back([this, connection] { serve(connection); });
  }
}

ScriptedDaemon::Handler ScriptedDaemon::handlerFor(const std::map<std::string, Handler>& handlers,
                                                   const std::string& line) {
  const std::lock_guard lock(mutex_);
  const auto found = handlers.find(line.substr(0, line.find('?')));
  return found == handlers.end() ? Handler() : found->second;
}

/// One request. `received` holds what has been read of it, and in the end what has been read beyond it. True when
/// another may follow.
bool ScriptedDaemon::serveOne(int connection, std::string& received) {
  std::size_t length = 0;
  std::string head;
  std::string line;
  while (head.empty() || received.size() < head.size() + length) {
    char buffer[65536];
    const ssize_t count = recv(connection, buffer, sizeof buffer, 0);
    if (count <= 0) break;
    received.append(buffer, static_cast<std::size_t>(count));
    const std::size_t end = head.empty() ? received.find("\r\n\r\n") : std::string::npos;
    if (end == std::string::npos) continue;
    head = received.substr(0, end + 4);
    line = head.substr(0, head.find(" HTTP/1.1\r\n"));
    const std::string name = "Content-Length: ";
    if (const std::size_t at = head.find(name); at != std::string::npos)
      length = std::stoul(head.substr(at + name.size()));
    if (head.find("\r\nExpect: 100-continue\r\n") == std::string::npos) continue;
    if (const Handler handler = handlerFor(asked_, line)) {
      Exchange exchange(connection, head, "");
      handler(exchange);
      if (!exchange.kept()) {  // not answered: the body may come
        exchange.send("HTTP/1.1 100 Continue\r\n\r\n");
        continue;
      }
      note(line);
      return false;
    }
    (void)Exchange(connection, head, "").send("HTTP/1.1 100 Continue\r\n\r\n");
  }
  if (head.empty()) return false;
  note(line);
  Exchange exchange(connection, head, received.substr(head.size(), length));
  received.erase(0, head.size() + length);
  if (const Handler handler = handlerFor(handlers_, line)) {
    handler(exchange);
  } else {
    exchange.reply(404, R"({"error":{"code":"unknown_route","message":"There is nothing here."}})");
  }
  return exchange.kept();
}

void ScriptedDaemon::serve(int connection) {
  std::string received;
  while (serveOne(connection, received)) {
  }
  const std::lock_guard lock(mutex_);
  std::erase(connections_, connection);
  (void)close(connection);  // everything worth checking has been sent
}
