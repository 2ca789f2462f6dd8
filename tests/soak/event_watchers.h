#pragma once
// Many watchers of the status table, and what each of them must see: every event once, those of each client in order.

#include <atomic>
#include <mutex>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

/// Transaction ids of the load are "CLIENT-NUMBER", numbered from 0 for each client.
std::string transactionId(int client, int number);

class EventWatchers {
 public:
  /// Opens `count` event streams on the daemon's socket and reads them on a thread of its own. Clients are numbered
  /// from 0.
  EventWatchers(const std::string& socket, int count, int clients);
  ~EventWatchers();
  EventWatchers(const EventWatchers&) = delete;
  EventWatchers& operator=(const EventWatchers&) = delete;

  /// How many events of a client every watcher has seen.
  [[nodiscard]] int seenByAll(int client) const;
  /// Events that did not come where they were due, of all watchers together: lost ones, or passed by a later one.
  [[nodiscard]] long long missing() const { return missing_; }
  /// Events that came once more, or after a later one.
  [[nodiscard]] long long repeated() const { return repeated_; }
  /// The first of everything that was wrong, in one line each: the above, events of failures, streams that end.
  [[nodiscard]] std::vector<std::string> mistakes() const;
  /// How many events all watchers have seen together.
  [[nodiscard]] long long events() const { return events_; }

 private:
  struct Watcher {
    int descriptor = -1;
    std::string received;   ///< not taken yet
    std::vector<int> seen;  ///< of each client, how many of its events
  };

  void run();
  /// False at the end of its stream.
  bool read(Watcher& watcher);
  void take(Watcher& watcher);
  void takeEvent(Watcher& watcher, std::string_view event);
  void complain(const std::string& mistake);

  std::vector<Watcher> watchers_;
  std::atomic<bool> ending_{false};
  std::atomic<long long> events_{0};
  std::atomic<long long> missing_{0};
  std::atomic<long long> repeated_{0};
  mutable std::mutex mutex_;  // of what the watchers have seen and of the mistakes
  std::vector<std::string> mistakes_;
  std::thread thread_;
};
