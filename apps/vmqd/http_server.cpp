// HTTP/1.1 on the listening socket, by libmicrohttpd.

#include "apps/vmqd/http_server.h"

#include <microhttpd.h>

#include <cerrno>
#include <stdexcept>
#include <utility>

#include "apps/vmqd/http_connection.h"
#include "apps/vmqd/log.h"

namespace vmqd {
namespace {

// Of one connection: request header, reply header, and the body's next piece.
constexpr size_t headerBytes = size_t{32} * 1024;
constexpr unsigned turnedAway = 64;  // connections beyond the limit that can be told so at a time

HttpConnection* connectionOf(MHD_Connection* connection) {
  const auto* const info = MHD_get_connection_info(connection, MHD_CONNECTION_INFO_SOCKET_CONTEXT);
  return info == nullptr ? nullptr : static_cast<HttpConnection*>(info->socket_context);
}

// What follows is called by the HTTP library, which no exception may reach.

void connectionChanged(void* server, MHD_Connection* connection, void** context, MHD_ConnectionNotificationCode code) {
  if (code == MHD_CONNECTION_NOTIFY_CLOSED) {
    delete static_cast<HttpConnection*>(std::exchange(*context, nullptr));
    return;
  }
  try {
    *context = new HttpConnection(*static_cast<HttpServer*>(server), connection);
  } catch (const std::exception&) {
    *context = nullptr;  // handleRequest closes it
  }
}

MHD_Result handleRequest(void*, MHD_Connection* connection, const char* path, const char* method, const char*,
                         const char* piece, size_t* bytes, void** request) try {
  if (*request == nullptr) {
    HttpConnection* const begun = connectionOf(connection);
    *request = begun;
    return begun == nullptr ? MHD_NO : begun->begin(method, path);
  }
  auto* const under_way = static_cast<HttpConnection*>(*request);
  if (*bytes == 0) return under_way->answer(method, path);
  return under_way->takeBody(piece, std::exchange(*bytes, 0));
} catch (const std::exception&) {
  return MHD_NO;
}

void requestEnded(void*, MHD_Connection*, void** request, MHD_RequestTerminationCode) {
  if (*request != nullptr) static_cast<HttpConnection*>(std::exchange(*request, nullptr))->end();
}

}  // namespace

HttpServer::HttpServer(ListeningSocket& socket, const AdmittedUsers& users, const HttpLimits& limits,
                       CarriesPacket carriesPacket, Answer answer)
    : socket_(socket), users_(users), limits_(limits), carries_packet_(carriesPacket), answer_(std::move(answer)) {
  constexpr unsigned flags =
      MHD_USE_THREAD_PER_CONNECTION | MHD_USE_INTERNAL_POLLING_THREAD | MHD_USE_POLL | MHD_USE_ITC;
  daemon_ = MHD_start_daemon(flags, 0, nullptr, nullptr, handleRequest, this,                            //
                             MHD_OPTION_LISTEN_SOCKET, socket_.descriptor(),                             //
                             MHD_OPTION_CONNECTION_LIMIT, limits_.maximum_connections + turnedAway,      //
                             MHD_OPTION_CONNECTION_MEMORY_LIMIT, headerBytes,                            //
                             MHD_OPTION_NOTIFY_CONNECTION, connectionChanged, static_cast<void*>(this),  //
                             MHD_OPTION_NOTIFY_COMPLETED, requestEnded, static_cast<void*>(this),        //
                             MHD_OPTION_END);
  if (daemon_ == nullptr) throw std::runtime_error(withReason("the HTTP server does not start", errno));
}

HttpServer::~HttpServer() {
  if (daemon_ != nullptr) MHD_stop_daemon(daemon_);
}

unsigned HttpServer::stop(std::chrono::seconds patience) {
  constexpr std::chrono::seconds sending(1);
  stopping_ = true;
  (void)MHD_quiesce_daemon(daemon_);  // the socket's owner closes it
  socket_.refuseFurther();
  if (const unsigned working = working_.waitForNone(patience)) return working;
  (void)unfinished_.waitForNone(sending);  // those who do not read are cut off
  MHD_stop_daemon(std::exchange(daemon_, nullptr));
  return 0;
}

}  // namespace vmqd
