#pragma once
// User and group names of a test's own, in place of the machine's.

#include <sys/types.h>

#include <map>
#include <string>

/// While it lives, the component finds these names and no others. One at a time.
class FakeAccounts {
 public:
  struct User {
    uid_t uid;
    gid_t gid;
  };
  FakeAccounts(std::map<std::string, User> users, std::map<std::string, gid_t> groups, size_t entryBytes = 100);
  ~FakeAccounts();
  FakeAccounts(const FakeAccounts&) = delete;
  FakeAccounts& operator=(const FakeAccounts&) = delete;
};
