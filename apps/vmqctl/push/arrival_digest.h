#pragma once
// What a file will be on the machine that it is sent to.

#include <nettle/sha2.h>

#include <cstdint>
#include <string>
#include <string_view>

namespace vmqctl {

/// The machine drops every carriage return and every control-Z of files with such paths (as a whole, with the depot).
bool isConverted(std::string_view destinationPath);

/// Collects size and SHA-256 of a file as it arrives, while it is sent. One thread.
class ArrivalDigest {
 public:
  explicit ArrivalDigest(bool converted);

  /// The bytes that come next, as they are sent.
  void add(std::string_view bytes);

  [[nodiscard]] std::uint64_t bytes() const { return bytes_; }
  /// 64 hexadecimal digits. Nothing can be added after it.
  [[nodiscard]] std::string sha256();

 private:
  void addArriving(std::string_view bytes);

  const bool converted_;
  std::uint64_t bytes_ = 0;
  sha256_ctx state_;
};

}  // namespace vmqctl
