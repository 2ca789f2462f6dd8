#include "process/user_token.h"

#include <grp.h>
#include <pwd.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <optional>
#include <vector>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/user_token"};

constexpr uint32_t kNoId = 0x7FFFFFFE;
constexpr char kNobody[] = "nobody";
constexpr size_t kLargestEntry = size_t{1} << 20;  // a group of many thousand members

/// Calls one of the getpwnam_r family with a buffer that grows until the entry fits, and picks from the entry found.
template <typename Entry, typename Lookup, typename Pick>
auto lookUp(Lookup lookup, const char* name, Pick pick) -> std::optional<decltype(pick(std::declval<Entry>()))> {
  Entry entry;
  Entry* found = nullptr;
  for (std::vector<char> buffer(1024); buffer.size() <= kLargestEntry; buffer.resize(buffer.size() * 2)) {
    const int rc = lookup(name, &entry, buffer.data(), buffer.size(), &found);
    if (rc == 0 && found != nullptr) return pick(entry);
    if (rc != ERANGE && rc != EINTR) break;
  }
  return std::nullopt;
}

std::optional<user_s_t> findUser(const char* name) {
  return lookUp<passwd>(getpwnam_r, name, [](const passwd& entry) { return user_s_t{entry.pw_uid, entry.pw_gid}; });
}

std::optional<uint32_t> findGroup(const char* name) {
  return lookUp<group>(getgrnam_r, name, [](const group& entry) { return uint32_t{entry.gr_gid}; });
}

const char* shown(const char* name) {
  return name != nullptr ? name : "(null)";
}

}  // namespace

user_s_t* create_user_token(const char* user, const char* group, const char* /*third*/) {
  const Trace trace(traceUnit);
  auto* const token = static_cast<user_s_t*>(malloc(sizeof(user_s_t)));
  if (token == nullptr) return nullptr;

  std::optional<user_s_t> account;
  if (user == nullptr) {
    token->uid = getuid();
  } else {
    account = findUser(user);
    if (!account) account = findUser(kNobody);
    token->uid = account ? account->uid : kNoId;
  }

  if (group == nullptr) {
    token->gid = getgid();
  } else if (const std::optional<uint32_t> gid = findGroup(group)) {
    token->gid = *gid;
  } else {
    token->gid = account && findGroup(kNobody) ? account->gid : kNoId;
  }

  TRACE_DETAIL(trace, "User: %s UID: %d Group: %s GID: %d", shown(user), static_cast<int>(token->uid), shown(group),
               static_cast<int>(token->gid));
  return token;
}

}  // namespace VMQ
