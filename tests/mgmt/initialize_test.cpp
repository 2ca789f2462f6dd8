#include "mgmt/initialize.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "bss1.h"
#include "mgmt/kagdyst.h"
#include "mgmt/kagreqt.h"
#include "mgmt/kinagt.h"
#include "table_client.h"
#include "test_seam.h"
#include "tests/mgmt/fresh_process.h"
#include "tests/mgmt/running_component.h"
#include "tests/support/failing_allocation.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"
#include "tests/tasks/rows.h"
#include "util/corvel_home.h"
#include "util/string.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::StrEq;

std::vector<std::string> tableNames() {
  std::vector<std::string> names;
  for (const auto& table : vmqhost::listTables()) names.push_back(table.application + "." + table.table);
  return names;
}

/// The entry point's own detail lines.
std::vector<std::string> steps(const TEST_TraceCapture& trace) {
  std::vector<std::string> texts;
  for (const auto& line : trace.lines()) {
    if (line.level == RAS1_DETAIL && line.unit == "mgmt/initialize") texts.push_back(line.text);
  }
  return texts;
}

constexpr const char* kAllSteps[] = {"Calling VMQ Table initialization", "Calling VMQ Task Manager initialization",
                                     "Calling VMQ RPC calls initialization",
                                     "Done calling VMQ initialization routines"};

void startWithoutHome() {
  unsetenv("CORVELHOME");
  TEST_TraceCapture trace;
  const unsigned threads = ProcessResources::now().threads;
  EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
  EXPECT_EQ(VMQ_CORVELHOME, nullptr);
  EXPECT_THAT(trace.texts(RAS1_ERROR), ElementsAre("No value for CORVELHOME - MANAGEMENT FUNCTIONS DISABLED"));
  EXPECT_THAT(steps(trace), IsEmpty());
  EXPECT_THAT(tableNames(), IsEmpty());
  EXPECT_EQ(ProcessResources::now().threads, threads);
  EXPECT_EQ(vmq_kagreqt_static_manager, nullptr);
  EXPECT_EQ(vmq_kinagt_static_manager, nullptr);
  EXPECT_EQ(vmq_kagdyst_static_manager, nullptr);
}

TEST(EntryPoint, WithoutAHomeDoesNothing) {
  IN_FRESH_PROCESS(startWithoutHome());
}

void startWithEmptyHome() {
  BSS1_PutEnv("CORVELHOME=");
  TEST_TraceCapture trace;
  EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
  EXPECT_THAT(VMQ_CORVELHOME, StrEq(""));
  EXPECT_THAT(tableNames(), ElementsAre("VMQ.KAGREQT", "VMQ.KINAGT", "VMQ.KAGDYST"));
  EXPECT_THAT(steps(trace), testing::ElementsAreArray(kAllSteps));
}

TEST(EntryPoint, WithAnEmptyHomeIsActive) {
  IN_FRESH_PROCESS(startWithEmptyHome());
}

void startWithHome() {
  const InstallationHome home;
  TEST_TraceCapture trace;
  const unsigned threads = ProcessResources::now().threads;
  EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
  EXPECT_EQ(VMQ_CORVELHOME, home.path());
  EXPECT_THAT(tableNames(), ElementsAre("VMQ.KAGREQT", "VMQ.KINAGT", "VMQ.KAGDYST"));
  EXPECT_THAT(steps(trace), testing::ElementsAreArray(kAllSteps));
  EXPECT_GT(ProcessResources::now().threads, threads);  // the executor, and perhaps a sanitizer's own
}

TEST(EntryPoint, RegistersTheTablesInOrderAndStartsTheExecutor) {
  IN_FRESH_PROCESS(startWithHome());
}

void startWithFailingRegistration() {
  const InstallationHome home;
  const TEST_FailCall failing("RegisterWithManager", 2, 17);
  TEST_TraceCapture trace;
  EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
  EXPECT_TRUE(failing.happened());
  EXPECT_THAT(tableNames(), ElementsAre("VMQ.KAGREQT", "VMQ.KAGDYST"));
  EXPECT_THAT(steps(trace), testing::ElementsAreArray(kAllSteps));
}

