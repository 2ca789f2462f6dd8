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

struct ChildCost {
  double seconds = 0;
  double peakKilobytes = 0;
};

/// Runs a program to its end. Its output is thrown away.
ChildCost run(std::vector<std::string> arguments) {
  std::vector<char*> pointers;
  for (std::string& argument : arguments) pointers.push_back(argument.data());
  pointers.push_back(nullptr);
  posix_spawn_file_actions_t files;
  posix_spawn_file_actions_init(&files);
  for (const int stream : {STDOUT_FILENO, STDERR_FILENO}) {
    posix_spawn_file_actions_addopen(&files, stream, "/dev/null", O_WRONLY, 0);
  }
  ChildCost cost;
  rusage usage = {};
  int status = -1;
  cost.seconds = secondsFor([&] {
    pid_t pid = -1;
    if (posix_spawnp(&pid, pointers[0], &files, nullptr, pointers.data(), environ) != 0) return;
    while (wait4(pid, &status, 0, &usage) < 0 && errno == EINTR) {
    }
  });
  posix_spawn_file_actions_destroy(&files);
  if (status != 0) throw std::runtime_error(arguments[0] + " fails");
  cost.peakKilobytes = static_cast<double>(usage.ru_maxrss);
  return cost;
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
  [[nodiscard]] std::string path(const std::string& name) const { return (directory_ / name).string(); }

  ChildCost push() const {
    fs::remove_all(path("depot/files"));
    return run({VMQ_CLIENT, "push", path("files"), "--socket", path("s")});
  }
  /// Holes are written out, and nothing is shared: what a transfer has to do as well.
  ChildCost copy() const {
    fs::remove_all(path("copy"));
    return run({"cp", "-r", "--sparse=never", "--reflink=never", path("files"), path("copy")});
  }
  /// The packets of a push, made and sent as vmqctl does, to an operation that does not exist.
  double postToNothing() const {
    const vmqctl::Stream nowhere;
    const vmqctl::Console console(nowhere, nowhere);
    vmqctl::Settings settings;
    settings.socket = path("s");
    vmqctl::PushPlan plan;
    plan.add(path("files"), "");
    return secondsFor([&] {
      vmqctl::Session session(console, settings, 0);
      vmqctl::Packet packet(session.client.get("/v1").at("maximum_packet_bytes").get<std::size_t>());
      for (const vmqctl::PlannedFile& file : plan.files()) postToNothing(session.client, packet, file);
    });
  }
  [[nodiscard]] double daemonPeakKilobytes() const {
    std::ifstream status("/proc/" + std::to_string(process_.pid()) + "/status");
    for (std::string line; std::getline(status, line);) {
      if (line.rfind("VmHWM:", 0) == 0) return std::atof(line.c_str() + 6);
    }
    throw std::runtime_error("no VmHWM");
  }

 private:
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

  std::string configuration() const {
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

double median(std::vector<double> values) {
  std::nth_element(values.begin(), values.begin() + static_cast<long>(values.size() / 2), values.end());
  return values[values.size() / 2];
}

/// The three in turns, so that all see the same machine. The ratios are of speed: 1 is as fast, 0.5 takes twice as
/// long.
void compare(benchmark::State& state, const Scene& scene, double bytes) {
  std::vector<double> pushes, copies, posts;
  double clientPeak = 0;
  for (auto _ : state) {
    const ChildCost push = scene.push();
    pushes.push_back(push.seconds);
    clientPeak = std::max(clientPeak, push.peakKilobytes);
    copies.push_back(scene.copy().seconds);
    posts.push_back(scene.postToNothing());
    state.SetIterationTime(push.seconds);
  }
  constexpr double mebibyte = 1024 * 1024;
  state.counters["push_MiB_per_s"] = bytes / mebibyte / median(pushes);
  state.counters["cp_MiB_per_s"] = bytes / mebibyte / median(copies);
  state.counters["empty_route_MiB_per_s"] = bytes / mebibyte / median(posts);
  state.counters["of_cp"] = median(copies) / median(pushes);
  state.counters["of_empty_route"] = median(posts) / median(pushes);
  state.counters["client_peak_kB"] = clientPeak;
  state.counters["daemon_peak_kB"] = scene.daemonPeakKilobytes();
}

void PushOfOneLargeFile(benchmark::State& state) {
  const char* const mebibytes = std::getenv("VMQ_PUSH_BENCH_MIB");
  const auto bytes = static_cast<std::uintmax_t>(mebibytes != nullptr ? std::atoll(mebibytes) : 1024) * 1024 * 1024;
  const Scene scene;
  std::ofstream(scene.path("files/large")).flush();
  fs::resize_file(scene.path("files/large"), bytes);
  compare(state, scene, static_cast<double>(bytes));
}
BENCHMARK(PushOfOneLargeFile)->UseManualTime()->Iterations(3)->Unit(benchmark::kMillisecond);

void PushOfAThousandSmallFiles(benchmark::State& state) {
  constexpr int files = 1000;
  const std::string text(10 * 1024, 'x');
  const Scene scene;
  for (int i = 0; i < files; ++i) std::ofstream(scene.path("files/" + std::to_string(i))) << text;
  compare(state, scene, static_cast<double>(files * text.size()));
}
BENCHMARK(PushOfAThousandSmallFiles)->UseManualTime()->Iterations(5)->Unit(benchmark::kMillisecond);

}  // namespace
