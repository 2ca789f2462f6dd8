#pragma once
// What a file holds, as a digest.

#include <cstdint>
#include <optional>
#include <string>

namespace vmqd {

struct FileDigest {
  uint64_t size;       ///< bytes that were read
  std::string sha256;  ///< 64 hexadecimal digits, lower case
};

/// Reads the file in pieces. Nothing when there is no such regular file; throws std::runtime_error when it cannot be
/// read.
std::optional<FileDigest> digestOf(const std::string& path);

}  // namespace vmqd
