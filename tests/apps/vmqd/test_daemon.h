#pragma once
// The daemon with the component of these tests, and what they say to it.

#include <string>
#include <utility>
#include <vector>

#include "tests/support/daemon_fixture.h"
#include "tests/support/http_client.h"
#include "tests/support/json.h"

/// A vmqd with the tables of test_component.cpp.
class TestDaemon : public DaemonFixture {
 public:
  explicit TestDaemon(std::vector<std::string> lines = {}, bool start = true)
      : DaemonFixture({"", VMQ_TEST_COMPONENT, std::move(lines), start}) {}

  /// The JSON of a reply to a request on a connection of its own. Throws when it is no JSON.
  [[nodiscard]] nlohmann::json get(const std::string& path) const;
  [[nodiscard]] nlohmann::json query(const std::string& table, const std::string& predicates) const;
};

/// The code of an error reply; what the reply holds when it is none.
std::string errorCode(const HttpReply& reply);

/// Calls an operation of the interface of test_component.cpp, as a little-endian client.
inline HttpReply callOperation(HttpClient& client, int operation, const std::string& packet) {
  return client.request("POST",
                        "/v1/rpc/5a000000-0000-0000-0000-000000000001/" + std::to_string(operation) + "?version=3",
                        packet, "Data-Representation: 10000000\r\n");
}

/// A FIFO on which a query of the table GATE, or a call of operation 3, blocks.
class Gate {
 public:
  explicit Gate(const std::string& path);
  ~Gate();
  Gate(const Gate&) = delete;
  Gate& operator=(const Gate&) = delete;

  /// The body of a call of operation 3, `bytes` long.
  [[nodiscard]] std::string packet(size_t bytes) const { return path_ + std::string(bytes - path_.size(), '\0'); }
  /// The body of the query.
  [[nodiscard]] std::string query() const { return "{\"predicates\":{\"BYTES\":\"" + path_ + "\"}}"; }
  /// Waits until a query blocks on it.
  void waitForQuery();
  /// Lets it go on.
  void open();

 private:
  const std::string path_;
  int writer_ = -1;
};
