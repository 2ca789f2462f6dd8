#pragma once
// What the routes work on: the one state of the daemon that outlives requests.

#include <chrono>
#include <string>

#include "apps/vmqd/table_catalog.h"
#include "apps/vmqd/watcher_slots.h"

namespace vmqd {

struct ServiceSettings {
  std::string node;
  std::string home;
  std::string depot;  ///< empty when none is set
  unsigned event_buffer_rows = 0;
  unsigned maximum_watchers = 0;
  unsigned maximum_packet_bytes = 0;
  std::chrono::milliseconds keep_alive = std::chrono::seconds(15);
  int stop = -1;  ///< descriptor that becomes readable when every watch is to end
};

/// Any thread.
struct Service {
  Service(ServiceSettings given, std::vector<vmqhost::TableDescription> described)
      : settings(std::move(given)), tables(std::move(described)), watchers(settings.maximum_watchers) {}

  const ServiceSettings settings;
  const TableCatalog tables;
  const std::chrono::steady_clock::time_point started = std::chrono::steady_clock::now();
  WatcherSlots watchers;
};

}  // namespace vmqd
