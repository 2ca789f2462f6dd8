#include "tests/apps/vmqd/test_daemon.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

nlohmann::json TestDaemon::get(const std::string& path) const {
  return parsedJson(HttpClient(socket()).get(path).body);
}

nlohmann::json TestDaemon::query(const std::string& table, const std::string& predicates) const {
  return parsedJson(
      HttpClient(socket()).post("/v1/tables/" + table + "/query", "{\"predicates\":" + predicates + "}").body);
}

std::string errorCode(const HttpReply& reply) {
  const auto json = nlohmann::json::parse(reply.body, nullptr, /*allow_exceptions=*/false);
  if (!json.is_object() || !json.contains("error")) return reply.body;
  return json["error"]["code"].get<std::string>();
}

Gate::Gate(const std::string& path) : path_(path) {
  if (mkfifo(path_.c_str(), 0600) != 0) throw std::system_error(errno, std::generic_category(), path_);
}

Gate::~Gate() {
  open();
}

void Gate::waitForQuery() {
  writer_ = ::open(path_.c_str(), O_WRONLY | O_CLOEXEC);  // comes back when there is a reader
  if (writer_ < 0) throw std::system_error(errno, std::generic_category(), path_);
}

void Gate::open() {
  if (writer_ >= 0) close(writer_);
  writer_ = -1;
}
