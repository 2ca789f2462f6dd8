// Texts beside std::u16string, and the conversions of ASCII beside a plain SSE2 loop. Each pair of rows does the same
// job; sizes are in characters.

#include <benchmark/benchmark.h>
#ifdef __SSE2__
#include <emmintrin.h>
#endif

#include <cstring>
#include <memory>
#include <string>

#include "util/string.h"

namespace {

using VMQ::String;

/// What commands print: words, paths and numbers in lines.
std::string output(size_t size) {
  static constexpr const char* LINES[] = {
      "Starting Monitoring Agent for UNIX OS ...\n", "export CORVELHOME=/opt/corvel/home\n",
      "Product code ux was started as process 28731\n", "06.30.07.00  lx8266  registry=/opt/corvel/home/registry\n"};
  std::string text;
  for (size_t i = 0; text.size() < size; ++i) text += LINES[i % std::size(LINES)];
  text.resize(size);
  return text;
}

template <class Text>
Text textOf(const std::string& ascii);
template <>
String textOf(const std::string& ascii) {
  return String(ascii.c_str());
}
template <>
std::u16string textOf(const std::string& ascii) {
  return {ascii.begin(), ascii.end()};
}

size_t find(const String& text, const String& piece) {
  return text.find(piece, 0);
}
size_t find(const std::u16string& text, const std::u16string& piece) {
  return text.find(piece, 0);
}

String replace(const String& text, const String& from, const String& to) {
  return String::replace(text, from, to);
}
std::u16string replace(const std::u16string& text, const std::u16string& from, const std::u16string& to) {
  std::u16string result;
  size_t start = 0;
  for (size_t pos; (pos = text.find(from, start)) != std::u16string::npos; start = pos + from.size()) {
    result.append(text, start, pos - start);
    result.append(to);
  }
  result.append(text, start);
  return result;
}

void appendUnit(String& text, unsigned short unit) {
  text.append(unit);
}
void appendUnit(std::u16string& text, unsigned short unit) {
  text.push_back(unit);
}

template <class Text>
void append(benchmark::State& state) {
  const auto size = static_cast<size_t>(state.range(0));
  for (auto _ : state) {
    Text text;
    for (size_t i = 0; i < size; ++i) appendUnit(text, static_cast<unsigned short>('a' + i % 26));
    benchmark::DoNotOptimize(text);
  }
  state.SetItemsProcessed(state.iterations() * state.range(0));
}

template <class Text>
void appendText(benchmark::State& state) {
  const Text piece = textOf<Text>("/opt/corvel/");
  for (auto _ : state) {
    Text text;
    for (int64_t i = 0; i < state.range(0); ++i) text.append(piece);
    benchmark::DoNotOptimize(text);
  }
}

template <class Text>
void copy(benchmark::State& state) {
  const Text text = textOf<Text>(output(static_cast<size_t>(state.range(0))));
  for (auto _ : state) {
    Text another(text);
    benchmark::DoNotOptimize(another);
  }
}

/// What is looked for stands at the end.
template <class Text>
void findText(benchmark::State& state) {
  const Text piece = textOf<Text>("CorvelAgent");
  Text text = textOf<Text>(output(static_cast<size_t>(state.range(0))));
  text.append(piece);
  for (auto _ : state) benchmark::DoNotOptimize(find(text, piece));
}

/// Each position begins like what is looked for.
template <class Text>
void findInRun(benchmark::State& state) {
  const auto size = static_cast<size_t>(state.range(0));
  const Text text = textOf<Text>(std::string(size, 'a') + "b");
  const Text piece = textOf<Text>("aaaaaaab");
  for (auto _ : state) benchmark::DoNotOptimize(find(text, piece));
}

template <class Text>
void replaceText(benchmark::State& state) {
  const Text text = textOf<Text>(output(static_cast<size_t>(state.range(0))));
  const Text from = textOf<Text>("/opt/corvel/home");
  const Text to = textOf<Text>("/usr/local/corvel");
  for (auto _ : state) {
    Text replaced = replace(text, from, to);
    benchmark::DoNotOptimize(replaced);
  }
}

// ---- conversions --------------------------------------------------------------------------------------------------

#ifdef __SSE2__
void widen(const char* bytes, size_t count, unsigned short* units) {
  size_t i = 0;
  for (; i + 16 <= count; i += 16) {
    const __m128i chunk = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes + i));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(units + i), _mm_unpacklo_epi8(chunk, _mm_setzero_si128()));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(units + i + 8), _mm_unpackhi_epi8(chunk, _mm_setzero_si128()));
  }
  for (; i < count; ++i) units[i] = static_cast<unsigned char>(bytes[i]);
}

void narrow(const unsigned short* units, size_t count, char* bytes) {
  size_t i = 0;
  for (; i + 16 <= count; i += 16) {
    const __m128i low = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units + i));
    const __m128i high = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units + i + 8));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes + i), _mm_packus_epi16(low, high));
  }
  for (; i < count; ++i) bytes[i] = static_cast<char>(units[i]);
}

