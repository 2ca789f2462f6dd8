// A real vmqd under load: many clients that ask and queue commands, many watchers, and the programs that the commands
// run. After every round the clients rest, and what the daemon then takes is looked at: it may not grow from round to
// round. Every watcher sees every event once, those of each client in order; every command has run its program once.
//
//   vmq_soak seconds|requests NUMBER [CLIENTS [WATCHERS]]

#include <sys/resource.h>
#include <sys/utsname.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/soak/daemon_footprint.h"
#include "tests/soak/event_watchers.h"
#include "tests/support/daemon_fixture.h"
#include "tests/support/http_client.h"
#include "tests/support/json.h"
#include "tests/support/process_memory.h"

namespace {

using Clock = std::chrono::steady_clock;
using nlohmann::json;

// What a client does in a round beside the one command that it queues. That makes as many events as there are watchers.
constexpr int kReadsOfARound = 8;   // of a configuration: three programs each
constexpr int kLooksOfARound = 11;  // at the status table
constexpr int kRequestsOfARound = 1 + kReadsOfARound + kLooksOfARound;
constexpr int kWarmUpRounds = 2;
constexpr size_t kRoundsAtRest = 4;
constexpr int kFewestRounds = kWarmUpRounds + static_cast<int>(kRoundsAtRest);
// On a busy machine the events of a watcher pile up, and the buffers of all 500 become a kilobyte larger for good, in
// any round. So many more rounds may then show that this comes to an end, which a leak does not.
constexpr int kMoreRounds = 20;
constexpr size_t kLogShown = 4000;

constexpr char kInventory[] = R"(echo '"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"'
)";

/// The programs that the commands run. Each writes down that it was run.
class Home {
 public:
  Home() {
    program("bin/qinfo", kInventory);
    program("zlpqor6/lx8266/bin/vmq_xa", "printf 'INSTANCE=i\\nKEY=value\\n'\n");
    program("bin/CorvelAgent", "");
    directory_.writeFile("home/tmp/.keep", "");
    directory_.writeFile("home/runs/.keep", "");
    utsname host{};
    (void)uname(&host);
    const std::string name = host.nodename;
    directory_.writeFile("home/config/" + name.substr(0, name.find('.')) + "_vmqrunas.cfg", "<runas></runas>\n");
  }

  [[nodiscard]] std::string path() const { return directory_ / "home"; }
  [[nodiscard]] long runs(const std::string& program) const {
    const std::string file = path() + "/runs/" + program;
    return std::filesystem::exists(file) ? static_cast<long>(std::filesystem::file_size(file)) : 0;
  }
  [[nodiscard]] long runsOfAll() const { return runs("qinfo") + runs("vmq_xa") + runs("CorvelAgent"); }

 private:
  /// One byte for each run: lines of several at a time do not mix.
  void program(const std::string& name, const std::string& body) const {
    const std::string file = path() + "/runs/" + std::filesystem::path(name).filename().string();
    directory_.writeScript("home/" + name, "echo >> '" + file + "'\n" + body);
  }

  const TemporaryDirectory directory_;
};

/// What a daemon says that has nothing to complain of.
bool isQuiet(const std::string& log) {
  return log.find("error") == std::string::npos && log.find("warning") == std::string::npos;
}

/// One client on its connection.
struct Client {
  int number;
  std::unique_ptr<HttpClient> connection;
  int queued = 0;
  std::string mistake = {};

  void work() try {
    start();
    for (int request = 0; request < std::max(kReadsOfARound, kLooksOfARound); ++request) {
      if (request < kReadsOfARound) readConfiguration();
      // cppcheck-suppress knownConditionTrueFalse ; as the numbers are today
      if (request < kLooksOfARound) lookAtStatus();
    }
  } catch (const std::exception& error) {
    mistake = error.what();
  }

  void start() {
    (void)ask({{"COMMAND", "START"}, {"TRANSID", transactionId(number, queued)}, {"PRODUCT", "ux"}});
    ++queued;
  }

  void readConfiguration() {
    const json row = ask({{"COMMAND", "GETCONFIG"}, {"TRANSID", "g"}, {"PRODUCT", "ux"}});
    if (row["CONTEXT"] != "INSTANCE=i\nKEY=value\n") throw std::runtime_error("another text: " + row.dump());
  }

