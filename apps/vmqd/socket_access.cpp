// Lets further users connect to a socket that only its owner may use.

#include "apps/vmqd/socket_access.h"

#include <sys/xattr.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>

namespace vmqd {
namespace {

// The form in which the kernel takes an access control list.
enum Tag : uint16_t { ownerTag = 0x01, userTag = 0x02, groupTag = 0x04, maskTag = 0x10, othersTag = 0x20 };
constexpr uint16_t nothing = 0;
constexpr uint16_t readAndWrite = 6;
constexpr uint32_t noId = 0xFFFFFFFF;

class List {
 public:
  List() { append32(2); }  // the version

  void add(Tag tag, uint16_t permissions, uint32_t id) {
    append16(tag);
    append16(permissions);
    append32(id);
  }
  [[nodiscard]] const std::vector<unsigned char>& bytes() const { return bytes_; }

 private:
  void append16(uint16_t value) {
    bytes_.push_back(static_cast<unsigned char>(value & 0xFF));
    bytes_.push_back(static_cast<unsigned char>(value >> 8));
  }
  void append32(uint32_t value) {
    append16(static_cast<uint16_t>(value & 0xFFFF));
    append16(static_cast<uint16_t>(value >> 16));
  }
  std::vector<unsigned char> bytes_;
};

}  // namespace

int admitUsers(const std::string& path, std::vector<uid_t> users) {
  // Each user once.
  std::sort(users.begin(), users.end());
  users.erase(std::unique(users.begin(), users.end()), users.end());
  List list;
  list.add(ownerTag, readAndWrite, noId);
  for (const uid_t user : users) list.add(userTag, readAndWrite, user);
  list.add(groupTag, nothing, noId);
  list.add(maskTag, readAndWrite, noId);
  list.add(othersTag, nothing, noId);
  const auto& bytes = list.bytes();
  return lsetxattr(path.c_str(), "system.posix_acl_access", bytes.data(), bytes.size(), 0) == 0 ? 0 : errno;
}

}  // namespace vmqd
