// Calls on several threads at a time.

#include <gtest/gtest.h>

#include <barrier>
#include <thread>
#include <vector>

#include "tests/host/sample_interface.h"

namespace {

using vmqhost::RpcResult;

TEST(RpcThreads, CallsRunSideBySide) {
  constexpr int threads = 4;
  std::barrier<> together(threads);  // passed only when all of them are in the routine at a time
  static SampleRoutine manager;
  manager = [&together](const rpc__call& call) {
    together.arrive_and_wait();
    return replyWith(call.offered, bodyOf(*call.request));
  };
  static const rpc__if_spec interface = newSampleInterface();
  uint32_t status = 1;
  rpc__register_mgr(&rpc__nil_type, &interface, &manager, &status);
  ASSERT_EQ(status, 0u);
  std::vector<std::thread> callers;
  for (int thread = 0; thread < threads; ++thread) {
    callers.emplace_back([thread] {
      const std::string request = std::to_string(thread);
      for (int round = 0; round < 50; ++round)
        EXPECT_EQ(vmqhost::call({interface.id, 1, 0, {}, request}).reply, request);
    });
  }
  for (std::thread& caller : callers) caller.join();
}

TEST(RpcThreads, FaultsStayOnTheirThread) {
  static SampleRoutine manager = [](const rpc__call& call) -> rpc__reply {
    if (bodyOf(*call.request) == "raise") PFM1__Raise(7);
    return replyWith(call.offered, "fine");
  };
  static const rpc__if_spec interface = newSampleInterface();
  uint32_t status = 1;
  rpc__register_mgr(&rpc__nil_type, &interface, &manager, &status);
  ASSERT_EQ(status, 0u);
  const auto callMany = [](const std::string& request, RpcResult::Outcome expected) {
    for (int round = 0; round < 300; ++round) {
      ASSERT_EQ(vmqhost::call({interface.id, 1, 0, {}, request}).outcome, expected);
    }
  };
  std::thread raising(callMany, "raise", RpcResult::kFault);
  std::thread replying(callMany, "reply", RpcResult::kReplied);
  raising.join();
  replying.join();
}

TEST(RpcThreads, RegistrationsAndCallsMeet) {
  static SampleRoutine manager = [](const rpc__call& call) { return replyWith(call.offered, "fine"); };
  static std::vector<rpc__if_spec> interfaces;
  for (int count = 0; count < 40; ++count) interfaces.push_back(newSampleInterface());
  std::thread registering([] {
    for (const rpc__if_spec& each : interfaces) {
      uint32_t status = 1;
      rpc__register_mgr(&rpc__nil_type, &each, &manager, &status);
      EXPECT_EQ(status, 0u);
    }
  });
  while (vmqhost::call({interfaces.back().id}).outcome != RpcResult::kReplied) {
  }
  registering.join();
  for (const rpc__if_spec& each : interfaces) EXPECT_EQ(vmqhost::call({each.id}).reply, "fine");
}

}  // namespace
