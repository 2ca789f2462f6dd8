#pragma once
// The fast path of every code page: runs of ASCII. Sixteen characters at a time where the machine can, else eight, else
// one. Inline, because most texts are short.

#include <cstddef>
#include <cstdint>
#include <cstring>

#ifdef __SSE2__
#include <emmintrin.h>
#endif

namespace vmqhost {

/// A UTF-16 code unit, of the type that the interface has: char16_t would be another type to the compiler.
using Unit = unsigned short;

namespace ascii {

#ifdef __SSE2__

inline constexpr size_t kStep = 16;

inline bool widenStep(const unsigned char* bytes, Unit* units) {
  const __m128i zero = _mm_setzero_si128();
  const __m128i chunk = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes));
  if (_mm_movemask_epi8(chunk) != 0) return false;
  _mm_storeu_si128(reinterpret_cast<__m128i*>(units), _mm_unpacklo_epi8(chunk, zero));
  _mm_storeu_si128(reinterpret_cast<__m128i*>(units + 8), _mm_unpackhi_epi8(chunk, zero));
  return true;
}

inline bool narrowStep(const Unit* units, unsigned char* bytes) {
  const __m128i low = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units));
  const __m128i high = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units + 8));
  const __m128i beyond = _mm_and_si128(_mm_or_si128(low, high), _mm_set1_epi16(static_cast<short>(0xFF80)));
  if (_mm_movemask_epi8(_mm_cmpeq_epi16(beyond, _mm_setzero_si128())) != 0xFFFF) return false;
  _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes), _mm_packus_epi16(low, high));
  return true;
}

#else

inline constexpr size_t kStep = 8;

inline bool widenStep(const unsigned char* bytes, Unit* units) {
  uint64_t chunk;
  std::memcpy(&chunk, bytes, sizeof chunk);
  if ((chunk & UINT64_C(0x8080808080808080)) != 0) return false;
  for (size_t i = 0; i < kStep; ++i) units[i] = bytes[i];
  return true;
}

inline bool narrowStep(const Unit* units, unsigned char* bytes) {
  unsigned all = 0;
  for (size_t i = 0; i < kStep; ++i) all |= units[i];
  if (all > 0x7F) return false;
  for (size_t i = 0; i < kStep; ++i) bytes[i] = static_cast<unsigned char>(units[i]);
  return true;
}

#endif

}  // namespace ascii

/// Widens the ASCII characters that `bytes` begins with, up to `count`. Returns how many.
inline size_t widenAscii(const unsigned char* bytes, size_t count, Unit* units) {
  size_t done = 0;
  while (count - done >= ascii::kStep && ascii::widenStep(bytes + done, units + done)) done += ascii::kStep;
  for (; done < count && bytes[done] < 0x80; ++done) units[done] = bytes[done];
  return done;
}

/// Narrows the ASCII characters that `units` begins with, up to `count`. Returns how many.
inline size_t narrowAscii(const Unit* units, size_t count, unsigned char* bytes) {
  size_t done = 0;
  while (count - done >= ascii::kStep && ascii::narrowStep(units + done, bytes + done)) done += ascii::kStep;
  for (; done < count && units[done] < 0x80; ++done) bytes[done] = static_cast<unsigned char>(units[done]);
  return done;
}

}  // namespace vmqhost
