#pragma once
// A sample home with the real daemon on it, and the words in which its tests are written.

#include <gmock/gmock.h>

#include <memory>
#include <string>
#include <vector>

#include "tests/e2e/sample_home.h"
#include "tests/support/daemon_fixture.h"
#include "tests/support/http_client.h"
#include "tests/support/json.h"

/// A client that watches the outcomes of requests. From its construction on nothing is missed.
class Watcher {
 public:
  /// `query` as in the URL ("TRANSID=t1"), empty for every row.
  explicit Watcher(const std::string& socket, const std::string& query = "");

  /// The next row. Throws std::runtime_error when none comes within a minute; null when the daemon ends the stream.
  nlohmann::json next();

 private:
  HttpClient client_;
};

class Deployment : public testing::Test {
 protected:
  using Json = nlohmann::json;

  /// Starts the daemon; `lines` are further lines of its configuration file.
  void startDaemon(const std::vector<std::string>& lines = {});
  /// Starts the daemon with a component that does not sleep: no second before an event, no ten seconds before the
  /// outcome of an install that restarts the daemon.
  void startHurriedDaemon();

  /// vmqctl with these arguments, as a shell reads them.
  [[nodiscard]] Outcome vmqctl(const std::string& arguments) const;

  /// Puts the sample bundles together, as they are before they are sent.
  static void assembleBundles(const std::string& folder);
  /// Sends all of them to the depot.
  void sendBundles() const;

  /// The rows of a query. Predicates go out in the order of their names.
  Json query(const std::string& table, const Json& predicates);
  /// The one answer row of a request.
  Json ask(const Json& request);
  /// Sends a request that is to be accepted, and waits for the row that tells its outcome.
  Json carryOut(const Json& request);

  /// The command line that the component builds for the agent script; `rest` follows the home.
  [[nodiscard]] std::string command(const std::string& rest) const;

  SampleHome home;
  std::unique_ptr<DaemonFixture> daemon;  ///< after the home: it is stopped before its agents are ended
};

/// Matches a row that tells success: no code, no message.
MATCHER(Succeeded, "") {
  (void)result_listener;
  return arg["RETVAL"] == 0 && arg["RETMSGID"] == "" && arg["RETMSGPARM"] == "";
}

/// Matches a row with this code, its message id and these message parameters.
MATCHER_P2(Failed, code, parameters, "") {
  (void)result_listener;
  return arg["RETVAL"] == code && arg["RETMSGID"] == "VMQ" + std::to_string(code) + "E" &&
         arg["RETMSGPARM"] == parameters;
}
