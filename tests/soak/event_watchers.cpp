#include "tests/soak/event_watchers.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <system_error>

namespace {

constexpr size_t kMistakesKept = 20;

int connectTo(const std::string& path) {
  const int descriptor = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
  if (descriptor < 0 || connect(descriptor, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0)
    throw std::system_error(errno, std::generic_category(), "a watcher cannot connect");
  return descriptor;
}

/// The text behind `before`, up to the next `end`; empty when there is none.
std::string between(const std::string& text, const std::string& before, char end) {
  const size_t begin = text.find(before);
  if (begin == std::string::npos) return {};
  const size_t from = begin + before.size();
  return text.substr(from, text.find(end, from) - from);
}

}  // namespace

std::string transactionId(int client, int number) {
  return std::to_string(client) + "-" + std::to_string(number);
}

EventWatchers::EventWatchers(const std::string& socket, int count) : watchers_(static_cast<size_t>(count)) {
  // By the older version of the protocol the stream comes as it is, not in chunks.
  const std::string request = "GET /v1/tables/KAGDYST/events HTTP/1.0\r\n\r\n";
  for (Watcher& watcher : watchers_) {
    watcher.descriptor = connectTo(socket);
    if (send(watcher.descriptor, request.data(), request.size(), MSG_NOSIGNAL) != static_cast<ssize_t>(request.size()))
      throw std::system_error(errno, std::generic_category(), "a watcher cannot ask");
  }
  // Only who has been told so is sure to see what comes.
  for (Watcher& watcher : watchers_) {
    while (watcher.received.find("event: open\n") == std::string::npos) {
      char block[4096];
      const ssize_t bytes = read(watcher.descriptor, block, sizeof block);
      if (bytes <= 0) throw std::system_error(errno, std::generic_category(), "a watcher was turned away");
      watcher.received.append(block, static_cast<size_t>(bytes));
    }
    watcher.received.erase(0, watcher.received.find("\r\n\r\n") + 4);
  }
  thread_ = std::thread([this] { run(); });
}

EventWatchers::~EventWatchers() {
  ending_ = true;
  if (thread_.joinable()) thread_.join();
  for (const Watcher& watcher : watchers_) close(watcher.descriptor);
}

int EventWatchers::seenByAll(int client) const {
  const std::lock_guard held(mutex_);
  int least = std::numeric_limits<int>::max();
  for (const Watcher& watcher : watchers_) {
    const auto seen = watcher.seen.find(client);
    least = std::min(least, seen == watcher.seen.end() ? 0 : seen->second);
  }
  return least;
}

std::vector<std::string> EventWatchers::mistakes() const {
  const std::lock_guard held(mutex_);
  return mistakes_;
}

void EventWatchers::run() {
  std::vector<pollfd> waiting;
  for (const Watcher& watcher : watchers_) waiting.push_back({watcher.descriptor, POLLIN, 0});
  while (!ending_) {
    if (poll(waiting.data(), waiting.size(), 100) <= 0) continue;
    for (size_t index = 0; index < waiting.size(); ++index) {
      if (waiting[index].revents == 0) continue;
      char block[65536];
      const ssize_t bytes = read(waiting[index].fd, block, sizeof block);
      const std::lock_guard held(mutex_);
      if (bytes <= 0) {
        waiting[index].fd = -1;
        if (!ending_) complain("a watcher's stream has ended");
        continue;
      }
      watchers_[index].received.append(block, static_cast<size_t>(bytes));
      take(watchers_[index]);
    }
  }
}

void EventWatchers::take(Watcher& watcher) {
  size_t begin = 0;
  for (size_t end; (end = watcher.received.find("\n\n", begin)) != std::string::npos; begin = end + 2)
    takeEvent(watcher, watcher.received.substr(begin, end - begin));
  watcher.received.erase(0, begin);
}

void EventWatchers::takeEvent(Watcher& watcher, const std::string& event) {
  if (event.rfind("event: open", 0) == 0 || event.rfind(":", 0) == 0) return;
  const std::string id = between(event, "\"TRANSID\":\"", '"');
  const size_t hyphen = id.find('-');
  if (event.rfind("event: row", 0) != 0 || hyphen == std::string::npos) return complain("not expected: " + event);
  if (between(event, "\"RETVAL\":", ',') != "0") complain("failed: " + event);
  int& seen = watcher.seen[std::atoi(id.c_str())];
  const int number = std::atoi(id.c_str() + hyphen + 1);
  if (number != seen)
    complain("a watcher sees " + id + " where " + std::to_string(seen) + " is the next of that client");
  seen = number + 1;
  ++events_;
}

void EventWatchers::complain(const std::string& mistake) {
  if (mistakes_.size() < kMistakesKept) mistakes_.push_back(mistake);
}
