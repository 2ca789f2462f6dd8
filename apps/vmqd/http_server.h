#pragma once
// HTTP/1.1 on the listening socket: one thread for each connection, since a query may block for long.

#include <sys/types.h>

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>

#include "apps/vmqd/activity.h"
#include "apps/vmqd/client_deadlines.h"
#include "apps/vmqd/listening_socket.h"
#include "apps/vmqd/packet_memory.h"
#include "apps/vmqd/peer_credentials.h"
#include "apps/vmqd/reply.h"

struct MHD_Daemon;

namespace vmqd {

class HttpConnection;

struct HttpLimits {
  unsigned maximum_request_bytes;
  unsigned maximum_packet_bytes;
  unsigned packet_memory_bytes;
  unsigned maximum_connections;
  unsigned client_seconds;
};

class HttpServer {
 public:
  /// Answers a request; called on many threads at a time. Throws nothing but std::bad_alloc, which ends the connection.
  using Answer = std::function<void(Request&, Reply&)>;
  /// Whether the body of a request to this path is a packet.
  using CarriesPacket = bool (*)(std::string_view method, std::string_view path);

  /// Serves from now on. Throws std::runtime_error. `socket` outlives the server.
  HttpServer(ListeningSocket& socket, const AdmittedUsers& users, const HttpLimits& limits, CarriesPacket carriesPacket,
             Answer answer);
  /// Without a stop() before, waits for every answer that is being worked out.
  ~HttpServer();
  HttpServer(const HttpServer&) = delete;
  HttpServer& operator=(const HttpServer&) = delete;

  /// Takes no more clients and requests, waits up to `patience` for the answers that are being worked out and a second
  /// more for those that are being sent, and closes every connection. Returns 0, or how many answers are still being
  /// worked out: their threads cannot be ended, and the process has to exit around them. Streams must have been told to
  /// end before.
  [[nodiscard]] unsigned stop(std::chrono::seconds patience);

 private:
  friend class HttpConnection;

  ListeningSocket& socket_;
  const AdmittedUsers users_;
  const HttpLimits limits_;
  const CarriesPacket carries_packet_;
  const Answer answer_;
  std::atomic<bool> stopping_{false};
  PacketMemory packet_memory_{limits_.packet_memory_bytes};
  ClientDeadlines deadlines_{std::chrono::seconds(limits_.client_seconds)};
  Activity connections_;
  Activity working_;     // in answer_
  Activity unfinished_;  // from answer_ until the reply has been sent
  MHD_Daemon* daemon_ = nullptr;
};

}  // namespace vmqd
