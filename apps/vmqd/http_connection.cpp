// One client's connection, and the request that is on it.

#include "apps/vmqd/http_connection.h"

#include <charconv>
#include <memory>
#include <string_view>
#include <utility>
#include <vector>

#include "apps/vmqd/log.h"

namespace vmqd {
namespace {

constexpr size_t streamBlockBytes = 8192;
constexpr size_t keptBufferBytes = size_t{64} * 1024;  // of each buffer, from one request to the next

struct DestroyResponse {
  void operator()(MHD_Response* response) const { MHD_destroy_response(response); }
};
using Response = std::unique_ptr<MHD_Response, DestroyResponse>;

ssize_t readStream(void* stream, uint64_t, char* buffer, size_t capacity) try {
  const size_t count = static_cast<ReplyStream*>(stream)->read(buffer, capacity);
  return count == 0 ? static_cast<ssize_t>(MHD_CONTENT_READER_END_OF_STREAM) : static_cast<ssize_t>(count);
} catch (const std::exception&) {
  return MHD_CONTENT_READER_END_WITH_ERROR;
}

void freeStream(void* stream) {
  delete static_cast<ReplyStream*>(stream);
}

int descriptorOf(MHD_Connection* connection) {
  const auto* const info = MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD);
  return info == nullptr ? -1 : info->connect_fd;
}

Response newResponse(Reply& reply) {
  if (!reply.stream) {
    // The text stays where it is until the reply has been sent.
    return Response(MHD_create_response_from_buffer(reply.text.size(), reply.text.data(), MHD_RESPMEM_PERSISTENT));
  }
  Response response(MHD_create_response_from_callback(MHD_SIZE_UNKNOWN, streamBlockBytes, readStream,
                                                      reply.stream.get(), freeStream));
  if (response) (void)reply.stream.release();  // freeStream has it now
  return response;
}

bool addHeader(const Response& response, const char* name, const char* value) {
  return MHD_add_response_header(response.get(), name, value) == MHD_YES;
}

MHD_Result collectArgument(void* arguments, MHD_ValueKind, const char* name, size_t name_bytes, const char* value,
                           size_t value_bytes) try {
  // An argument without "=" has no value at all.
  static_cast<std::vector<Argument>*>(arguments)->push_back(
      {{name, name_bytes}, value == nullptr ? std::string_view() : std::string_view(value, value_bytes)});
  return MHD_YES;
} catch (const std::bad_alloc&) {
  return MHD_NO;
}

void trim(std::string& buffer) {
  if (buffer.capacity() > keptBufferBytes) std::string().swap(buffer);
}

}  // namespace

HttpConnection::HttpConnection(HttpServer& server, MHD_Connection* connection)
    : server_(server),
      connection_(connection),
      descriptor_(descriptorOf(connection)),
      open_(server.connections_),
      deadline_(server.deadlines_, descriptor_),
      one_too_many_(server.connections_.count() > server.limits_.maximum_connections) {
  const auto peer = peerOf(descriptor_);
  admitted_ = peer && server_.users_.admits(peer->uid);
  if (!peer) {
    logWarning("refused a client whose user the system does not tell");
  } else if (!admitted_) {
    logWarning("refused the user " + std::to_string(peer->uid) + ", process " + std::to_string(peer->pid));
  }
  deadline_.await();
}

MHD_Result HttpConnection::begin(const char* method, const char* path) {
  body_.clear();
  body_bytes_ = 0;
  no_room_ = false;
  const bool is_packet = server_.carries_packet_(method, path);
  maximum_bytes_ = is_packet ? server_.limits_.maximum_packet_bytes : server_.limits_.maximum_request_bytes;
  if (!admitted_) return refuseNow(errors::notAllowed, "The daemon does not admit your user.");
  if (one_too_many_) {
    return refuseNow(errors::busy,
                     "There are already " + std::to_string(server_.limits_.maximum_connections) + " connections.");
  }
  const uint64_t bytes = announcedBytes().value_or(maximum_bytes_);  // without a length it may become as large
  if (bytes > maximum_bytes_) return bodyTooLarge();
  if (is_packet) makeRoomForPacket(bytes);
  return MHD_YES;
}

