#include "rpc/request_reader.h"

#include <algorithm>
#include <cstring>

namespace VMQ {
namespace {

char toAscii(unsigned char c) {
  return static_cast<char>(rpc__marshalling.ascii_from_ebcdic[c]);
}

}  // namespace

RequestReader::RequestReader(const rpc__packet& packet, const rpc__drep& sender)
    : body_(packet.body),
      size_(packet.body_bytes),
      swap_(sender.integers != rpc__marshalling.local.integers),
      translate_(sender.characters != rpc__marshalling.local.characters) {}

void RequestReader::align(size_t bytes) {
  (void)take((bytes - position_ % bytes) % bytes);
}

void RequestReader::takeText(char* text, size_t length) {
  const unsigned char* const from = take(length);
  if (translate_) {
    std::transform(from, from + length, text, toAscii);
  } else {
    std::memcpy(text, from, length);
  }
}

int32_t RequestReader::takeInt32() {
  uint32_t value;
  std::memcpy(&value, take(sizeof value), sizeof value);
  return static_cast<int32_t>(swap_ ? rpc__swap_32(value) : value);
}

uint16_t RequestReader::takeUint16() {
  uint16_t value;
  std::memcpy(&value, take(sizeof value), sizeof value);
  return swap_ ? rpc__swap_16(value) : value;
}

const unsigned char* RequestReader::take(size_t bytes) {
  if (bytes > remaining()) PFM1__Raise(rpc__fault_invalid_bound);
  const unsigned char* const taken = body_ + position_;
  position_ += bytes;
  return taken;
}

}  // namespace VMQ
