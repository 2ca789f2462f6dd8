#pragma once
// One client's connection, and the request that is on it.

#include <microhttpd.h>

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

#include "apps/vmqd/http_server.h"
#include "apps/vmqd/refusal.h"

namespace vmqd {

/// Its buffers stay from request to request. One thread at a time: it is made and destroyed by the one that accepts
/// connections, before and after its own thread works on its requests.
class HttpConnection {
 public:
  /// `connection` was accepted just now.
  HttpConnection(HttpServer& server, MHD_Connection* connection);
  ~HttpConnection() = default;
  HttpConnection(const HttpConnection&) = delete;
  HttpConnection& operator=(const HttpConnection&) = delete;

  // The steps of a request. The result is for the HTTP library: MHD_NO closes the connection.
  MHD_Result begin(const char* method, const char* path);   ///< its header has arrived
  MHD_Result takeBody(const char* piece, size_t bytes);     ///< a piece of its body has
  MHD_Result answer(const char* method, const char* path);  ///< all of it has
  void end();                                               ///< its reply has been sent, or cannot be

 private:
  MHD_Result refuseNow(const ErrorCode& code, const std::string& sentence);
  MHD_Result bodyTooLarge();
  /// What the header says of the length of the body; nothing where it does not.
  [[nodiscard]] std::optional<uint64_t> announcedBytes() const;
  void makeRoomForPacket(size_t bytes);
  void giveRoomBack();
  [[nodiscard]] std::string_view headerValue(const char* name) const;
  MHD_Result send(Reply& reply, bool last);

  HttpServer& server_;
  MHD_Connection* const connection_;
  const int descriptor_;
  const Activity::Scope open_;
  ClientDeadlines::Client deadline_;
  bool admitted_ = false;
  const bool one_too_many_;
  bool unfinished_ = false;
  size_t maximum_bytes_ = 0;                  // of this request's body
  std::optional<PacketMemory::Share> share_;  // when the body is a packet and there was room for it
  bool no_room_ = false;                      // when there was none: the body is read, but not kept
  size_t body_bytes_ = 0;                     // of those that came; body_ keeps no more than are allowed
  std::string body_;
  std::string reply_;
};

}  // namespace vmqd
