// What the daemon costs: a query of KAGREQT over the socket against the smallest thing that can be asked of it on the
// same connection, and the memory that it holds while nothing happens.

#include <benchmark/benchmark.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/support/daemon_process.h"

namespace {

using Clock = std::chrono::steady_clock;

/// A vmqd on a scratch home.
class Daemon {
 public:
  Daemon() : directory_(newDirectory()), process_({"--config", configuration(directory_)}, directory_ + "/log") {
    if (!process_.waitUntilReady()) throw std::runtime_error("vmqd does not start, see " + directory_ + "/log");
  }
  ~Daemon() {
    (void)process_.stop();
    std::filesystem::remove_all(directory_);
  }
  Daemon(const Daemon&) = delete;
  Daemon& operator=(const Daemon&) = delete;
  [[nodiscard]] std::string socket() const { return directory_ + "/s"; }
  /// A line of /proc/PID/status, in kB.
  [[nodiscard]] double kilobytes(const std::string& name) const {
    std::ifstream status("/proc/" + std::to_string(process_.pid()) + "/status");
    for (std::string line; std::getline(status, line);) {
      if (line.compare(0, name.size() + 1, name + ":") == 0)
        return std::strtod(line.c_str() + name.size() + 1, nullptr);
    }
    throw std::runtime_error("no " + name);
  }

 private:
  static std::string newDirectory() {
    std::string name = "/tmp/vmq-bench-XXXXXX";
    if (mkdtemp(name.data()) == nullptr) throw std::runtime_error("no directory " + name);
    return name;
  }
  static std::string configuration(const std::string& directory) {
    std::filesystem::create_directory(directory + "/home");
    std::ofstream(directory + "/vmqd.conf")
        << "socket = " << directory << "/s\nhome = " << directory << "/home\ntrace = none\n";
    return directory + "/vmqd.conf";
  }
  const std::string directory_;
  DaemonProcess process_;
};

/// A kept connection that knows where a reply ends by its length.
class Connection {
 public:
  explicit Connection(const std::string& path) : descriptor_(socket(AF_UNIX, SOCK_STREAM, 0)) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
    if (connect(descriptor_, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
      throw std::runtime_error("cannot connect");
    }
  }
  ~Connection() { close(descriptor_); }
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  /// Microseconds until the whole reply has come; `bytes` of it come in one piece, as the server writes it.
  [[nodiscard]] double roundTrip(const std::string& request, size_t bytes) const {
    char reply[16384];
    const auto begin = Clock::now();
    if (send(descriptor_, request.data(), request.size(), 0) < 0) throw std::runtime_error("send");
    size_t received = 0;
    while (received < bytes) {
      const ssize_t count = recv(descriptor_, reply + received, sizeof reply - received, 0);
      if (count <= 0) throw std::runtime_error("recv");
      received += static_cast<size_t>(count);
    }
    return std::chrono::duration<double, std::micro>(Clock::now() - begin).count();
  }
  /// The reply to a request that is answered in one piece.
  [[nodiscard]] std::string ask(const std::string& request) const {
    char reply[16384];
    if (send(descriptor_, request.data(), request.size(), 0) < 0) throw std::runtime_error("send");
    const ssize_t count = recv(descriptor_, reply, sizeof reply, 0);
    if (count <= 0) throw std::runtime_error("recv");
    return {reply, static_cast<size_t>(count)};
  }

 private:
  const int descriptor_;
};

const std::string emptyRequest = "GET /v1/health HTTP/1.1\r\nHost: localhost\r\n\r\n";

/// Refused by the component at once, so nothing runs behind it; the answer row is as wide as any.
std::string queryRequest() {
  const std::string body =
      R"({"predicates":{"COMMAND":"EXPLAIN","TRANSID":"t-0123456789","PRODUCT":"ux","VERSION":"06.20.00",)"
      R"("TARGETMSN":"host:UX","CONTEXT":"some text"}})";
  return "POST /v1/tables/KAGREQT/query HTTP/1.1\r\nHost: localhost\r\nContent-Length: " + std::to_string(body.size()) +
         "\r\n\r\n" + body;
}

double quantile(std::vector<double>& values, double part) {
  const auto at = values.begin() + static_cast<long>(part * static_cast<double>(values.size() - 1));
  std::nth_element(values.begin(), at, values.end());
  return *at;
}

void KagreqtAgainstEmptyRoundTrip(benchmark::State& state) {
  const Daemon daemon;
  const double idle = daemon.kilobytes("VmRSS");
  const Connection connection(daemon.socket());
  const std::string query = queryRequest();
  if (connection.ask(query).find("VMQ1006E") == std::string::npos)
    return state.SkipWithError("not the expected answer");
  const size_t empty_bytes = connection.ask(emptyRequest).size();
  const size_t query_bytes = connection.ask(query).size();
  std::vector<double> empty;
  std::vector<double> queries;
  for (auto _ : state) {
    // In turns, so that both see the same machine.
    empty.push_back(connection.roundTrip(emptyRequest, empty_bytes));
    queries.push_back(connection.roundTrip(query, query_bytes));
    state.SetIterationTime(queries.back() * 1e-6);
  }
  for (const double part : {0.1, 0.5, 0.9}) {
    const std::string name = "_p" + std::to_string(static_cast<int>(part * 100)) + "_us";
    state.counters["empty" + name] = quantile(empty, part);
    state.counters["kagreqt" + name] = quantile(queries, part);
  }
  state.counters["ratio_p50"] = quantile(queries, 0.5) / quantile(empty, 0.5);
  state.counters["idle_rss_kB"] = idle;
  state.counters["rss_after_kB"] = daemon.kilobytes("VmRSS");
}
BENCHMARK(KagreqtAgainstEmptyRoundTrip)->UseManualTime()->MinTime(2.0)->Unit(benchmark::kMicrosecond);

}  // namespace
