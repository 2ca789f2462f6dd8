#include "tests/process/fake_accounts.h"

#include <grp.h>
#include <pwd.h>

#include <cerrno>
#include <utility>

namespace {

struct Accounts {
  std::map<std::string, FakeAccounts::User> users;
  std::map<std::string, gid_t> groups;
  size_t entryBytes;  ///< what each entry needs of the caller's buffer
};
Accounts* accounts = nullptr;

}  // namespace

FakeAccounts::FakeAccounts(std::map<std::string, User> users, std::map<std::string, gid_t> groups, size_t entryBytes) {
  accounts = new Accounts{std::move(users), std::move(groups), entryBytes};
}

FakeAccounts::~FakeAccounts() {
  delete std::exchange(accounts, nullptr);
}

#pragma GCC visibility push(default)  // as in tests/support/system_faults.cpp
extern "C" {

int __real_getpwnam_r(const char* name, passwd* entry, char* buffer, size_t size, passwd** result);
int __wrap_getpwnam_r(const char* name, passwd* entry, char* buffer, size_t size, passwd** result) {
  if (accounts == nullptr) return __real_getpwnam_r(name, entry, buffer, size, result);
  *result = nullptr;
  const auto user = accounts->users.find(name);
  if (user == accounts->users.end()) return 0;
  if (size < accounts->entryBytes) return ERANGE;
  entry->pw_uid = user->second.uid;
  entry->pw_gid = user->second.gid;
  *result = entry;
  return 0;
}

int __real_getgrnam_r(const char* name, group* entry, char* buffer, size_t size, group** result);
int __wrap_getgrnam_r(const char* name, group* entry, char* buffer, size_t size, group** result) {
  if (accounts == nullptr) return __real_getgrnam_r(name, entry, buffer, size, result);
  *result = nullptr;
  const auto found = accounts->groups.find(name);
  if (found == accounts->groups.end()) return 0;
  if (size < accounts->entryBytes) return ERANGE;
  entry->gr_gid = found->second;
  *result = entry;
  return 0;
}

}  // extern "C"
#pragma GCC visibility pop