std::optional<uint64_t> HttpConnection::announcedBytes() const {
  // A body in pieces is as long as its pieces, whatever length is announced beside.
  if (!headerValue(MHD_HTTP_HEADER_TRANSFER_ENCODING).empty()) return std::nullopt;
  const std::string_view digits = headerValue(MHD_HTTP_HEADER_CONTENT_LENGTH);
  if (digits.empty()) return std::nullopt;
  uint64_t bytes = UINT64_MAX;
  (void)std::from_chars(digits.data(), digits.data() + digits.size(), bytes);
  return bytes;
}

void HttpConnection::makeRoomForPacket(size_t bytes) {
  share_ = server_.packet_memory_.take(bytes);
  no_room_ = !share_;
  if (share_) body_ = server_.packet_memory_.takeBuffer(bytes);  // at once, so that it is never copied
}

std::string_view HttpConnection::headerValue(const char* name) const {
  const char* const value = MHD_lookup_connection_value(connection_, MHD_HEADER_KIND, name);
  return value == nullptr ? std::string_view() : std::string_view(value);
}

MHD_Result HttpConnection::takeBody(const char* piece, size_t bytes) {
  body_bytes_ += bytes;
  // A body of unannounced length can be refused in words only once it has ended, but it need not end.
  if (body_bytes_ > 16 * maximum_bytes_) return MHD_NO;
  if (body_bytes_ <= maximum_bytes_ && !no_room_) body_.append(piece, bytes);
  return MHD_YES;
}

MHD_Result HttpConnection::answer(const char* method, const char* path) {
  deadline_.proceed();
  if (body_bytes_ > maximum_bytes_) return bodyTooLarge();
  Request request{method, path, {}, {}, body_, headerValue(representationHeader), descriptor_};
  (void)MHD_get_connection_values_n(connection_, MHD_GET_ARGUMENT_KIND, collectArgument, &request.arguments);
  server_.unfinished_.begin();
  unfinished_ = true;
  Reply reply(reply_);
  {
    const Activity::Scope working(server_.working_);
    // A stop sets it before it looks at who is working, so no answer begins behind its back.
    if (server_.stopping_) return refuseNow(errors::busy, "The daemon is stopping.");
    if (no_room_) {
      refuse(reply, errors::busy, "There is no room for the packet beside those that are being worked on.");
    } else {
      server_.answer_(request, reply);
    }
  }
  if (share_) giveRoomBack();
  return send(reply, false);
}

void HttpConnection::giveRoomBack() {
  server_.packet_memory_.giveBack(std::exchange(body_, std::string()));
  share_.reset();
}

void HttpConnection::end() {
  if (share_) giveRoomBack();
  trim(body_);
  trim(reply_);
  if (std::exchange(unfinished_, false)) server_.unfinished_.end();
  deadline_.await();
}

MHD_Result HttpConnection::bodyTooLarge() {
  return refuseNow(errors::bodyTooLarge, "The body is larger than " + std::to_string(maximum_bytes_) + " bytes.");
}

/// The connection ends with the reply: a body that may still be coming is not read.
MHD_Result HttpConnection::refuseNow(const ErrorCode& code, const std::string& sentence) {
  Reply reply(reply_);
  refuse(reply, code, sentence);
  return send(reply, true);
}

MHD_Result HttpConnection::send(Reply& reply, bool last) {
  const unsigned status = reply.status;
  const bool is_stream = reply.stream != nullptr;
  if (!is_stream) deadline_.await();  // a watcher may read as slowly as it likes, and loses rows
  const Response response = newResponse(reply);
  if (!response ||
      !addHeader(response, MHD_HTTP_HEADER_CONTENT_TYPE, is_stream ? "text/event-stream" : reply.content_type) ||
      (is_stream && !addHeader(response, MHD_HTTP_HEADER_CACHE_CONTROL, "no-cache")) ||
      (last && !addHeader(response, MHD_HTTP_HEADER_CONNECTION, "close"))) {
    return MHD_NO;
  }
  for (const auto& [name, value] : reply.headers) {
    if (!addHeader(response, name, value.c_str())) return MHD_NO;
  }
  return MHD_queue_response(connection_, status, response.get());
}

}  // namespace vmqd
