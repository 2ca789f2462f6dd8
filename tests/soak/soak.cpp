// A real vmqd under load: many clients that ask and queue commands, many watchers, and the programs that the commands
// run. After every round the clients rest, and what the daemon then takes is looked at: it may not grow from round to
// round. Every watcher sees every event once, those of each client in order.
//
//   vmq_soak SECONDS [CLIENTS [WATCHERS]]

#include <sys/resource.h>
#include <sys/utsname.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "tests/soak/daemon_footprint.h"
#include "tests/soak/event_watchers.h"
#include "tests/support/daemon_fixture.h"
#include "tests/support/http_client.h"
#include "tests/support/process_memory.h"

namespace {

using Clock = std::chrono::steady_clock;
using nlohmann::json;

constexpr int kStepsOfARound = 3;  // each: a configuration that is read, and an agent that is started
constexpr int kWarmUpRounds = 2;
constexpr int kFewestRounds = 5;
constexpr double kTolerableSlope = 40;  // KiB for 1000 requests: what a leak of 40 bytes in each would be
constexpr size_t kLogShown = 4000;
constexpr long kNoise = 1024;  // KiB that resident memory may differ by without any leak

constexpr char kInventory[] = R"(#!/bin/sh
echo '"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"'
)";

void writeHome(const TemporaryDirectory& directory) {
  directory.writeScript("home/bin/qinfo", kInventory);
  directory.writeScript("home/zlpqor6/lx8266/bin/vmq_xa", "printf 'INSTANCE=i\\nKEY=value\\n'\n");
  directory.writeScript("home/bin/CorvelAgent", "exit 0\n");
  directory.writeFile("home/tmp/.keep", "");
  utsname host{};
  (void)uname(&host);
  const std::string name = host.nodename;
  directory.writeFile("home/config/" + name.substr(0, name.find('.')) + "_vmqrunas.cfg", "<runas></runas>\n");
}

/// What a daemon says that has nothing to complain of.
bool isQuiet(const std::string& log) {
  return log.find("error") == std::string::npos && log.find("warning") == std::string::npos;
}

/// The answer row of a command.
json ask(HttpClient& client, const json& predicates) {
  const HttpReply reply = client.post("/v1/tables/KAGREQT/query", json{{"predicates", predicates}}.dump());
  if (reply.status != 200) throw std::runtime_error("a request was refused: " + reply.body);
  const json rows = json::parse(reply.body)["rows"];
  if (rows.size() != 1 || rows[0]["RETVAL"] != 0) throw std::runtime_error("a command has failed: " + reply.body);
  return rows[0];
}

/// One client on its connection.
struct Client {
  int number;
  std::unique_ptr<HttpClient> connection;
  int queued = 0;
  std::string mistake = {};

  void work() try {
    for (int step = 0; step < kStepsOfARound; ++step) {
      const json row = ask(*connection, {{"COMMAND", "GETCONFIG"}, {"TRANSID", "g"}, {"PRODUCT", "ux"}});
      if (row["CONTEXT"] != "INSTANCE=i\nKEY=value\n") throw std::runtime_error("another text: " + row.dump());
      (void)ask(*connection, {{"COMMAND", "START"}, {"TRANSID", transactionId(number, queued)}, {"PRODUCT", "ux"}});
      ++queued;
    }
  } catch (const std::exception& error) {
    mistake = error.what();
  }
};

