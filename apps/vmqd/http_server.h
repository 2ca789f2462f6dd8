#pragma once
// HTTP/1.1 on the listening socket: one thread for each connection, since a query may block for long.

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <memory>

#include "apps/vmqd/activity.h"
#include "apps/vmqd/listening_socket.h"
#include "apps/vmqd/peer_credentials.h"
#include "apps/vmqd/reply.h"

struct MHD_Daemon;

namespace vmqd {

class HttpConnection;

struct HttpLimits {
  unsigned maximum_request_bytes;
  unsigned maximum_connections;
};

class HttpServer {
 public:
  /// Answers a request; called on many threads at a time. Throws nothing but std::bad_alloc, which ends the connection.
  using Answer = std::function<void(Request&, Reply&)>;

  /// Serves from now on. Throws std::runtime_error. `socket` outlives the server.
  HttpServer(ListeningSocket& socket, const AdmittedUsers& users, const HttpLimits& limits, Answer answer);
  /// Without a stop() before, waits for every answer that is being worked out.
  ~HttpServer();
  HttpServer(const HttpServer&) = delete;
  HttpServer& operator=(const HttpServer&) = delete;

  /// Takes no more clients, waits up to `patience` for the answers that are being worked out and a second more for
  /// those that are being sent, and closes every connection. False when an answer is still being worked out: its
  /// thread cannot be ended, and the process has to exit around it. Streams must have been told to end before.
  [[nodiscard]] bool stop(std::chrono::seconds patience);

  /// How many answers are being worked out.
  [[nodiscard]] unsigned working() const { return working_.count(); }

 private:
  friend class HttpConnection;

  ListeningSocket& socket_;
  const AdmittedUsers users_;
  const HttpLimits limits_;
  const Answer answer_;
  Activity connections_;
  Activity working_;     // in answer_
  Activity unfinished_;  // from answer_ until the reply has been sent
  MHD_Daemon* daemon_ = nullptr;
};

}  // namespace vmqd
