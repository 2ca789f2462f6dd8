// Digests of files as they arrive.

#include "apps/vmqctl/push/arrival_digest.h"

#include <algorithm>
#include <iterator>

namespace vmqctl {

bool isConverted(std::string_view destinationPath) {
  constexpr std::string_view parts[] = {"install.sh", "DeployLnk.sh", ".mdl"};
  return std::any_of(std::begin(parts), std::end(parts),
                     [&](std::string_view part) { return destinationPath.find(part) != std::string_view::npos; });
}

ArrivalDigest::ArrivalDigest(bool converted) : converted_(converted) {
  sha256_init(&state_);
}

void ArrivalDigest::add(std::string_view bytes) {
  constexpr std::string_view dropped = "\r\x1a";
  while (converted_) {
    const std::size_t at = bytes.find_first_of(dropped);
    if (at == std::string_view::npos) break;
    addArriving(bytes.substr(0, at));
    bytes.remove_prefix(at + 1);
  }
  addArriving(bytes);
}

void ArrivalDigest::addArriving(std::string_view bytes) {
  bytes_ += bytes.size();
  sha256_update(&state_, bytes.size(), reinterpret_cast<const std::uint8_t*>(bytes.data()));
}

std::string ArrivalDigest::sha256() {
  constexpr std::string_view digits = "0123456789abcdef";
  std::uint8_t digest[SHA256_DIGEST_SIZE];
  sha256_digest(&state_, sizeof digest, digest);
  std::string text;
  for (const std::uint8_t byte : digest) text += {digits[byte >> 4], digits[byte & 15]};
  return text;
}

}  // namespace vmqctl
