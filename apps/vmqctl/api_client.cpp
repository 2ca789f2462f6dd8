// The daemon's interface.

#include "apps/vmqctl/api_client.h"

#include <algorithm>
#include <bit>
#include <cerrno>
#include <cstring>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

constexpr int httpOk = 200;
constexpr int httpForbidden = 403;
constexpr int httpNotFound = 404;
constexpr int httpBusy = 503;

constexpr const char* allowHint = "Run vmqctl as root or as a user in the daemon's allowed_uids.";
constexpr const char* startHint =
    "Check that it runs (systemctl status vmqd) and that --socket or VMQ_SOCKET names its socket.";

[[noreturn]] void notUnderstood(const std::string& socket, const std::string& why) {
  throw Failure(ExitCode::Failed, "The answer on " + socket + " is not understood: " + why + ".",
                "Check that the socket is vmqd's, and of the same version as vmqctl.");
}

Json parse(const std::string& text, const std::string& socket) {
  Json value = Json::parse(text, /*cb=*/nullptr, /*allow_exceptions=*/false);
  if (value.is_discarded()) notUnderstood(socket, "it is not JSON");
  return value;
}

/// Why a transfer that did not end well did not. REQUIRES: transfer.ended(), not with CURLE_OK.
[[noreturn]] void connectionFailure(const Transfer& transfer, const std::string& socket) {
  const int error = transfer.systemError();
  switch (transfer.result()) {
    case CURLE_COULDNT_CONNECT:
      if (error == EACCES || error == EPERM) {
        throw Failure(ExitCode::NotAllowed, "The socket " + socket + " may not be used by this user.", allowHint);
      }
      throw Failure(
          ExitCode::NotReachable,
          "No daemon answers on " + socket + (error != 0 ? std::string(": ") + std::strerror(error) : "") + ".",
          startHint);
    case CURLE_UNSUPPORTED_PROTOCOL:
    case CURLE_WEIRD_SERVER_REPLY:
      notUnderstood(socket, "it is not HTTP");
    case CURLE_OUT_OF_MEMORY:
      throw std::bad_alloc();
    default:
      throw AnswerLost(ExitCode::NotReachable,
                       "The daemon on " + socket + " closed the connection before its answer was whole.", startHint);
  }
}

struct ErrorHint {
  std::string_view code;
  const char* next;
};

constexpr ErrorHint errorHints[] = {
    {"not_allowed", allowHint},
    {"unknown_table", "The command \"vmqctl status\" lists the tables."},
    {"unknown_column", "The command \"vmqctl status -o json\" lists the columns of each table."},
    {"busy", "Try again when other clients have ended."},
    {"body_too_large", "Send less, or raise maximum_request_bytes in the daemon's configuration."},
    {"internal", "Look at the daemon's trace log."},
    {"unknown_route", "Check that vmqd and vmqctl are of the same version."},
};

std::string textAt(const Json& object, const char* pointer) {
  const Json::json_pointer at(pointer);
  return object.is_object() && object.contains(at) && object[at].is_string() ? object[at].get<std::string>() : "";
}

/// The code of an error answer, "" when it is none.
std::string errorCode(const std::string& body) {
  return textAt(Json::parse(body, /*cb=*/nullptr, /*allow_exceptions=*/false), "/error/code");
}

/// Throws what an answer other than 200 says, with this code unless another fits better. The daemon's own words are
/// shown.
void checkStatus(long status, const std::string& body, const std::string& socket, ExitCode code = ExitCode::Failed) {
  if (status == httpOk) return;
  const Json answer = Json::parse(body, /*cb=*/nullptr, /*allow_exceptions=*/false);
  std::string sentence = textAt(answer, "/error/message");
  if (sentence.empty()) {
    sentence = "The daemon on " + socket + " answers with HTTP status " + std::to_string(status) + ".";
  }
  const std::string error = textAt(answer, "/error/code");
  const auto* hint =
      std::find_if(std::begin(errorHints), std::end(errorHints), [&](const ErrorHint& h) { return h.code == error; });
  throw Failure(status == httpForbidden ? ExitCode::NotAllowed : code, sentence,
                hint == std::end(errorHints) ? "" : hint->next);
}

/// Waiting times that grow, between tries that found the daemon busy.
class Backoff {
 public:
  /// Before the next try. The daemon knows best how long, within reason.
  std::chrono::milliseconds next(std::chrono::seconds asked) {
    const milliseconds own = next_;
    next_ = std::min(2 * next_, longest);
    return std::max(own, std::min<milliseconds>(asked, longest));
  }

 private:
  using milliseconds = std::chrono::milliseconds;
  static constexpr milliseconds longest{5000};
  milliseconds next_{20};
};

/// Integers as on this machine, characters ASCII.
constexpr const char* ownRepresentation = std::endian::native == std::endian::little ? "10000000" : "00000000";

std::string tableTarget(const std::string& table) {
  return "/v1/tables/" + percentEncoded(table);
}

std::string eventsTarget(const std::string& table, const Predicates& predicates) {
  const std::string query = toQueryString(predicates);
  return tableTarget(table) + "/events" + (query.empty() ? "" : "?" + query);
}

}  // namespace

