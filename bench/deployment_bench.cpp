// What the component adds to the commands that it runs for a request, measured through its tables on real children.
// Each pair is measured in turns, so that both see the same machine; the counters are the best rounds, to which other
// work of the machine has added least.
//   InventoryAgainstItsCommands   KINAGT with many products, against running the same three commands without reading
//                                 what they print. us_per_line is what each product costs.
//   GetConfigAgainstTheTranslator GETCONFIG, which asks the inventory tool twice before, against the translator alone
//                                 and against all three commands.
//   RequestsThatDoNothing         a thousand queued requests without a task, until the event of the last, against
//                                 payloads of the same sizes through bare queues. The second before each event is not
//                                 slept.

#include <benchmark/benchmark.h>
#include <sys/stat.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <deque>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "bss1.h"
#include "mgmt/initialize.h"
#include "mgmt/rows.h"
#include "row_buffer.h"
#include "table_client.h"
#include "test_seam.h"
#include "util/util.h"

namespace {

using Clock = std::chrono::steady_clock;
using vmqhost::OpenRequest;
using vmqhost::RowBuffer;

constexpr char kHeader[] = "\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"\n";

/// The component of this process on a scratch home with its tools.
class Component {
 public:
  Component(const Component&) = delete;
  Component& operator=(const Component&) = delete;
  static Component& get() {
    static Component component;
    return component;
  }
  [[nodiscard]] const std::string& home() const { return home_; }
  /// The inventory tool lists so many products, the two that lead to the translator among them.
  void products(int64_t count) const {
    std::ofstream listing(home_ + "/listing");
    listing << kHeader << "\"ux\",\"Unix agent\",\"lx8266\",\"062000000\",\"100\"\n"
            << "\"ax\",\"Shared libraries\",\"lx8266\",\"062000000\",\"100\"\n";
    for (int64_t i = 2; i < count; ++i)
      listing << "\"p" << i << "\",\"Monitoring agent number " << i << "\",\"lx8266\",\"062000000\",\"100\"\n";
  }

 private:
  Component() : home_(newDirectory()) {
    BSS1_PutEnv(("CORVELHOME=" + home_).c_str());
    BSS1_PutEnv(("QORDEPLOY_AGENTDEPOT=" + home_ + "/depot").c_str());
    script("bin/dynarch.shl", "os=Linux; cArch=lx8266");
    script("bin/qinfo", "case $1 in -d) exec cat " + home_ + "/listing ;; esac");
    script("zlpqor6/lx8266/bin/vmq_xa", "echo INSTANCE=inst1");
    products(2);
    if (Initialize_Mgmt_Functions() != 0) throw std::runtime_error("the component does not start");
  }
  ~Component() { std::filesystem::remove_all(home_); }

  static std::string newDirectory() {
    std::string name = "/tmp/vmq-bench-XXXXXX";
    if (mkdtemp(name.data()) == nullptr) throw std::runtime_error("no directory " + name);
    return name;
  }
  void script(const std::string& name, const std::string& body) const {
    const std::filesystem::path path = home_ + "/" + name;
    std::filesystem::create_directories(path.parent_path());
    std::ofstream(path) << "#!/bin/sh\n" << body << "\n";
    chmod(path.c_str(), 0755);
  }