TEST(EntryPoint, GoesOnAfterAFailedRegistration) {
  IN_FRESH_PROCESS(startWithFailingRegistration());
}

void startWithAStepThatThrows() {
  const InstallationHome home;
  const TemporaryDirectory directory;
  const std::string log = directory / "trace.log";
  BSS1_PutEnv("KBB_RAS1=error,mgmt/initialize=all");
  BSS1_PutEnv(("KBB_RAS1_LOG=" + log).c_str());
  char error[200];
  ASSERT_TRUE(RAS1_Configure(error, sizeof error)) << error;
  const unsigned threads = ProcessResources::now().threads;
  {
    // Kept in memory, trace lines would take the failure that is meant for the list of commands.
    const FailingAllocation failing(16 * sizeof(VMQ::String));
    EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_THAT(readWholeFile(log),
              testing::AllOf(testing::HasSubstr("Exception while initializing the task manager: std::bad_alloc"),
                             testing::HasSubstr("Done calling VMQ initialization routines")));
  EXPECT_THAT(tableNames(), ElementsAre("VMQ.KAGREQT", "VMQ.KINAGT", "VMQ.KAGDYST"));
  EXPECT_EQ(ProcessResources::now().threads, threads);
}

TEST(EntryPoint, GoesOnAfterAStepThatThrows) {
  IN_FRESH_PROCESS(startWithAStepThatThrows());
}

void startWithoutMemoryForAManager() {
  {
    const FailingAllocation failing(sizeof(vmq_kagreqt_manager));
    EXPECT_EQ(vmq_kagreqt_init(), 0x21060002u);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(vmq_kagreqt_static_manager, nullptr);
  {
    const FailingAllocation failing(sizeof(vmq_kinagt_manager));
    EXPECT_EQ(vmq_kinagt_init(), 0x21060002u);
  }
  {
    const FailingAllocation failing(sizeof(vmq_kagdyst_manager));
    EXPECT_EQ(vmq_kagdyst_init(), 0x21060002u);
  }
  EXPECT_THAT(tableNames(), IsEmpty());
}

TEST(Registration, WithoutMemoryForTheManagerHasAStatusOfItsOwn) {
  IN_FRESH_PROCESS(startWithoutMemoryForAManager());
}

void sendEventToUnregisteredTables() {
  vmq_kagreqt_data_t request{};
  vmq_kinagt_data_t product{};
  vmq_kagdyst_data_t status{};
  EXPECT_EQ(vmq_kagreqt_manager::EventArrived(&request, 1), 0u);
  EXPECT_EQ(vmq_kinagt_manager::EventArrived(&product, 1), 0u);
  EXPECT_EQ(vmq_kagdyst_manager::EventArrived(&status, 1), 0u);
}

TEST(Registration, EventsBeforeItAreDropped) {
  IN_FRESH_PROCESS(sendEventToUnregisteredTables());
}

void startWithoutDepot() {
  const InstallationHome home;
  BSS1_PutEnv("QORDEPLOY_AGENTDEPOT=/proc/no/depot/here");
  vmqhost::setOriginNode(kNode);
  TEST_TraceCapture trace;
  const unsigned threads = ProcessResources::now().threads;
  EXPECT_EQ(Initialize_Mgmt_Functions(), 0u);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "VMQ1010E No Agent Depot directory set"));
  EXPECT_THAT(steps(trace), testing::ElementsAreArray(kAllSteps));
  EXPECT_EQ(ProcessResources::now().threads, threads);
  const AnswerRow refused{.originnode = kNode,
                          .transid = "t1",
                          .command = "START",
                          .product = "ux",
                          .retval = 1006,
                          .retmsgid = "VMQ1006E",
                          .retmsgparm = "START"};
  EXPECT_THAT(ask({equal("COMMAND", "START"), equal("TRANSID", "t1"), equal("PRODUCT", "ux")}),
              ElementsAre(refused.bytes()));
}

TEST(EntryPoint, WithoutADepotIsActiveAndRefusesEveryRequest) {
  IN_FRESH_PROCESS(startWithoutDepot());
}

}  // namespace