ApiClient::Answer ApiClient::answerTo(const HttpRequest& request) {
  Transfer transfer(loop_, request);
  loop_.until([&] { return transfer.ended(); });
  if (transfer.result() != CURLE_OK) connectionFailure(transfer, loop_.socket());
  return {transfer.status(), transfer.takeBody(), transfer.header("Data-Representation"), transfer.retryAfter()};
}

ApiClient::Answer ApiClient::patientAnswerTo(const HttpRequest& request) {
  for (Backoff backoff;;) {
    Answer answer = answerTo(request);
    if (answer.status != httpBusy || errorCode(answer.body) != "busy") return answer;
    try {
      loop_.pause(backoff.next(answer.retryAfter));
    } catch (const TimedOut&) {
      checkStatus(answer.status, answer.body, loop_.socket(), ExitCode::TimedOut);
    }
  }
}

Json ApiClient::exchange(const HttpRequest& request) {
  const Answer answer = answerTo(request);
  checkStatus(answer.status, answer.body, loop_.socket());
  return parse(answer.body, loop_.socket());
}

RpcReply ApiClient::call(const std::string& interface, unsigned operation, std::string_view packet) {
  HttpRequest request = {"/v1/rpc/" + interface + "/" + std::to_string(operation)};
  request.packet = packet;
  request.headers = {std::string("Data-Representation: ") + ownRepresentation};
  request.keepsConnection = true;
  Answer answer = patientAnswerTo(request);
  checkStatus(answer.status, answer.body, loop_.socket());
  if (answer.representation != "10000000" && answer.representation != "00000000") {
    throw AnswerLost(ExitCode::Failed, "The daemon's answer has no Data-Representation that is understood.",
                     "Check that vmqd and vmqctl are of the same version.");
  }
  return {std::move(answer.body), answer.representation.front() == '1'};
}

std::optional<DepotFile> ApiClient::depotFile(const std::string& name) {
  HttpRequest request = {"/v1/depot/" + percentEncodedPath(name)};
  request.keepsConnection = true;
  const Answer answer = patientAnswerTo(request);
  if (answer.status == httpNotFound && errorCode(answer.body) == "not_found") return std::nullopt;
  checkStatus(answer.status, answer.body, loop_.socket());
  const Json file = parse(answer.body, loop_.socket());
  const std::string sha256 = textAt(file, "/sha256");
  if (sha256.empty() || !file.contains("size") || !file["size"].is_number_unsigned()) {
    notUnderstood(loop_.socket(), "it does not describe a file");
  }
  return DepotFile{file["size"].get<std::uint64_t>(), sha256};
}

Json ApiClient::get(const std::string& target) {
  Json answer = exchange({target});
  if (!answer.is_object()) notUnderstood(loop_.socket(), "it is not a JSON object");
  return answer;
}

std::vector<Json> ApiClient::query(const std::string& table, const Predicates& predicates) {
  const Json answer = exchange({tableTarget(table) + "/query", queryBody(predicates)});
  if (!answer.is_object() || !answer.contains("rows") || !answer["rows"].is_array()) {
    notUnderstood(loop_.socket(), "it has no rows");
  }
  std::vector<Json> rows(answer["rows"].begin(), answer["rows"].end());
  for (const Json& row : rows) {
    if (!row.is_object()) notUnderstood(loop_.socket(), "a row of it is not a JSON object");
  }
  return rows;
}

EventStream::EventStream(HttpLoop& loop, const std::string& table, const Predicates& predicates)
    : loop_(loop), transfer_(loop, {eventsTarget(table, predicates)}) {
  const std::optional<ServerSentEvent> first = nextOfAnyName();
  if (!first) {
    throw Failure(ExitCode::NotReachable,
                  "The daemon on " + loop.socket() + " ended its event stream before it was open.", startHint);
  }
  if (first->name != "open") notUnderstood(loop.socket(), "its event stream does not begin with \"open\"");
}

StreamEvent EventStream::next() {
  for (;;) {
    const std::optional<ServerSentEvent> event = nextOfAnyName();
    if (!event) return {StreamEvent::Kind::End, nullptr};
    if (event->name != "row" && event->name != "lost") continue;  // what a later daemon may say beside them
    Json data = parse(event->data, loop_.socket());
    if (!data.is_object()) notUnderstood(loop_.socket(), "an event of it is not a JSON object");
    return {event->name == "row" ? StreamEvent::Kind::Row : StreamEvent::Kind::Lost, std::move(data)};
  }
}

std::optional<ServerSentEvent> EventStream::nextOfAnyName() {
  std::optional<ServerSentEvent> event;
  loop_.until([&] {
    // The body of another status is an error object, read whole below.
    if (transfer_.status() == httpOk && !parser_.feed(transfer_.takeBody())) {
      notUnderstood(loop_.socket(), "an event of it is too long");
    }
    event = parser_.take();
    return event.has_value() || transfer_.ended();
  });
  if (event) return event;
  const bool answered = transfer_.status() != 0;
  if (!answered) connectionFailure(transfer_, loop_.socket());
  checkStatus(transfer_.status(), transfer_.body(), loop_.socket());
  return std::nullopt;
}

}  // namespace vmqctl
