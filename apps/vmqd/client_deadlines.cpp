// Ends the connections of clients that take too long.

#include "apps/vmqd/client_deadlines.h"

#include <sys/socket.h>

namespace vmqd {

ClientDeadlines::ClientDeadlines(std::chrono::seconds limit) : limit_(limit), thread_([this] { run(); }) {}

ClientDeadlines::~ClientDeadlines() {
  {
    const std::lock_guard held(mutex_);
    ending_ = true;
  }
  changed_.notify_one();
  thread_.join();
}

void ClientDeadlines::run() {
  std::unique_lock held(mutex_);
  while (!ending_) {
    if (awaited_.empty()) {
      changed_.wait(held);
      continue;
    }
    Client& first = *awaited_.front();
    if (std::chrono::steady_clock::now() < first.deadline_) {
      (void)changed_.wait_until(held, std::chrono::steady_clock::time_point(first.deadline_));
      continue;
    }
    // Still that connection's: a client leaves the list, under this lock, before its descriptor is closed.
    (void)shutdown(first.descriptor_, SHUT_RDWR);
    rest(first);
  }
}

/// REQUIRES: mutex_ is held.
void ClientDeadlines::rest(Client& client) noexcept {
  if (client.resting_.empty()) client.resting_.splice(client.resting_.end(), awaited_, client.place_);
}

void ClientDeadlines::Client::await() noexcept {
  const std::lock_guard held(deadlines_.mutex_);
  deadlines_.rest(*this);
  deadline_ = std::chrono::steady_clock::now() + deadlines_.limit_;
  deadlines_.awaited_.splice(deadlines_.awaited_.end(), resting_);
  if (deadlines_.awaited_.size() == 1) deadlines_.changed_.notify_one();
}

void ClientDeadlines::Client::proceed() noexcept {
  const std::lock_guard held(deadlines_.mutex_);
  deadlines_.rest(*this);
}

}  // namespace vmqd
