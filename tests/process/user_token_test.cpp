#include "process/user_token.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <map>
#include <memory>
#include <string>

#include "test_seam.h"
#include "tests/process/fake_accounts.h"

namespace {

using Users = std::map<std::string, FakeAccounts::User>;
using Groups = std::map<std::string, gid_t>;
constexpr uint32_t kNoId = 2147483646;

VMQ::user_s_t tokenOf(const char* user, const char* group) {
  const std::unique_ptr<VMQ::user_s_t, decltype(&free)> token(VMQ::create_user_token(user, group, nullptr), &free);
  return *token;
}

TEST(CreateUserToken, OfNothingIsThisProcess) {
  const TEST_TraceCapture traces;
  const VMQ::user_s_t token = tokenOf(nullptr, nullptr);
  EXPECT_EQ(token.uid, getuid());
  EXPECT_EQ(token.gid, getgid());
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "User: (null) UID: " + std::to_string(getuid()) +
                                          " Group: (null) GID: " + std::to_string(getgid())));
}

TEST(CreateUserToken, FindsTheMachinesOwnNames) {
  const VMQ::user_s_t token = tokenOf("root", "root");
  EXPECT_EQ(token.uid, 0u);
  EXPECT_EQ(token.gid, 0u);
}

struct Case {
  const char* situation;
  Users users;
  Groups groups;
  const char* user;
  const char* group;
  uint32_t uid, gid;
};

TEST(CreateUserToken, FallsBackUnlikeForUsersAndGroups) {
  const Users ann = {{"ann", {1000, 1001}}};
  const Users annAndNobody = {{"ann", {1000, 1001}}, {"nobody", {65534, 65533}}};
  const Groups staff = {{"staff", 50}};
  const Groups staffAndNobody = {{"staff", 50}, {"nobody", 99}};
  const Case cases[] = {
      {"both known", ann, staff, "ann", "staff", 1000, 50},
      {"unknown user", annAndNobody, staff, "bob", "staff", 65534, 50},
      {"unknown user, no nobody", ann, staff, "bob", "staff", kNoId, 50},
      {"unknown group, a group nobody: the user's own group", ann, staffAndNobody, "ann", "x", 1000, 1001},
      {"unknown group, no group nobody", ann, staff, "ann", "x", 1000, kNoId},
      {"both unknown: nobody's own group", annAndNobody, staffAndNobody, "bob", "x", 65534, 65533},
      {"both unknown, no user nobody", ann, staffAndNobody, "bob", "x", kNoId, kNoId},
      {"no user asked for, unknown group", annAndNobody, staffAndNobody, nullptr, "x", getuid(), kNoId},
  };
  for (const Case& c : cases) {
    const FakeAccounts accounts(c.users, c.groups);
    const TEST_TraceCapture traces;
    const VMQ::user_s_t token = tokenOf(c.user, c.group);
    EXPECT_EQ(token.uid, c.uid) << c.situation;
    EXPECT_EQ(token.gid, c.gid) << c.situation;
    EXPECT_TRUE(traces.has(RAS1_DETAIL, std::string("User: ") + (c.user != nullptr ? c.user : "(null)") +
                                            " UID: " + std::to_string(c.uid) + " Group: " + c.group +
                                            " GID: " + std::to_string(c.gid)))
        << c.situation;
  }
}

TEST(CreateUserToken, LargeEntriesAreFound) {
  const FakeAccounts accounts({{"ann", {1000, 1001}}}, {{"staff", 50}}, /*entryBytes=*/100'000);
  const VMQ::user_s_t token = tokenOf("ann", "staff");
  EXPECT_EQ(token.uid, 1000u);
  EXPECT_EQ(token.gid, 50u);
}

TEST(CreateUserToken, EntryTooLargeToBelieveIsNoEntry) {
  const FakeAccounts accounts({{"ann", {1000, 1001}}}, {}, /*entryBytes=*/100'000'000);
  EXPECT_EQ(tokenOf("ann", nullptr).uid, kNoId);
}

}  // namespace
