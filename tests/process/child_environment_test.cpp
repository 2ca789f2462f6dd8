#include "process/child_environment.h"

#include <gmock/gmock.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/support/scoped_variable.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::StartsWith;
using VMQ::ChildEnvironment;

std::vector<std::string> entriesOf(char* const* list) {
  std::vector<std::string> entries;
  for (; *list != nullptr; ++list) entries.emplace_back(*list);
  return entries;
}

class ChildEnvironmentTest : public testing::Test {
 protected:
  std::vector<std::string> childEntries() { return entriesOf(environment.entries()); }

  const ScopedVariable variable{"VMQ_TEST", "host"};
  const std::vector<std::string> host = entriesOf(environ);
  ChildEnvironment environment;
};

TEST_F(ChildEnvironmentTest, BeginsAsACopyOfTheHosts) {
  EXPECT_EQ(childEntries(), host);
}

TEST_F(ChildEnvironmentTest, EntryReplacesTheVariableOfItsName) {
  environment.put("VMQ_TEST=child=1");
  EXPECT_THAT(childEntries(), Contains("VMQ_TEST=child=1"));
  EXPECT_THAT(childEntries(), Not(Contains("VMQ_TEST=host")));
  EXPECT_STREQ(environment.get("VMQ_TEST"), "child=1");
  EXPECT_EQ(childEntries().size(), host.size());
}

TEST_F(ChildEnvironmentTest, EntryOfANewNameIsAdded) {
  environment.put("VMQ_TEST_2=x");
  environment.put("VMQ_TES=y");  // the beginning of another name
  EXPECT_EQ(childEntries().size(), host.size() + 2);
  EXPECT_STREQ(environment.get("VMQ_TEST"), "host");
  EXPECT_STREQ(environment.get("VMQ_TEST_2"), "x");
  EXPECT_STREQ(environment.get("VMQ_TES"), "y");
}

TEST_F(ChildEnvironmentTest, EntryWithoutAnEqualsSignRemovesTheVariable) {
  environment.put("VMQ_TEST");
  EXPECT_THAT(childEntries(), Not(Contains(StartsWith("VMQ_TEST="))));
  EXPECT_EQ(environment.get("VMQ_TEST"), nullptr);
  environment.put("VMQ_NEVER_SET");
  EXPECT_EQ(childEntries().size(), host.size() - 1);
}

TEST_F(ChildEnvironmentTest, EmptyValueIsSet) {
  environment.put("VMQ_TEST=");
  EXPECT_STREQ(environment.get("VMQ_TEST"), "");
}

TEST_F(ChildEnvironmentTest, ListIsAppliedInOrder) {
  const char* const list[] = {"VMQ_TEST=1", "VMQ_TEST=2", "VMQ_OTHER=3", nullptr};
  VMQ::setEnv(environment, list);
  EXPECT_STREQ(environment.get("VMQ_TEST"), "2");
  EXPECT_STREQ(environment.get("VMQ_OTHER"), "3");
}

TEST_F(ChildEnvironmentTest, NullListChangesNothing) {
  VMQ::setEnv(environment, nullptr);
  EXPECT_EQ(childEntries(), host);
}

TEST_F(ChildEnvironmentTest, HostsOwnEnvironmentIsNeverChanged) {
  environment.put("VMQ_TEST=child");
  environment.put("VMQ_TEST_2=x");
  environment.put("PATH");
  EXPECT_EQ(entriesOf(environ), host);
}

TEST_F(ChildEnvironmentTest, IsCopiedEvenWhenTheLockCannotBeHad) {
  const TEST_FailCall failure("BSS1_GetLock", 1, 35);
  ChildEnvironment other;
  EXPECT_TRUE(failure.happened());
  EXPECT_EQ(entriesOf(other.entries()), host);
}

TEST(ChildEnvironmentOfNothing, IsEmpty) {
  char** const before = environ;
  environ = nullptr;  // what clearenv leaves
  ChildEnvironment environment;
  environ = before;
  environment.put("A=1");
  EXPECT_THAT(entriesOf(environment.entries()), ElementsAre("A=1"));
}

}  // namespace
