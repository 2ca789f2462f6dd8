// What it costs to push files into the depot: vmqctl and a real vmqd against cp of the same files, and against the same
// packets posted to an operation that does not exist, which the daemon reads whole and answers without doing anything.
// The size of the large file: VMQ_PUSH_BENCH_MIB (1024). Where the files are: TMPDIR (/tmp).

#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/push/packet.h"
#include "apps/vmqctl/push/push_plan.h"
#include "apps/vmqctl/push/source_file.h"
#include "apps/vmqctl/settings.h"
#include "tests/support/daemon_process.h"

namespace {

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;
using Seconds = std::chrono::duration<double>;

constexpr unsigned unknownOperation = 9999;

fs::path newDirectory() {
  std::string name = (fs::temp_directory_path() / "vmq-push-bench-XXXXXX").string();
  if (mkdtemp(name.data()) == nullptr) throw std::runtime_error("no directory " + name);
  return name;
}

double secondsFor(const std::function<void()>& work) {
  const auto begin = Clock::now();
  work();
  return Seconds(Clock::now() - begin).count();
}

struct Cost {
  double seconds = 0;
  double cpuSeconds = 0;        ///< of the program that was run, or of this one
  double daemonCpuSeconds = 0;  ///< meanwhile
};

double inSeconds(const timeval& time) {
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) * 1e-6;
}

double cpuSecondsIn(const rusage& usage) {
  return inSeconds(usage.ru_utime) + inSeconds(usage.ru_stime);
}

/// The most memory that a process has held so far; 0 when it is gone.
double peakKilobytes(pid_t pid) {
  std::ifstream status("/proc/" + std::to_string(pid) + "/status");
  for (std::string line; std::getline(status, line);) {
    if (line.rfind("VmHWM:", 0) == 0) return std::strtod(line.c_str() + 6, nullptr);
  }
  return 0;
}

/// Starts a program. Its output is thrown away.
pid_t start(std::vector<std::string> arguments) {
  std::vector<char*> pointers;
  for (std::string& argument : arguments) pointers.push_back(argument.data());
  pointers.push_back(nullptr);
  posix_spawn_file_actions_t files;
  posix_spawn_file_actions_init(&files);
  for (const int stream : {STDOUT_FILENO, STDERR_FILENO}) {
    posix_spawn_file_actions_addopen(&files, stream, "/dev/null", O_WRONLY, 0);
  }
  pid_t pid = -1;
  const int error = posix_spawnp(&pid, pointers[0], &files, nullptr, pointers.data(), environ);
  posix_spawn_file_actions_destroy(&files);
  if (error != 0) throw std::runtime_error(arguments[0] + " does not start");
  return pid;
}

/// Runs a program to its end.
Cost run(const std::vector<std::string>& arguments) {
  int status = -1;
  rusage usage = {};
  const double seconds = secondsFor([&] {
    const pid_t pid = start(arguments);
    while (wait4(pid, &status, 0, &usage) < 0 && errno == EINTR) {
    }
  });
  if (status != 0) throw std::runtime_error(arguments[0] + " fails");
  return {seconds, cpuSecondsIn(usage)};
}

