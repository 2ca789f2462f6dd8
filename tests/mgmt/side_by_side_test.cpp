// Everything that a host does with the component at the same time: its own threads ask for configurations and the
// inventory, push files and change the environment, while the executor starts and stops agents.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "bss1.h"
#include "rpc/binary_data_transfer.h"
#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/temporary_directory.h"
#include "tests/tasks/rows.h"
#include "util/util.h"

namespace {

using testing::ElementsAre;
using testing::SizeIs;

constexpr int kTimes = 10;

constexpr char kInventory[] = R"(echo '"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"')";

class SideBySide : public testing::Test {
 protected:
  SideBySide() : home_(runningComponent()) {
    home_.tool("bin/qinfo", kInventory);
    home_.tool("zlpqor6/lx8266/bin/vmq_xa", "case $1 in -i) echo inst1 ;; *) echo \"INSTANCE=$2\" ;; esac");
    home_.file("bin/dynarch.shl", "os=Linux; cArch=lx8266\n");
    home_.file("tmp/.keep", "");
    home_.controlScript("exit 0");
    home_.runAsFile(InstallationHome::runAs("lz", "other", "nobody"));
  }

  /// Runs the work on a thread of its own, kTimes.
  void beside(const std::function<void(int time)>& work) {
    threads_.emplace_back([work] {
      for (int time = 0; time < kTimes; ++time) work(time);
    });
  }
  void join() {
    for (std::thread& thread : threads_) thread.join();
    threads_.clear();
  }

  // ---- what host threads do

  static void askForConfiguration(const std::string& name) {
    const AnswerRow answer{.originnode = kNode,
                           .transid = "g",
                           .command = "GETCONFIG",
                           .product = "ux",
                           .context = "INSTANCE=" + name + "\n",
                           .targetmsn = name};
    EXPECT_THAT(
        ask({equal("COMMAND", "GETCONFIG"), equal("TRANSID", "g"), equal("PRODUCT", "ux"), equal("TARGETMSN", name)}),
        ElementsAre(answer.bytes()));
  }
  static void listInventory() {
    vmqhost::RowBuffer rows(1000);
    const auto request = vmqhost::OpenRequest::open(query("KINAGT"), rows);
    ASSERT_NE(request, nullptr);
    EXPECT_EQ(request->sample(), 0u);
    int count = 0;
    while (rows.take(std::chrono::milliseconds(0)).kind == vmqhost::RowBuffer::Item::kRow) ++count;
    EXPECT_EQ(count, 4) << "two products, each from two listings";
  }
  static void queue(const std::string& command, const std::string& name) {
    EXPECT_THAT(ask({equal("COMMAND", command), equal("TRANSID", name), equal("PRODUCT", "ux"),
                     equal("TARGETMSN", "inst1:node7:UX")}),
                SizeIs(1));
  }
  static void push(const std::string& name, const std::string& text) {
    std::string field = name;
    field.resize(255);
    DataBlock block{};
    block.length = static_cast<int32_t>(text.size());
    std::copy(text.begin(), text.end(), block.data);
    uint32_t status = 999;
    BinaryDataTransfer(nullptr, "", field.c_str(), 0, /*chunkNumber=*/1, /*lastBlockIndex=*/0, &block, &status);
    EXPECT_EQ(status, 0u);
  }
  static void runProgram(int number) {
    int code = 0;
    VMQ::String out, err;
    EXPECT_TRUE(VMQ::Util::runCommand(VMQ::String(("/bin/echo " + std::to_string(number)).c_str()), code, out, err,
                                      VMQ::String(), false));
    EXPECT_EQ(out.toNarrow(), std::to_string(number) + "\n");
  }

  InstallationHome& home_;
  TEST_RecordedSleeps sleeps_;
  std::vector<std::thread> threads_;
};

TEST_F(SideBySide, EverythingGetsItsOwnResult) {
  const NothingLeftBehind nothing;
  StatusEvents events;
  // Three threads queue; what each has queued is carried out in its order.
  for (const char* const command : {"START", "STOP", "RESTART"}) {
    beside([command](int time) { queue(command, command + std::to_string(time)); });
  }
  for (int thread = 0; thread < 2; ++thread) {
    beside([thread](int time) { askForConfiguration("m" + std::to_string(thread) + std::to_string(time)); });
    beside([](int) { listInventory(); });
    beside([thread](int time) { runProgram(100 * thread + time); });
    beside([thread](int time) {
      push("t" + std::to_string(thread) + "/install.sh", "line\r\n" + std::to_string(time) + "\r\n");
    });
  }
  beside([](int) { const StatusEvents comesAndGoes; });
  beside([](int time) { BSS1_PutEnv(("BXIRA_HOSTNAME=h" + std::to_string(time)).c_str()); });
  join();

  std::vector<std::string> seen;
  for (int event = 0; event < 3 * kTimes; ++event) seen.push_back(events.next());
  for (const char* const command : {"START", "STOP", "RESTART"}) {
    auto place = seen.begin();
    for (int time = 0; time < kTimes; ++time) {
      const StatusEvent event{.originnode = kNode,
                              .transid = command + std::to_string(time),
                              .command = command,
                              .targetmsn = "inst1:node7:UX"};
      place = std::find(place, seen.end(), event.bytes());
      ASSERT_NE(place, seen.end()) << event.transid;
    }
  }
  EXPECT_TRUE(events.none());
  EXPECT_THAT(home_.runs(), SizeIs(4 * kTimes)) << "a restart is two runs";
  for (int thread = 0; thread < 2; ++thread) {
    EXPECT_EQ(readWholeFile(home_.path() + "/depot/t" + std::to_string(thread) + "/install.sh"),
              "line\n" + std::to_string(kTimes - 1) + "\n");
  }
}

TEST_F(SideBySide, EverythingGetsItsOwnResultWithEveryLineTraced) {
  const TEST_TraceCapture trace;
  StatusEvents events;
  beside([](int time) { queue("START", "s" + std::to_string(time)); });
  beside([](int time) { askForConfiguration("m" + std::to_string(time)); });
  beside([](int) { listInventory(); });
  join();
  for (int time = 0; time < kTimes; ++time) EXPECT_FALSE(events.next().empty());
  EXPECT_THAT(trace.texts(RAS1_ERROR), testing::IsEmpty());
}

}  // namespace
