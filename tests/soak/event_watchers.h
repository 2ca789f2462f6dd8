#pragma once
// Many watchers of the status table, and what each of them must see: every event once, those of each client in order.

#include <atomic>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

/// Transaction ids of the load are "CLIENT-NUMBER", numbered from 0 for each client.
std::string transactionId(int client, int number);

class EventWatchers {
 public:
  /// Opens `count` event streams on the daemon's socket and reads them on a thread of its own.
  EventWatchers(const std::string& socket, int count);
  ~EventWatchers();
  EventWatchers(const EventWatchers&) = delete;
  EventWatchers& operator=(const EventWatchers&) = delete;

  /// How many events of a client every watcher has seen.
  [[nodiscard]] int seenByAll(int client) const;
  /// What was wrong, in one line each: an event that was lost, doubled, out of order or of a failure.
  [[nodiscard]] std::vector<std::string> mistakes() const;
  /// How many events all watchers have seen together.
  [[nodiscard]] long long events() const { return events_; }

 private:
  struct Watcher {
    int descriptor = -1;
    std::string received;     ///< not taken yet
    std::map<int, int> seen;  ///< client, how many of its events
  };

  void run();
  void take(Watcher& watcher);
  void takeEvent(Watcher& watcher, const std::string& event);
  void complain(const std::string& mistake);

  std::vector<Watcher> watchers_;
  std::atomic<bool> ending_{false};
  std::atomic<long long> events_{0};
  mutable std::mutex mutex_;  // of what the watchers have seen and of the mistakes
  std::vector<std::string> mistakes_;
  std::thread thread_;
};
