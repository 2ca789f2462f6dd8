// Conversion of text between the host's code pages and UTF-16, beside a plain loop over the same text.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <string>
#include <vector>

#include "nls2.h"

#ifdef __SSE2__
#include <emmintrin.h>
#endif

namespace {

std::string asciiText(size_t bytes) {
  std::string text;
  while (text.size() < bytes) text += "/opt/corvel/config/node7_vmqrunas.cfg ";
  text.resize(bytes);
  return text;
}

/// The least that widening ASCII takes: no check, no capacity, a size that is a multiple of 16.
void widenPlainly(const char* bytes, size_t count, unsigned short* units) {
#ifdef __SSE2__
  const __m128i zero = _mm_setzero_si128();
  for (size_t i = 0; i < count; i += 16) {
    const __m128i chunk = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes + i));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(units + i), _mm_unpacklo_epi8(chunk, zero));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(units + i + 8), _mm_unpackhi_epi8(chunk, zero));
  }
#else
  for (size_t i = 0; i < count; ++i) units[i] = static_cast<unsigned char>(bytes[i]);
#endif
}

void narrowPlainly(const unsigned short* units, size_t count, char* bytes) {
#ifdef __SSE2__
  for (size_t i = 0; i < count; i += 16) {
    const __m128i low = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units + i));
    const __m128i high = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units + i + 8));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes + i), _mm_packus_epi16(low, high));
  }
#else
  for (size_t i = 0; i < count; ++i) bytes[i] = static_cast<char>(units[i]);
#endif
}

void countBytes(benchmark::State& state, size_t bytes) {
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(bytes));
}

void widenByThePlainLoop(benchmark::State& state) {
  const std::string text = asciiText(static_cast<size_t>(state.range(0)));
  std::vector<unsigned short> units(text.size());
  for (auto _ : state) {
    widenPlainly(text.data(), text.size(), units.data());
    benchmark::ClobberMemory();
  }
  countBytes(state, text.size());
}

void narrowByThePlainLoop(benchmark::State& state) {
  const std::vector<unsigned short> units(static_cast<size_t>(state.range(0)), 'x');
  std::vector<char> bytes(units.size());
  for (auto _ : state) {
    narrowPlainly(units.data(), units.size(), bytes.data());
    benchmark::ClobberMemory();
  }
  countBytes(state, units.size());
}

void toUtf16(benchmark::State& state, int32_t code_page, const std::string& text) {
  // NOLINTNEXTLINE(readability-suspicious-call-argument): the first is what the second is
  NLS2_Locale* const locale = NLS2_GetLocale(NLS2_BY_CODEPAGE, code_page);
  std::vector<unsigned short> units(text.size());
  const auto count = static_cast<uint32_t>(text.size());
  int32_t status = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(NLS2_toUTF16(locale, text.data(), count, units.data(), count, &status));
    benchmark::ClobberMemory();
  }
  countBytes(state, text.size());
  NLS2_ReleaseLocale(locale);
}

void fromUtf16(benchmark::State& state, int32_t code_page) {
  // NOLINTNEXTLINE(readability-suspicious-call-argument): the first is what the second is
  NLS2_Locale* const locale = NLS2_GetLocale(NLS2_BY_CODEPAGE, code_page);
  const std::vector<unsigned short> units(static_cast<size_t>(state.range(0)), 'x');
  std::vector<char> bytes(units.size() + 1);
  int32_t status = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(NLS2_fromUTF16(locale, units.data(), static_cast<uint32_t>(units.size()), bytes.data(),
                                            static_cast<uint32_t>(bytes.size()), &status));
    benchmark::ClobberMemory();
  }
  countBytes(state, units.size());
  NLS2_ReleaseLocale(locale);
}

void asciiToUtf16(benchmark::State& state, int32_t code_page) {
  toUtf16(state, code_page, asciiText(static_cast<size_t>(state.range(0))));
}

void japaneseToUtf16(benchmark::State& state, int32_t code_page, const char* two_characters) {
  std::string text;
  while (text.size() < static_cast<size_t>(state.range(0))) text += two_characters;
  toUtf16(state, code_page, text);
}

constexpr int64_t kPath = 64;
constexpr int64_t kFile = 65536;

BENCHMARK(widenByThePlainLoop)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(asciiToUtf16, utf8, NLS2_CP_UTF8)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(asciiToUtf16, ascii, NLS2_CP_ASCII)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(asciiToUtf16, cp932, NLS2_CP932)->Arg(kPath)->Arg(kFile);
BENCHMARK(narrowByThePlainLoop)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(fromUtf16, utf8, NLS2_CP_UTF8)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(fromUtf16, ascii, NLS2_CP_ASCII)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(fromUtf16, cp932, NLS2_CP932)->Arg(kPath)->Arg(kFile);
BENCHMARK_CAPTURE(japaneseToUtf16, utf8, NLS2_CP_UTF8, "\xE6\x97\xA5\xE6\x9C\xAC")->Arg(kFile);
BENCHMARK_CAPTURE(japaneseToUtf16, cp932, NLS2_CP932, "\x93\xFA\x96\x7B")->Arg(kFile);

}  // namespace
