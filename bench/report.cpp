// bench_report FILE...: the results of the benchmark programs (their JSON) as one table, with what is wanted of each.
// Exit status: 0; 1 when a figure is missing or a file cannot be read. A missed aim is shown, and is no error.

#include <sys/utsname.h>

#include <cstdio>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>

#include "bench/report_rows.h"

namespace {

using Json = nlohmann::json;

/// By name: the median where a benchmark was repeated, else its one run.
using Results = std::map<std::string, Json>;

/// The name without the parts that only say how it was run.
std::string plainName(std::string name) {
  for (const char* part : {"/iterations:", "/min_time:", "/repeats:", "/real_time", "/manual_time", "/process_time"}) {
    if (const size_t at = name.find(part); at != std::string::npos) name.resize(at);
  }
  return name;
}

void add(Results& results, const char* file) {
  std::ifstream stream(file);
  const Json all = Json::parse(stream);
  for (const Json& run : all.at("benchmarks")) {
    if (run.value("error_occurred", false)) continue;
    const bool isMedian = run.value("aggregate_name", "") == "median";
    if (!isMedian && run.value("run_type", "") != "iteration") continue;
    const std::string name = plainName(run.at("run_name"));
    if (isMedian || !results.contains(name)) results[name] = run;
  }
}

std::optional<double> valueOf(const Results& results, const Figure& figure) {
  const auto found = results.find(figure.benchmark);
  if (found == results.end() || !found->second.contains(figure.quantity)) return std::nullopt;
  return found->second.at(figure.quantity).get<double>();
}

std::string number(double value) {
  char text[32];
  (void)std::snprintf(text, sizeof text, value < 100 ? "%.3g" : "%.0f", value);
  return text;
}

/// With its unit, in which rates are readable.
std::string shown(const Results& results, const Row& row, const Figure& figure, double value) {
  if (figure.quantity == "bytes_per_second") return number(value / (1 << 20)) + " MiB/s";
  if (!row.unit.empty()) return number(value) + " " + row.unit;
  return number(value) + " " + results.at(figure.benchmark).value("time_unit", "");
}

std::string wanted(const Aim& aim) {
  if (aim.kind == Aim::None) return "";
  return (aim.kind == Aim::AtMost ? "<= " : ">= ") + number(aim.bound);
}

const char* verdict(const Aim& aim, double value) {
  if (aim.kind == Aim::None) return "";
  const bool isMet = aim.kind == Aim::AtMost ? value <= aim.bound : value >= aim.bound;
  return isMet ? "met" : "**missed**";
}

/// False when a figure is missing.
bool print(const Results& results, const Row& row) {
  const std::optional<double> ours = valueOf(results, row.ours);
  const bool isAlone = row.baseline.benchmark.empty();
  const std::optional<double> baseline = isAlone ? 1.0 : valueOf(results, row.baseline);  // alone it is judged as it is
  if (!ours || !baseline) {
    std::printf("| %s | not measured | | | | |\n", row.what.c_str());
    return false;
  }
  const double judged = *ours / *baseline;
  char ratio[32] = "";
  if (!isAlone) (void)std::snprintf(ratio, sizeof ratio, "%.2f", judged);
  std::printf("| %s | %s | %s | %s | %s | %s |\n", row.what.c_str(), shown(results, row, row.ours, *ours).c_str(),
              isAlone ? "" : shown(results, row, row.baseline, *baseline).c_str(), ratio, wanted(row.aim).c_str(),
              verdict(row.aim, judged));
  return true;
}

std::string processor() {
  std::ifstream stream("/proc/cpuinfo");
  for (std::string line; std::getline(stream, line);) {
    if (line.starts_with("model name")) return line.substr(line.find(':') + 2);
  }
  return "processor of unknown name";
}

void printMachine(const char* file) {
  std::ifstream stream(file);
  const Json context = Json::parse(stream).at("context");
  utsname system{};
  (void)uname(&system);
  std::printf("%s, %d cores; %s %s; g++ %s; %s\n\n", processor().c_str(), context.value("num_cpus", 0), system.sysname,
              system.release, __VERSION__, context.value("date", "").substr(0, 10).c_str());
}

}  // namespace

int main(int count, char** files) try {
  if (count < 2) {
    (void)std::fprintf(stderr, "usage: bench_report FILE...\n");
    return 1;
  }
  Results results;
  for (int i = 1; i < count; ++i) add(results, files[i]);
  printMachine(files[1]);
  std::puts("| what | ours | baseline | ratio | aim | |");
  std::puts("|---|---|---|---|---|---|");
  bool isWhole = true;
  for (const Row& row : reportRows()) isWhole = print(results, row) && isWhole;
  return isWhole ? 0 : 1;
} catch (const std::exception& problem) {
  (void)std::fprintf(stderr, "bench_report: %s\n", problem.what());
  return 1;
}
