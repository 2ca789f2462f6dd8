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

void Exchange::reply(int status, const std::string& json) const {
  send("HTTP/1.1 " + std::to_string(status) +
       " X\r\nContent-Type: application/json\r\nContent-Length: " + std::to_string(json.size()) + "\r\n\r\n" + json);
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

std::vector<std::string> ScriptedDaemon::log() {
  const std::lock_guard lock(mutex_);
  return log_;
}

void ScriptedDaemon::note(const std::string& text) {
  const std::lock_guard lock(mutex_);
  log_.push_back(text);
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

void ScriptedDaemon::serve(int connection) {
  std::string text;
  std::size_t headEnd = std::string::npos;
  std::size_t length = 0;
  while (headEnd == std::string::npos || text.size() < headEnd + length) {
    char buffer[4096];
    const ssize_t count = recv(connection, buffer, sizeof buffer, 0);
    if (count <= 0) break;
    text.append(buffer, static_cast<std::size_t>(count));
    if (headEnd == std::string::npos && text.find("\r\n\r\n") != std::string::npos) {
      headEnd = text.find("\r\n\r\n") + 4;
      const std::string name = "Content-Length: ";
      const std::size_t at = text.find(name);
      if (at < headEnd) length = std::stoul(text.substr(at + name.size()));
    }
  }
  if (headEnd != std::string::npos) {
    const std::string line = text.substr(0, text.find(" HTTP/1.1\r\n"));
    Handler handler = [](Exchange& exchange) {
      exchange.reply(404, R"({"error":{"code":"unknown_route","message":"There is nothing here."}})");
    };
    {
      const std::lock_guard lock(mutex_);
      log_.push_back(line);
      const auto found = handlers_.find(line.substr(0, line.find('?')));
      if (found != handlers_.end()) handler = found->second;
    }
    Exchange exchange(connection, line.substr(line.find(' ') + 1), text.substr(headEnd));
    handler(exchange);
  }
  const std::lock_guard lock(mutex_);
  std::erase(connections_, connection);
  (void)close(connection);  // everything worth checking has been sent
}
