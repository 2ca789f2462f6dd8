// Running a command against the least that any program must do for it: posix_spawn, two pipes, one poll loop.
//   process_bench --benchmark_enable_random_interleaving --benchmark_repetitions=9 --benchmark_report_aggregates_only
// Wanted: RunTrue at most 1.3 times SpawnTrue at both sizes, RunMuch at least 0.8 times the rate of SpawnMuch.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>
#include <memory>
#include <vector>

#include "util/util.h"

namespace {

constexpr size_t kMebibyte = size_t{1} << 20;
constexpr size_t kMuch = 64 * kMebibyte;
constexpr size_t kReadBytes = 16384;

/// Memory that the process really uses, as hosts do.
class Resident {
 public:
  explicit Resident(size_t bytes) : memory_(new char[bytes]) { memset(memory_.get(), 1, bytes); }

 private:
  const std::unique_ptr<char[]> memory_;
};

/// Runs a program and throws away what it prints; returns how much that was.
size_t spawnAndDrain(std::vector<const char*> argv) {
  int out[2], err[2];
  if (pipe2(out, O_CLOEXEC) != 0 || pipe2(err, O_CLOEXEC) != 0) abort();
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, out[1], STDOUT_FILENO);
  posix_spawn_file_actions_adddup2(&actions, err[1], STDERR_FILENO);
  pid_t pid = -1;
  argv.push_back(nullptr);
  if (posix_spawn(&pid, argv[0], &actions, nullptr, const_cast<char* const*>(argv.data()), environ) != 0) abort();
  posix_spawn_file_actions_destroy(&actions);
  close(out[1]);
  close(err[1]);

  size_t total = 0;
  char buffer[kReadBytes];
  pollfd events[2] = {{out[0], POLLIN, 0}, {err[0], POLLIN, 0}};
  for (int open = 2; open > 0;) {
    poll(events, 2, -1);
    for (pollfd& event : events) {
      if (event.fd < 0 || event.revents == 0) continue;
      const ssize_t count = read(event.fd, buffer, sizeof buffer);
      if (count > 0) {
        total += static_cast<size_t>(count);
      } else {
        close(event.fd);
        event.fd = -1;
        --open;
      }
    }
  }
  int status = 0;
  if (waitpid(pid, &status, 0) != pid || status != 0) abort();
  return total;
}

size_t run(const char* command) {
  int rc = -1;
  VMQ::String out, err;
  if (!VMQ::Util::runCommand(command, rc, out, err, /*nonBlocking=*/false) || rc != 0) abort();
  return out.length();
}

void SpawnTrue(benchmark::State& state) {
  const Resident resident(static_cast<size_t>(state.range(0)) * kMebibyte);
  for (auto _ : state) spawnAndDrain({"/bin/true"});
}

void RunTrue(benchmark::State& state) {
  const Resident resident(static_cast<size_t>(state.range(0)) * kMebibyte);
  for (auto _ : state) run("/bin/true");
}

void SpawnMuch(benchmark::State& state) {
  for (auto _ : state) {
    if (spawnAndDrain({"/bin/sh", "-c", "yes 0123456789abcde | head -c 67108864"}) != kMuch) abort();
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * kMuch));
}

void RunMuch(benchmark::State& state) {
  for (auto _ : state) {
    if (run("/bin/sh -c \"yes 0123456789abcde | head -c 67108864\"") != kMuch) abort();
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * kMuch));
}

BENCHMARK(SpawnTrue)->Arg(20)->Arg(1024)->ArgName("MiB")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(RunTrue)->Arg(20)->Arg(1024)->ArgName("MiB")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(SpawnMuch)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(RunMuch)->UseRealTime()->Unit(benchmark::kMillisecond);

}  // namespace
