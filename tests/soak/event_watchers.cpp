#include "tests/soak/event_watchers.h"

#include <sys/epoll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <iterator>
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
std::string_view between(std::string_view text, std::string_view before, char end) {
  const size_t begin = text.find(before);
  if (begin == std::string_view::npos) return {};
  const size_t from = begin + before.size();
  return text.substr(from, text.find(end, from) - from);
}

/// -1 for what is no number.
int numberOf(std::string_view digits) {
  int number = -1;
  const auto parsed = std::from_chars(digits.data(), digits.data() + digits.size(), number);
  return parsed.ec == std::errc() && parsed.ptr == digits.data() + digits.size() ? number : -1;
}

}  // namespace

std::string transactionId(int client, int number) {
  return std::to_string(client) + "-" + std::to_string(number);
}

EventWatchers::EventWatchers(const std::string& socket, int count, int clients)
    : watchers_(static_cast<size_t>(count)) {
  // By the older version of the protocol the stream comes as it is, not in chunks.
  const std::string request = "GET /v1/tables/KAGDYST/events HTTP/1.0\r\n\r\n";
  for (Watcher& watcher : watchers_) {
    watcher.seen.resize(static_cast<size_t>(clients));
    watcher.descriptor = connectTo(socket);
    if (send(watcher.descriptor, request.data(), request.size(), MSG_NOSIGNAL) != static_cast<ssize_t>(request.size()))
      throw std::system_error(errno, std::generic_category(), "a watcher cannot ask");
  }
  // Only who has been told so is sure to see what comes.
  for (Watcher& watcher : watchers_) {
    while (watcher.received.find("event: open\n") == std::string::npos) {
      char block[4096];
      const ssize_t bytes = ::read(watcher.descriptor, block, sizeof block);
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
  for (const Watcher& watcher : watchers_) least = std::min(least, watcher.seen[static_cast<size_t>(client)]);
  return least;
}

std::vector<std::string> EventWatchers::mistakes() const {
  const std::lock_guard held(mutex_);
  return mistakes_;
}

void EventWatchers::run() {
  const int readable = epoll_create1(EPOLL_CLOEXEC);
  for (Watcher& watcher : watchers_) {
    epoll_event wanted{EPOLLIN, {&watcher}};
    (void)epoll_ctl(readable, EPOLL_CTL_ADD, watcher.descriptor, &wanted);
  }
  epoll_event ready[64];
  while (!ending_) {
    const int count = epoll_wait(readable, ready, std::size(ready), 100);
    const std::lock_guard held(mutex_);
    for (int index = 0; index < count; ++index) {
      auto& watcher = *static_cast<Watcher*>(ready[index].data.ptr);
      if (!read(watcher)) (void)epoll_ctl(readable, EPOLL_CTL_DEL, watcher.descriptor, nullptr);
    }
  }
  close(readable);
}

bool EventWatchers::read(Watcher& watcher) {
  char block[65536];
  const ssize_t bytes = ::read(watcher.descriptor, block, sizeof block);
  if (bytes <= 0) {
    if (!ending_) complain("a watcher's stream has ended");
    return false;
  }
  watcher.received.append(block, static_cast<size_t>(bytes));
  take(watcher);
  return true;
}

void EventWatchers::take(Watcher& watcher) {
  const std::string_view received = watcher.received;
  size_t begin = 0;
  for (size_t end; (end = received.find("\n\n", begin)) != std::string_view::npos; begin = end + 2)
    takeEvent(watcher, received.substr(begin, end - begin));
  watcher.received.erase(0, begin);
}

void EventWatchers::takeEvent(Watcher& watcher, std::string_view event) {
  if (event.starts_with("event: open") || event.starts_with(":")) return;
  const std::string_view id = between(event, "\"TRANSID\":\"", '"');
  const int client = numberOf(id.substr(0, id.find('-')));
  const int number = numberOf(id.substr(std::min(id.size(), id.find('-') + 1)));
  if (!event.starts_with("event: row") || number < 0 || client < 0 || client >= static_cast<int>(watcher.seen.size()))
    return complain("not expected: " + std::string(event));
  if (between(event, "\"RETVAL\":", ',') != "0") complain("failed: " + std::string(event));
  int& due = watcher.seen[static_cast<size_t>(client)];
  if (number != due)
    complain("a watcher sees " + std::string(id) + " where " + std::to_string(due) + " is the next of that client");
  if (number < due) {
    ++repeated_;
  } else {
    missing_ += number - due;
    due = number + 1;
  }
  ++events_;
}

void EventWatchers::complain(const std::string& mistake) {
  if (mistakes_.size() < kMistakesKept) mistakes_.push_back(mistake);
}