  void lookAtStatus() {
    const json rows = rowsOf("KAGDYST", {{"TRANSID", "none"}});  // but what passes meanwhile
    if (!rows.empty()) throw std::runtime_error("rows that were not asked for: " + rows.dump());
  }

  /// The answer row of a command.
  json ask(const json& predicates) {
    const json rows = rowsOf("KAGREQT", predicates);
    if (rows.size() != 1 || rows[0]["RETVAL"] != 0) throw std::runtime_error("a command has failed: " + rows.dump());
    return rows[0];
  }

  json rowsOf(const std::string& table, const json& predicates) {
    const HttpReply reply = connection->post("/v1/tables/" + table + "/query", json{{"predicates", predicates}}.dump());
    if (reply.status != 200) throw std::runtime_error("a request was refused: " + reply.body);
    return parsedJson(reply.body)["rows"];
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

bool sameButForMemory(const Footprint& one, const Footprint& other) {
  return one.threads == other.threads && one.descriptors == other.descriptors && one.children == other.children;
}

/// Once the threads of the round's last programs have gone: when it looks the same twice in a row, and not larger than
/// before.
Footprint footprintAtRest(pid_t daemon, const std::vector<Footprint>& before) {
  const auto end = Clock::now() + std::chrono::seconds(30);
  Footprint last;
  Footprint footprint = Footprint::of(daemon);
  do {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    last = std::exchange(footprint, Footprint::of(daemon));
  } while (Clock::now() < end && (!sameButForMemory(footprint, last) || footprint.children > 0 ||
                                  (!before.empty() && footprint.threads > before[0].threads)));
  return footprint;
}

/// How much the resident memory has grown in the second half of the rounds, or in the last few.
struct Growth {
  explicit Growth(const std::vector<Footprint>& at_rest) {
    const size_t rounds = std::min(std::max(kRoundsAtRest, at_rest.size() / 2), at_rest.size() - 1);
    const Footprint& before = at_rest[at_rest.size() - 1 - rounds];
    requests = at_rest.back().requests - before.requests;
    kib = at_rest.back().resident_kib - before.resident_kib;
  }

  /// A leak of 40 bytes in each request, and what single pages make of it.
  [[nodiscard]] double tolerable() const { return 128 + 40 * requests / 1000; }
  [[nodiscard]] bool isTolerable() const { return !memoryTells || static_cast<double>(kib) <= tolerable(); }

  double requests;
  long kib;
};

bool doesNotGrow(const std::vector<Footprint>& at_rest) {
  const Footprint& first = at_rest.front();
  const Footprint& last = at_rest.back();
  const Growth growth(at_rest);
  std::printf("resident memory: %+ld KiB in the last %.0f requests, %+.1f for 1000", growth.kib, growth.requests,
              static_cast<double>(growth.kib) * 1000 / growth.requests);
  if (memoryTells) {
    std::printf(" (in all, %.0f are tolerable)\n", growth.tolerable());
  } else {
    std::printf(" (not judged: a sanitizer keeps what is freed)\n");
  }
  std::printf("threads: %+d, descriptors: %+d since the warm-up\n", static_cast<int>(last.threads - first.threads),
              static_cast<int>(last.descriptors - first.descriptors));
  bool fine = growth.isTolerable();
  for (const Footprint& footprint : at_rest) {
    fine = fine && sameButForMemory(footprint, first) && footprint.children == 0;
  }
  return fine;
}

bool isComplete(const EventWatchers& watchers) {
  std::printf("events: %lld, missing: %lld, repeated or out of order: %lld\n", watchers.events(), watchers.missing(),
              watchers.repeated());
  const std::vector<std::string> mistakes = watchers.mistakes();
  for (const std::string& mistake : mistakes) std::printf("%s\n", mistake.c_str());
  return mistakes.empty() && watchers.missing() == 0 && watchers.repeated() == 0;
}

bool hasRunEachOnce(const Home& home, long starts, long reads) {
  std::printf("child programs: %ld\n", home.runsOfAll());
  if (home.runs("CorvelAgent") == starts && home.runs("vmq_xa") == reads && home.runs("qinfo") >= reads) return true;
  std::printf("%ld starts ran their program %ld times, %ld configurations were read %ld times with %ld inventories\n",
              starts, home.runs("CorvelAgent"), reads, home.runs("vmq_xa"), home.runs("qinfo"));
  return false;
}

/// Whichever comes first.
struct End {
  std::chrono::seconds time;
  double requests;
};

bool soak(const End& end, int client_count, int watcher_count) {
  const Home home;
  DaemonFixture daemon({home.path(),
                        VMQ_HURRIED_COMPONENT,
                        {"maximum_connections = " + std::to_string((watcher_count + client_count) * 4 / 3 + 4)}});
  const auto began = Clock::now();
  std::vector<Footprint> at_rest;
  std::vector<Client> clients;
  for (int number = 0; number < client_count; ++number)
    clients.push_back({number, std::make_unique<HttpClient>(daemon.socket())});
  bool fine = false;
  {
    const EventWatchers watchers(daemon.socket(), watcher_count, client_count);
    std::printf("%d clients, %d watchers\n", client_count, watcher_count);
    std::printf("  seconds  requests     events  programs  resident KiB  threads  descriptors  children\n");
    Footprint footprint;
    int round = 0;
    int more_rounds = 0;
    const auto goesOn = [&] {
      if (round < kFewestRounds || (Clock::now() - began < end.time && footprint.requests < end.requests)) return true;
      // cppcheck-suppress knownConditionTrueFalse ; false under a sanitizer only
      return !Growth(at_rest).isTolerable() && ++more_rounds <= kMoreRounds;
    };
    while (goesOn()) {
      runRound(clients, watchers);
      ++round;
      footprint = footprintAtRest(daemon.process().pid(), at_rest);
      footprint.requests = static_cast<double>(round) * client_count * kRequestsOfARound;
      std::printf("%9.1f %9.0f %10lld %9ld %13ld %8u %12u %9u%s\n",
                  std::chrono::duration<double>(Clock::now() - began).count(), footprint.requests, watchers.events(),
                  home.runsOfAll(), footprint.resident_kib, footprint.threads, footprint.descriptors,
                  footprint.children, round <= kWarmUpRounds ? "  warm-up" : "");
      std::fflush(stdout);
      if (round >= kWarmUpRounds) at_rest.push_back(footprint);
    }
    fine = doesNotGrow(at_rest);
    fine = isComplete(watchers) && fine;
    const long starts = long{round} * client_count;
    fine = hasRunEachOnce(home, starts, long{round} * client_count * kReadsOfARound) && fine;
  }
  const int exit_code = daemon.stop();
  const std::string log = daemon.log();
  if (exit_code != 0 || !isQuiet(log)) {
    std::printf("vmqd ended with %d, saying:\n%s\n", exit_code, log.substr(0, kLogShown).c_str());
    return false;
  }
  return fine;
}

constexpr char kUsage[] = "usage: vmq_soak seconds|requests NUMBER [CLIENTS [WATCHERS]]";

int numberIn(const char* text) {
  const int number = std::atoi(text);
  if (number <= 0) throw std::invalid_argument(kUsage);
  return number;
}

End endIn(const std::string& unit, int number) {
  if (unit == "seconds") return {std::chrono::seconds(number), std::numeric_limits<double>::infinity()};
  if (unit == "requests") return {std::chrono::hours(24), static_cast<double>(number)};
  throw std::invalid_argument(kUsage);
}

/// The daemon's threads then allocate from the same memory. With the arenas that each of them finds by chance it grows
/// for long, until what one thread has freed serves all others.
void useOneArena() {
  (void)setenv("MALLOC_ARENA_MAX", "1", 1);
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
  if (count < 3) throw std::invalid_argument(kUsage);
  const End end = endIn(arguments[1], numberIn(arguments[2]));
  const int clients = count > 3 ? numberIn(arguments[3]) : 50;
  const int watchers = count > 4 ? numberIn(arguments[4]) : 500;
  raiseDescriptorLimit();
  useOneArena();
  const bool fine = soak(end, clients, watchers);
  std::printf("%s\n", fine ? "nothing lost, doubled or out of order; nothing grows" : "FAILED");
  return fine ? EXIT_SUCCESS : EXIT_FAILURE;
} catch (const std::exception& error) {
  std::fprintf(stderr, "vmq_soak: %s\n", error.what());
  return EXIT_FAILURE;
}
