// What tracing costs a routine: the same routine untraced, traced with the trace off, and with lines really written.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdlib>

#include "ras1.h"
#include "util/trace.h"

namespace {

constinit RAS1_Unit traceUnit{"bench/trace"};

/// Some work of a small routine: the hash of a product code.
inline uint32_t hashOf(const char* text) {
  uint32_t hash = 2166136261u;
  for (; *text != '\0'; ++text) hash = (hash ^ static_cast<unsigned char>(*text)) * 16777619u;
  return hash;
}

[[gnu::noinline]] uint32_t untracedRoutine(const char* text) {
  return hashOf(text);
}

[[gnu::noinline]] uint32_t tracedRoutine(const char* text) {
  const VMQ::Trace trace(traceUnit);
  const uint32_t hash = hashOf(text);
  TRACE_DETAIL(trace, "hash of %s is %u", text, hash);
  return hash;
}

/// Takes the levels from `setting` and writes what they let through to /dev/null.
void configure(const char* setting) {
  setenv("KBB_RAS1", setting, /*overwrite=*/1);
  setenv("KBB_RAS1_LOG", "/dev/null", /*overwrite=*/1);
  char error[256];
  if (!RAS1_Configure(error, sizeof error)) std::abort();
}

void run(benchmark::State& state, uint32_t (*routine)(const char*), const char* setting, const char* text) {
  configure(setting);
  for (auto _ : state) {
    benchmark::DoNotOptimize(text);
    benchmark::DoNotOptimize(routine(text));
  }
}

constexpr const char* kShort = "ux";
constexpr const char* kLong = "0123456789abcdef0123456789abcdef0123456789abcdef0123456789abcdef";

BENCHMARK_CAPTURE(run, untraced_2_bytes, untracedRoutine, "none", kShort);
BENCHMARK_CAPTURE(run, trace_off_2_bytes, tracedRoutine, "none", kShort);
BENCHMARK_CAPTURE(run, untraced_64_bytes, untracedRoutine, "none", kLong);
BENCHMARK_CAPTURE(run, trace_off_64_bytes, tracedRoutine, "none", kLong);
BENCHMARK_CAPTURE(run, three_lines_to_dev_null, tracedRoutine, "all", kShort);

}  // namespace