  const std::string home_;
};

std::unique_ptr<OpenRequest> open(const std::string& table, const std::vector<RequestDetail::Predicate>& predicates,
                                  RowBuffer& rows) {
  RequestDetail detail;
  detail.application = "VMQ";
  detail.table = table;
  detail.predicates = predicates;
  auto request = OpenRequest::open(detail, rows);
  if (!request) throw std::runtime_error("cannot open " + table);
  return request;
}

/// Rows that have arrived, all of them taken.
size_t takeAll(RowBuffer& rows) {
  size_t count = 0;
  while (rows.take(std::chrono::milliseconds(0)).kind == RowBuffer::Item::kRow) ++count;
  return count;
}

void run(const std::string& command) {
  int rc = -1;
  VMQ::String out, err;
  if (!VMQ::Util::runCommand(command.c_str(), rc, out, err, /*nonBlocking=*/false) || rc != 0)
    throw std::runtime_error("failed: " + command);
  benchmark::DoNotOptimize(out);
}

/// Seconds that something takes.
template <class Work>
double timed(Work work) {
  const auto begin = Clock::now();
  work();
  return std::chrono::duration<double>(Clock::now() - begin).count();
}

double best(const std::vector<double>& values) {
  return *std::min_element(values.begin(), values.end());
}

void InventoryAgainstItsCommands(benchmark::State& state) {
  const Component& component = Component::get();
  component.products(state.range(0));
  const std::string& home = component.home();
  RowBuffer rows(20000);
  const auto request = open("KINAGT", {}, rows);
  std::vector<double> bare, sampled;
  for (auto _ : state) {
    bare.push_back(timed([&] {
      run("/bin/ksh -c '. " + home + "/bin/dynarch.shl " + home + "/registry/archdsc.tbl >/dev/null 2>&1;echo x'");
      run(home + "/bin/qinfo -d");
      run(home + "/bin/qinfo -x");
    }));
    sampled.push_back(timed([&] { (void)request->sample(); }));
    state.SetIterationTime(sampled.back());
    if (takeAll(rows) != static_cast<size_t>(state.range(0))) return state.SkipWithError("rows are missing");
  }
  const double base = best(bare);
  const double whole = best(sampled);
  state.counters["commands_ms"] = base * 1e3;
  state.counters["sampled_ms"] = whole * 1e3;
  state.counters["ratio"] = whole / base;
  state.counters["us_per_line"] = (whole - base) * 1e6 / static_cast<double>(state.range(0));
}
BENCHMARK(InventoryAgainstItsCommands)
    ->ArgName("products")
    ->Arg(10)
    ->Arg(1000)
    ->Arg(10000)
    ->Arg(20000)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

void GetConfigAgainstTheTranslator(benchmark::State& state) {
  const Component& component = Component::get();
  component.products(2);
  const std::string translator = component.home() + "/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux";
  const std::string inventory = component.home() + "/bin/qinfo -d ";
  RowBuffer rows(10);
  const auto request = open(
      "KAGREQT", {{"COMMAND", INTF_EQ, "GETCONFIG"}, {"TRANSID", INTF_EQ, "t1"}, {"PRODUCT", INTF_EQ, "ux"}}, rows);
  std::vector<double> alone, all, asked;
  for (auto _ : state) {
    alone.push_back(timed([&] { run(translator); }));
    all.push_back(timed([&] {
      run(inventory);
      run(inventory);
      run(translator);
    }));
    asked.push_back(timed([&] { (void)request->sample(); }));
    state.SetIterationTime(asked.back());
    RowBuffer::Item answer = rows.take(std::chrono::milliseconds(0));
    if (answer.row.find("INSTANCE=inst1") == std::string::npos) return state.SkipWithError("not the expected answer");
  }
  const double whole = best(asked);
  state.counters["translator_us"] = best(alone) * 1e6;
  state.counters["commands_us"] = best(all) * 1e6;
  state.counters["getconfig_us"] = whole * 1e6;
  state.counters["ratio_translator"] = whole / best(alone);
  state.counters["ratio_commands"] = whole / best(all);
}
BENCHMARK(GetConfigAgainstTheTranslator)->UseManualTime()->MinTime(2.0)->Unit(benchmark::kMicrosecond);

/// The least that carries items from one thread to another.
template <class Item>
class BareQueue {
 public:
  void put(const Item& item) {
    const std::lock_guard<std::mutex> hold(mutex_);
    items_.push_back(item);
    filled_.notify_one();
  }
  Item take() {
    std::unique_lock<std::mutex> hold(mutex_);
    filled_.wait(hold, [this] { return !items_.empty(); });
    Item item = items_.front();
    items_.pop_front();
    return item;
  }

 private:
  std::mutex mutex_;
  std::condition_variable filled_;
  std::deque<Item> items_;
};

/// So many rows of a request to another thread, a row of an event back for each.
void carryThroughBareQueues(int64_t count) {
  BareQueue<vmq_kagreqt_data_t> there;
  BareQueue<vmq_kagdyst_data_t> back;
  std::thread executor([&] {
    for (int64_t i = 0; i < count; ++i) {
      const vmq_kagreqt_data_t request = there.take();
      vmq_kagdyst_data_t event{};
      std::copy_n(request.transid, sizeof event.transid, event.transid);
      back.put(event);
    }
  });
  for (int64_t i = 0; i < count; ++i) there.put(vmq_kagreqt_data_t{});
  for (int64_t i = 0; i < count; ++i) benchmark::DoNotOptimize(back.take());
  executor.join();
}

void RequestsThatDoNothing(benchmark::State& state) {
  (void)Component::get();
  const TEST_RecordedSleeps sleeps;
  const int64_t count = state.range(0);
  RowBuffer answers(10), events(static_cast<unsigned>(count));
  const auto watch = open("KAGDYST", {}, events);
  // For the data agent, with neither a model nor scripts: accepted, queued, and nothing to do.
  const auto request = open(
      "KAGREQT", {{"COMMAND", INTF_EQ, "SETCONFIG"}, {"TRANSID", INTF_EQ, "t1"}, {"PRODUCT", INTF_EQ, "um"}}, answers);
  std::vector<double> bare, queued;
  for (auto _ : state) {
    bare.push_back(timed([&] { carryThroughBareQueues(count); }));
    bool lost = false;
    queued.push_back(timed([&] {
      for (int64_t i = 0; i < count; ++i) {
        (void)request->sample();
        (void)answers.take(std::chrono::milliseconds(0));
      }
      for (int64_t i = 0; i < count; ++i) lost |= events.take(std::chrono::seconds(10)).kind != RowBuffer::Item::kRow;
    }));
    state.SetIterationTime(queued.back());
    if (lost) return state.SkipWithError("events are missing");
  }
  const double whole = best(queued);
  state.counters["us_per_request"] = whole * 1e6 / static_cast<double>(count);
  state.counters["us_per_payload"] = best(bare) * 1e6 / static_cast<double>(count);
  state.counters["ratio"] = whole / best(bare);
}
BENCHMARK(RequestsThatDoNothing)
    ->ArgName("requests")
    ->Arg(100)
    ->Arg(1000)
    ->Arg(10000)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

}  // namespace
