// Every other code page, through the C library's iconv.

#include <iconv.h>

#include <algorithm>

#include <bit>
#include <cerrno>
#include <cstring>
#include <mutex>
#include <new>

#include "nls2_ascii.h"
#include "nls2_converter.h"

namespace vmqhost {

namespace {

/// UTF-16 in this machine's byte order; the plain name would put a byte order mark in front.
constexpr const char* kUnits = std::endian::native == std::endian::little ? "UTF-16LE" : "UTF-16BE";

/// One direction of a conversion. For one thread at a time.
class Iconv {
 public:
  Iconv(const char* to, const char* from) : descriptor_(iconv_open(to, from)) {}
  ~Iconv() {
    if (valid()) (void)iconv_close(descriptor_);  // fails only for a bad descriptor
  }
  Iconv(const Iconv&) = delete;
  Iconv& operator=(const Iconv&) = delete;

  // NOLINTNEXTLINE(performance-no-int-to-ptr): that is what a failed iconv_open returns
  [[nodiscard]] bool valid() const { return descriptor_ != reinterpret_cast<iconv_t>(-1); }

  /// Converts from `In` to `Out` elements; an element that means nothing is replaced by `replace(element)`.
  template <class In, class Out, class Replace>
  Converted convert(const In* in, size_t count, Out* out, size_t capacity, Replace replace) {
    (void)iconv(descriptor_, nullptr, nullptr, nullptr, nullptr);       // back to the initial state
    auto* from = const_cast<char*>(reinterpret_cast<const char*>(in));  // iconv does not write there
    auto* to = reinterpret_cast<char*>(out);
    size_t from_left = count * sizeof(In);
    size_t to_left = capacity * sizeof(Out);
    const auto stored = [&] { return capacity - to_left / sizeof(Out); };
    while (iconv(descriptor_, &from, &from_left, &to, &to_left) == kFailed) {
      if (errno == E2BIG || to_left < sizeof(Out)) return {stored(), true};
      // EILSEQ, or EINVAL for a character that the end cuts off.
      In element;
      std::memcpy(&element, from, sizeof element);
      const Out replacement = replace(element);
      std::memcpy(to, &replacement, sizeof replacement);
      from += sizeof(In);
      from_left -= sizeof(In);
      to += sizeof(Out);
      to_left -= sizeof(Out);
    }
    // Some code pages hold a character back to see whether the next one combines with it.
    const bool cut = iconv(descriptor_, nullptr, nullptr, &to, &to_left) == kFailed;
    return {stored(), cut};
  }

 private:
  static constexpr auto kFailed = static_cast<size_t>(-1);
  const iconv_t descriptor_;
};

class IconvConverter final : public Converter {
 public:
  IconvConverter(const char* name, uint32_t maximum_bytes_per_unit)
      : decoder_(kUnits, name), encoder_(name, kUnits), maximum_bytes_per_unit_(maximum_bytes_per_unit) {
    // NOLINTNEXTLINE(cppcoreguidelines-prefer-member-initializer): asks an object that is whole
    ascii_is_ascii_ = valid() && asciiConvertsToItself();
  }

  [[nodiscard]] bool valid() const { return decoder_.valid() && encoder_.valid(); }

  Converted toUnits(const unsigned char* bytes, size_t count, Unit* units, size_t capacity) const override {
    const size_t run = ascii_is_ascii_ ? widenAscii(bytes, std::min(count, capacity), units) : 0;
    if (run == count || run == capacity) return {run, run < count};  // iconv takes no empty output
    const std::lock_guard held(mutex_);
    const Converted rest = decoder_.convert(bytes + run, count - run, units + run, capacity - run,
                                            [](unsigned char byte) { return static_cast<Unit>(byte); });
    return {run + rest.stored, rest.cut};
  }

  Converted fromUnits(const Unit* units, size_t count, unsigned char* bytes, size_t capacity) const override {
    const size_t run = ascii_is_ascii_ ? narrowAscii(units, std::min(count, capacity), bytes) : 0;
    if (run == count || run == capacity) return {run, run < count};  // iconv takes no empty output
    const std::lock_guard held(mutex_);
    const Converted rest = encoder_.convert(units + run, count - run, bytes + run, capacity - run, byteForUnit);
    return {run + rest.stored, rest.cut};
  }

  [[nodiscard]] uint32_t maximumBytesPerUnit() const override { return maximum_bytes_per_unit_; }

 private:
  [[nodiscard]] bool asciiConvertsToItself() const {
    constexpr size_t kCount = 128;
    unsigned char bytes[kCount];
    Unit units[kCount];
    Unit decoded[kCount];
    unsigned char encoded[kCount];
    for (size_t i = 0; i < kCount; ++i) {
      bytes[i] = static_cast<unsigned char>(i);
      units[i] = static_cast<Unit>(i);
    }
    return toUnits(bytes, kCount, decoded, kCount).stored == kCount &&
           fromUnits(units, kCount, encoded, kCount).stored == kCount &&
           std::memcmp(decoded, units, sizeof units) == 0 && std::memcmp(encoded, bytes, sizeof bytes) == 0;
  }

  // One pair for all threads: conversions are short, and text that is not ASCII is rare where this is used.
  mutable std::mutex mutex_;
  mutable Iconv decoder_;  // these two guarded by mutex_
  mutable Iconv encoder_;
  const uint32_t maximum_bytes_per_unit_;
  bool ascii_is_ascii_ = false;  // constant after construction
};

}  // namespace

std::unique_ptr<Converter> newIconvConverter(const char* name, uint32_t maximumBytesPerUnit) {
  auto converter = std::make_unique<IconvConverter>(name, maximumBytesPerUnit);
  if (!converter->valid()) return nullptr;
  return converter;
}

}  // namespace vmqhost