void runRound(std::vector<Client>& clients, const EventWatchers& watchers) {
  std::vector<std::thread> threads;
  for (Client& client : clients) threads.emplace_back([&client] { client.work(); });
  for (std::thread& thread : threads) thread.join();
  for (const Client& client : clients) {
    if (!client.mistake.empty()) throw std::runtime_error(client.mistake);
    const auto end = Clock::now() + std::chrono::minutes(2);
    while (watchers.seenByAll(client.number) < client.queued) {
      if (Clock::now() > end) throw std::runtime_error("events are missing");
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
  }
}

/// Once the threads of the round's last programs have gone.
Footprint footprintAtRest(pid_t daemon, const std::vector<Footprint>& before) {
  const auto end = Clock::now() + std::chrono::seconds(10);
  Footprint footprint;
  do {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    footprint = Footprint::of(daemon);
  } while (Clock::now() < end &&
           (footprint.children > 0 || (!before.empty() && footprint.threads > before[0].threads)));
  return footprint;
}

bool doesNotGrow(const std::vector<Footprint>& at_rest) {
  const Footprint& first = at_rest.front();
  const Footprint& last = at_rest.back();
  // The second half: until every thread has had its largest request, memory grows a little.
  const double slope = memorySlope({at_rest.begin() + static_cast<ptrdiff_t>(at_rest.size() / 2), at_rest.end()});
  const long grown = last.resident_kib - first.resident_kib;
  std::printf("resident memory: %+ld KiB since the warm-up, %+.2f KiB for 1000 requests in the second half\n", grown,
              slope);
  bool fine = !memoryTells || slope <= kTolerableSlope || grown <= kNoise;
  for (const Footprint& footprint : at_rest) {
    fine = fine && footprint.threads == first.threads && footprint.descriptors == first.descriptors &&
           footprint.children == 0;
  }
  return fine;
}

bool soak(std::chrono::seconds time, int client_count, int watcher_count) {
  const TemporaryDirectory directory;
  writeHome(directory);
  DaemonFixture daemon({directory / "home",
                        VMQ_HURRIED_COMPONENT,
                        {"maximum_connections = " + std::to_string((watcher_count + client_count) * 4 / 3 + 4)}});
  const auto began = Clock::now();
  std::vector<Footprint> at_rest;
  std::vector<Client> clients;
  for (int number = 0; number < client_count; ++number)
    clients.push_back({number, std::make_unique<HttpClient>(daemon.socket())});
  bool fine = false;
  {
    const EventWatchers watchers(daemon.socket(), watcher_count);
    std::printf("%d clients, %d watchers\n", client_count, watcher_count);
    std::printf("  seconds  requests     events  resident KiB  threads  descriptors  children\n");
    for (int round = 1; round <= kFewestRounds || Clock::now() - began < time; ++round) {
      runRound(clients, watchers);
      Footprint footprint = footprintAtRest(daemon.process().pid(), at_rest);
      footprint.requests = static_cast<double>(round) * client_count * kStepsOfARound * 2;
      std::printf("%9.1f %9.0f %10lld %13ld %8u %12u %9u%s\n",
                  std::chrono::duration<double>(Clock::now() - began).count(), footprint.requests, watchers.events(),
                  footprint.resident_kib, footprint.threads, footprint.descriptors, footprint.children,
                  round <= kWarmUpRounds ? "  warm-up" : "");
      std::fflush(stdout);
      if (round > kWarmUpRounds) at_rest.push_back(footprint);
    }
    fine = doesNotGrow(at_rest);
    const std::vector<std::string> mistakes = watchers.mistakes();
    for (const std::string& mistake : mistakes) std::printf("%s\n", mistake.c_str());
    fine = fine && mistakes.empty();
  }
  const int exit_code = daemon.stop();
  const std::string log = daemon.log();
  if (exit_code != 0 || !isQuiet(log)) {
    std::printf("vmqd ended with %d, saying:\n%s\n", exit_code, log.substr(0, kLogShown).c_str());
    return false;
  }
  return fine;
}

int numberIn(const char* text) {
  const int number = std::atoi(text);
  if (number <= 0) throw std::invalid_argument("usage: vmq_soak SECONDS [CLIENTS [WATCHERS]]");
  return number;
}

/// Each watcher takes two descriptors of the daemon, which inherits the limit.
void raiseDescriptorLimit() {
  rlimit limit{};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0) return;
  limit.rlim_cur = limit.rlim_max;
  (void)setrlimit(RLIMIT_NOFILE, &limit);
}

}  // namespace

int main(int count, char** arguments) try {
  const int seconds = count > 1 ? numberIn(arguments[1]) : 0;
  const int clients = count > 2 ? numberIn(arguments[2]) : 50;
  const int watchers = count > 3 ? numberIn(arguments[3]) : 500;
  raiseDescriptorLimit();
  const bool fine = soak(std::chrono::seconds(seconds), clients, watchers);
  std::printf("%s\n", fine ? "nothing lost, doubled or out of order; nothing grows" : "FAILED");
  return fine ? EXIT_SUCCESS : EXIT_FAILURE;
} catch (const std::exception& error) {
  std::fprintf(stderr, "vmq_soak: %s\n", error.what());
  return EXIT_FAILURE;
}
