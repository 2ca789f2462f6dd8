#pragma once
// Who a child is to be run as.

#include <cstdint>

namespace VMQ {

struct user_s_t {
  uint32_t uid;
  uint32_t gid;
};

/// The ids of a user and a group by name; null means this process's own. Returns a new record, which the caller frees
/// with free(), or null without memory. `third` is not used. For any thread.
///
/// Unknown names fall back, and not alike; both are kept on purpose:
/// - an unknown user is "nobody", and 2147483646 where there is no such user either;
/// - an unknown group, where a group "nobody" exists, is the primary group of the user found above (not that group),
/// and
///   2147483646 when no user was looked up or found, or where there is no group "nobody".
user_s_t* create_user_token(const char* user, const char* group, const char* third);

}  // namespace VMQ