/// The whole way from a C string to a text of its own.
void widenWithSse2(benchmark::State& state) {
  const std::string text = output(static_cast<size_t>(state.range(0)));
  for (auto _ : state) {
    const char* bytes = text.c_str();
    benchmark::DoNotOptimize(bytes);
    const size_t size = std::strlen(bytes) + 1;
    const std::unique_ptr<unsigned short[]> units(new unsigned short[size]);
    widen(bytes, size, units.get());
    benchmark::DoNotOptimize(units.get());
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(state.iterations() * state.range(0));
}

/// The whole way from a text to a std::string.
void narrowWithSse2(benchmark::State& state) {
  const String text = textOf<String>(output(static_cast<size_t>(state.range(0))));
  for (auto _ : state) {
    std::string bytes(text.length(), 0);
    narrow(text.getData(), text.length(), bytes.data());
    benchmark::DoNotOptimize(bytes.data());
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(state.iterations() * state.range(0));
}

/// The loop alone, beside the host's service alone.
void widenLoopSse2(benchmark::State& state) {
  const std::string text = output(static_cast<size_t>(state.range(0)));
  const std::unique_ptr<unsigned short[]> units(new unsigned short[text.size()]);
  for (auto _ : state) {
    widen(text.data(), text.size(), units.get());
    benchmark::ClobberMemory();
  }
}

void narrowLoopSse2(benchmark::State& state) {
  const String text = textOf<String>(output(static_cast<size_t>(state.range(0))));
  const std::unique_ptr<char[]> bytes(new char[text.length()]);
  for (auto _ : state) {
    narrow(text.getData(), text.length(), bytes.get());
    benchmark::ClobberMemory();
  }
}
#endif

void widenWithVmq(benchmark::State& state) {
  const std::string text = output(static_cast<size_t>(state.range(0)));
  for (auto _ : state) {
    String units(text.c_str());
    benchmark::DoNotOptimize(units);
  }
  state.SetBytesProcessed(state.iterations() * state.range(0));
}

void narrowWithVmq(benchmark::State& state) {
  const String text = textOf<String>(output(static_cast<size_t>(state.range(0))));
  for (auto _ : state) {
    std::string bytes = text.toNarrow();
    benchmark::DoNotOptimize(bytes);
  }
  state.SetBytesProcessed(state.iterations() * state.range(0));
}

void narrowWithCStr(benchmark::State& state) {
  const String text = textOf<String>(output(static_cast<size_t>(state.range(0))));
  for (auto _ : state) benchmark::DoNotOptimize(text.c_str().get());
  state.SetBytesProcessed(state.iterations() * state.range(0));
}

void widenLoopNls2(benchmark::State& state) {
  const std::string text = output(static_cast<size_t>(state.range(0)));
  const std::unique_ptr<unsigned short[]> units(new unsigned short[text.size()]);
  const auto size = static_cast<uint32_t>(text.size());
  int32_t status = 0;
  for (auto _ : state) {
    NLS2_toUTF16(VMQ::glbLocale, text.data(), size, units.get(), size, &status);
    benchmark::ClobberMemory();
  }
}

void narrowLoopNls2(benchmark::State& state) {
  const String text = textOf<String>(output(static_cast<size_t>(state.range(0))));
  const std::unique_ptr<char[]> bytes(new char[text.length() + 1]);
  int32_t status = 0;
  for (auto _ : state) {
    NLS2_fromUTF16(VMQ::glbLocale, text.getData(), text.length(), bytes.get(), text.length() + 1, &status);
    benchmark::ClobberMemory();
  }
}

BENCHMARK(append<String>)->Name("append/vmq")->Arg(16)->Arg(256)->Arg(16384);
BENCHMARK(append<std::u16string>)->Name("append/std")->Arg(16)->Arg(256)->Arg(16384);
BENCHMARK(appendText<String>)->Name("append_text/vmq")->Arg(4)->Arg(64);
BENCHMARK(appendText<std::u16string>)->Name("append_text/std")->Arg(4)->Arg(64);
BENCHMARK(copy<String>)->Name("copy/vmq")->Arg(16)->Arg(4096);
BENCHMARK(copy<std::u16string>)->Name("copy/std")->Arg(16)->Arg(4096);
BENCHMARK(findText<String>)->Name("find/vmq")->Arg(64)->Arg(4096);
BENCHMARK(findText<std::u16string>)->Name("find/std")->Arg(64)->Arg(4096);
BENCHMARK(findInRun<String>)->Name("find_in_run/vmq")->Arg(4096);
BENCHMARK(findInRun<std::u16string>)->Name("find_in_run/std")->Arg(4096);
BENCHMARK(replaceText<String>)->Name("replace/vmq")->Arg(64)->Arg(4096);
BENCHMARK(replaceText<std::u16string>)->Name("replace/std")->Arg(64)->Arg(4096);
BENCHMARK(widenWithVmq)->Name("widen/vmq")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(narrowWithVmq)->Name("narrow/vmq")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(narrowWithCStr)->Name("narrow/vmq_c_str")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(widenLoopNls2)->Name("widen_loop/nls2")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(narrowLoopNls2)->Name("narrow_loop/nls2")->Arg(16)->Arg(64)->Arg(4096);
#ifdef __SSE2__
BENCHMARK(widenWithSse2)->Name("widen/sse2")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(narrowWithSse2)->Name("narrow/sse2")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(widenLoopSse2)->Name("widen_loop/sse2")->Arg(16)->Arg(64)->Arg(4096);
BENCHMARK(narrowLoopSse2)->Name("narrow_loop/sse2")->Arg(16)->Arg(64)->Arg(4096);
#endif

}  // namespace
