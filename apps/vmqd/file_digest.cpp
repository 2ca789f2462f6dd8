// What a file holds, as a digest.

#include "apps/vmqd/file_digest.h"

#include <fcntl.h>
#include <nettle/base16.h>
#include <nettle/sha2.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <stdexcept>

#include "apps/vmqd/descriptor.h"
#include "apps/vmqd/log.h"

namespace vmqd {
namespace {

bool meansMissing(int error) {
  return error == ENOENT || error == ENOTDIR || error == ENAMETOOLONG || error == ELOOP || error == ENXIO;
}

std::string hexDigits(sha256_ctx& state) {
  std::array<uint8_t, SHA256_DIGEST_SIZE> digest;
  sha256_digest(&state, digest.size(), digest.data());
  std::string digits(BASE16_ENCODE_LENGTH(SHA256_DIGEST_SIZE), '\0');
  base16_encode_update(digits.data(), digest.size(), digest.data());
  return digits;
}

}  // namespace

std::optional<FileDigest> digestOf(const std::string& path) {
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));  // a FIFO must not hold it up
  if (!file && meansMissing(errno)) return std::nullopt;
  struct stat status;
  if (!file || fstat(file.get(), &status) != 0) throw std::runtime_error(withReason(path, errno));
  if (!S_ISREG(status.st_mode)) return std::nullopt;
  sha256_ctx state;
  sha256_init(&state);
  uint64_t size = 0;
  std::array<uint8_t, 65536> piece;
  while (true) {
    const ssize_t count = read(file.get(), piece.data(), piece.size());
    if (count == 0) return FileDigest{size, hexDigits(state)};
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) throw std::runtime_error(withReason(path, errno));
    sha256_update(&state, static_cast<size_t>(count), piece.data());
    size += static_cast<uint64_t>(count);
  }
}

}  // namespace vmqd
