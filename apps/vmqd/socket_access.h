#pragma once
// Lets further users connect to a socket that only its owner may use.

#include <sys/types.h>

#include <string>
#include <vector>

namespace vmqd {

/// Gives the users read and write access to a file of mode 0600, and nobody else: an access control list, since mode
/// bits can only name everybody. `ls` shows the mode as 0660 then, although the group has no access. Returns 0, or an
/// errno value (EOPNOTSUPP: the file system keeps no lists).
int admitUsers(const std::string& path, std::vector<uid_t> users);

}  // namespace vmqd