/// The same, and looks at its memory instead of its speed.
double peakKilobytesOf(const std::vector<std::string>& arguments) {
  const pid_t pid = start(arguments);
  double peak = 0;
  while (waitpid(pid, nullptr, WNOHANG) == 0) {
    peak = std::max(peak, peakKilobytes(pid));
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return peak;
}

/// A vmqd whose depot and whose files to push are on one file system.
class Scene {
 public:
  Scene() : directory_(newDirectory()), process_({"--config", configuration()}, path("log")) {
    if (!process_.waitUntilReady()) throw std::runtime_error("vmqd does not start, see " + path("log"));
  }
  ~Scene() {
    (void)process_.stop();
    fs::remove_all(directory_);
  }
  Scene(const Scene&) = delete;
  Scene& operator=(const Scene&) = delete;
  [[nodiscard]] std::string path(const std::string& name) const { return (directory_ / name).string(); }

  [[nodiscard]] Cost push() const {
    return withDaemon([&] { return run(pushArguments()); });
  }
  [[nodiscard]] double clientPeakKilobytes() const { return peakKilobytesOf(pushArguments()); }
  /// Holes are written out, and nothing is shared: what a transfer has to do as well.
  [[nodiscard]] Cost copy() const {
    setAside("copy");
    return run({"cp", "-r", "--sparse=never", "--reflink=never", path("files"), path("copy")});
  }
  /// The packets of a push, made and sent as vmqctl does, to an operation that does not exist.
  [[nodiscard]] Cost postToNothing() const {
    return withDaemon([&] {
      rusage before = {}, after = {};
      (void)getrusage(RUSAGE_SELF, &before);  // cannot fail
      const double seconds = secondsFor([&] { postFilesToNothing(); });
      (void)getrusage(RUSAGE_SELF, &after);
      return Cost{seconds, cpuSecondsIn(after) - cpuSecondsIn(before)};
    });
  }
  [[nodiscard]] double daemonPeakKilobytes() const { return peakKilobytes(process_.pid()); }

 private:
  /// Makes way for files of the same names. They are emptied, but not removed: a file system may take long to make a
  /// new file where it has just removed a thousand.
  void setAside(const std::string& name) const {
    if (!fs::exists(path(name))) return;
    for (const auto& file : fs::directory_iterator(path(name))) fs::resize_file(file, 0);
    static int number = 0;
    fs::rename(path(name), path("aside" + std::to_string(++number)));
  }
  [[nodiscard]] std::vector<std::string> pushArguments() const {
    setAside("depot/files");
    return {VMQ_CLIENT, "push", path("files"), "--socket", path("s")};
  }
  [[nodiscard]] Cost withDaemon(const std::function<Cost()>& work) const {
    const double before = daemonCpuSeconds();
    Cost cost = work();
    cost.daemonCpuSeconds = daemonCpuSeconds() - before;
    return cost;
  }
  [[nodiscard]] double daemonCpuSeconds() const {
    std::ifstream stat("/proc/" + std::to_string(process_.pid()) + "/stat");
    std::string word;
    for (int field = 1; field < 14; ++field) stat >> word;  // "(vmqd)" is one word
    double user = 0, system = 0;
    stat >> user >> system;
    return (user + system) / static_cast<double>(sysconf(_SC_CLK_TCK));
  }
  void postFilesToNothing() const {
    const vmqctl::Stream nowhere;
    const vmqctl::Console console(nowhere, nowhere);
    vmqctl::Settings settings;
    settings.socket = path("s");
    vmqctl::PushPlan plan;
    plan.add(path("files"), "");
    vmqctl::Session session(console, settings, 0);
    vmqctl::Packet packet(session.client.get("/v1").at("maximum_packet_bytes").get<std::size_t>());
    for (const vmqctl::PlannedFile& file : plan.files()) postToNothing(session.client, packet, file);
  }
  static void postToNothing(vmqctl::ApiClient& client, vmqctl::Packet& packet, const vmqctl::PlannedFile& file) {
    vmqctl::SourceFile source(file.source);
    std::uint64_t left = source.bytes();
    for (std::int32_t chunk = 1; chunk == 1 || left > 0; ++chunk) {
      const std::size_t count = std::min<std::uint64_t>(left, packet.chunkBytes());
      packet.begin(file.name, chunk, count);
      source.read(packet.pieces());
      left -= count;
      try {
        (void)client.call(vmqctl::Packet::interfaceId, unknownOperation, packet.bytes());
        throw std::logic_error("there is such an operation");
      } catch (const vmqctl::AnswerLost&) {
        throw;
      } catch (const vmqctl::Failure&) {
        // 404, after the whole packet has been read.
      }
    }
  }

  [[nodiscard]] std::string configuration() const {
    fs::create_directories(directory_ / "home/tmp");
    fs::create_directories(directory_ / "depot");
    fs::create_directories(directory_ / "files");
    std::ofstream(path("vmqd.conf")) << "socket = " << path("s") << "\nhome = " << path("home")
                                     << "\ndepot = " << path("depot") << "\ntrace = none\n";
    return path("vmqd.conf");
  }

  const fs::path directory_;
  DaemonProcess process_;
};

/// A series of costs, and the middle one of each kind.
class Costs {
 public:
  void add(const Cost& cost) { costs_.push_back(cost); }
  [[nodiscard]] double median(double Cost::*kind) const {
    std::vector<double> values;
    for (const Cost& cost : costs_) values.push_back(cost.*kind);
    std::nth_element(values.begin(), values.begin() + static_cast<long>(values.size() / 2), values.end());
    return values[values.size() / 2];
  }

 private:
  std::vector<Cost> costs_;
};

/// The three in turns, so that all see the same machine. The ratios are of speed: 1 is as fast, 0.5 takes twice as
/// long.
void compare(benchmark::State& state, const Scene& scene, double bytes) {
  Costs pushes, copies, posts;
  for (auto _ : state) {
    const Cost push = scene.push();
    pushes.add(push);
    copies.add(scene.copy());
    posts.add(scene.postToNothing());
    state.SetIterationTime(push.seconds);
  }
  const auto rate = [&](const Costs& costs) { return bytes / (1024 * 1024) / costs.median(&Cost::seconds); };
  state.counters["push_MiB_per_s"] = rate(pushes);
  state.counters["cp_MiB_per_s"] = rate(copies);
  state.counters["empty_route_MiB_per_s"] = rate(posts);
  state.counters["of_cp"] = rate(pushes) / rate(copies);
  state.counters["of_empty_route"] = rate(pushes) / rate(posts);
  // Where other work disturbs the rates, these still tell.
  state.counters["push_client_cpu_s"] = pushes.median(&Cost::cpuSeconds);
  state.counters["push_daemon_cpu_s"] = pushes.median(&Cost::daemonCpuSeconds);
  state.counters["empty_route_client_cpu_s"] = posts.median(&Cost::cpuSeconds);
  state.counters["empty_route_daemon_cpu_s"] = posts.median(&Cost::daemonCpuSeconds);
  state.counters["cp_cpu_s"] = copies.median(&Cost::cpuSeconds);
  state.counters["client_peak_kB"] = scene.clientPeakKilobytes();
  state.counters["daemon_peak_kB"] = scene.daemonPeakKilobytes();
}

void PushOfOneLargeFile(benchmark::State& state) {
  const char* const mebibytes = std::getenv("VMQ_PUSH_BENCH_MIB");
  const auto bytes =
      static_cast<std::uintmax_t>(mebibytes != nullptr ? std::strtoll(mebibytes, nullptr, 10) : 1024) * 1024 * 1024;
  const Scene scene;
  std::ofstream(scene.path("files/large")).flush();
  fs::resize_file(scene.path("files/large"), bytes);
  compare(state, scene, static_cast<double>(bytes));
}
BENCHMARK(PushOfOneLargeFile)->UseManualTime()->Iterations(3)->Unit(benchmark::kMillisecond);

void PushOfAThousandSmallFiles(benchmark::State& state) {
  constexpr int files = 1000;
  const std::string text(std::size_t{10} * 1024, 'x');
  const Scene scene;
  for (int i = 0; i < files; ++i) std::ofstream(scene.path("files/" + std::to_string(i))) << text;
  compare(state, scene, static_cast<double>(files * text.size()));
}
BENCHMARK(PushOfAThousandSmallFiles)->UseManualTime()->Iterations(5)->Unit(benchmark::kMillisecond);

}  // namespace
