// The entries of the run-as database.
#include "util/agent_entry.h"

#include <gtest/gtest.h>

#include <memory>

using VMQ::AgentEntry;
using VMQ::InstanceEntry;
using VMQ::String;

namespace {

TEST(InstanceEntryTest, KeepsNameAndUser) {
  InstanceEntry instance(String("inst1"), String("dbuser"));
  EXPECT_EQ(instance.getInstanceName(), String("inst1"));
  EXPECT_EQ(instance.getUser(), String("dbuser"));
  instance.setUser(String(""));
  EXPECT_EQ(instance.getUser(), String(""));
}

TEST(InstanceEntryTest, CopyIsIndependent) {
  InstanceEntry original(String("inst1"), String("one"));
  const InstanceEntry copy(original);
  original.setUser(String("two"));
  EXPECT_EQ(copy.getInstanceName(), String("inst1"));
  EXPECT_EQ(copy.getUser(), String("one"));
}

class AgentEntryTest : public testing::Test {
 protected:
  InstanceEntry* add(const char* name, const char* user) {
    auto* const instance = new InstanceEntry(String(name), String(user));
    agent_.addInstance(instance);
    return instance;
  }

  AgentEntry agent_{String("um")};
};

TEST_F(AgentEntryTest, NewAgentHasNoInstances) {
  EXPECT_EQ(agent_.getProductCode(), String("um"));
  EXPECT_EQ(agent_.getNumInstances(), 0u);
  EXPECT_EQ(agent_.getInstance(0U), nullptr);
  EXPECT_EQ(agent_.getInstance(String("")), nullptr);
}

TEST_F(AgentEntryTest, InstancesKeepTheirOrder) {
  InstanceEntry* const first = add("a", "1");
  InstanceEntry* const second = add("b", "2");
  EXPECT_EQ(agent_.getNumInstances(), 2u);
  EXPECT_EQ(agent_.getInstance(0U), first);
  EXPECT_EQ(agent_.getInstance(1U), second);
  EXPECT_EQ(agent_.getInstance(2U), nullptr);
  EXPECT_EQ(agent_.getInstance(0xFFFFFFFFU), nullptr);
}

TEST_F(AgentEntryTest, LookupIsExactAndFindsTheFirst) {
  InstanceEntry* const first = add("a", "1");
  add("a", "2");
  InstanceEntry* const unnamed = add("", "3");
  EXPECT_EQ(agent_.getInstance(String("a")), first);
  EXPECT_EQ(agent_.getInstance(String("")), unnamed);
  EXPECT_EQ(agent_.getInstance(String("A")), nullptr);
}

TEST_F(AgentEntryTest, RemovedInstanceKeepsItsSlot) {
  add("a", "1");
  InstanceEntry* const second = add("b", "2");
  agent_.removeInstance(0);
  EXPECT_EQ(agent_.getNumInstances(), 2u);
  EXPECT_EQ(agent_.getInstance(0U), nullptr);
  EXPECT_EQ(agent_.getInstance(1U), second);
  EXPECT_EQ(agent_.getInstance(String("a")), nullptr);
  EXPECT_EQ(agent_.getInstance(String("b")), second);
  agent_.removeInstance(0);
  EXPECT_EQ(agent_.getNumInstances(), 2u);
}

TEST_F(AgentEntryTest, RemovalBeyondTheCountDoesNothing) {
  add("a", "1");
  agent_.removeInstance(1);
  agent_.removeInstance(0xFFFFFFFF);
  EXPECT_EQ(agent_.getNumInstances(), 1u);
  EXPECT_NE(agent_.getInstance(0U), nullptr);
}

TEST_F(AgentEntryTest, CopyIsDeepAndKeepsSlots) {
  auto original = std::make_unique<AgentEntry>(String("ux"));
  original->addInstance(new InstanceEntry(String("a"), String("1")));
  original->addInstance(new InstanceEntry(String("b"), String("2")));
  original->removeInstance(0);
  const AgentEntry copy(*original);
  EXPECT_NE(copy.getInstance(1U), original->getInstance(1U));
  original.reset();
  EXPECT_EQ(copy.getProductCode(), String("ux"));
  EXPECT_EQ(copy.getNumInstances(), 2u);
  EXPECT_EQ(copy.getInstance(0U), nullptr);
  EXPECT_EQ(copy.getInstance(1U)->getUser(), String("2"));
}

}  // namespace
