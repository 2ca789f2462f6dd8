// The string-keyed map beside std::unordered_map, with keys and values of 8 to 20 characters.

#include <benchmark/benchmark.h>

#include <random>
#include <string>
#include <unordered_map>
#include <vector>

#include "util/str_str_map.h"

namespace {

using VMQ::String;
using VMQ::StrStrMap;
using StdMap = std::unordered_map<std::u16string, std::u16string>;

/// Different from each other, and the same in every run.
std::vector<std::string> names(int64_t count, unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_int_distribution<size_t> size(8, 20);
  std::uniform_int_distribution<int> letter('a', 'z');
  std::vector<std::string> result;
  for (int64_t i = 0; i < count; ++i) {
    std::string name = std::to_string(i) + '_';
    for (size_t wanted = size(random); name.size() < wanted;) name += static_cast<char>(letter(random));
    result.push_back(name);
  }
  return result;
}

template <class Text>
std::vector<Text> texts(int64_t count, unsigned seed);
template <>
std::vector<String> texts(int64_t count, unsigned seed) {
  std::vector<String> result;
  for (const std::string& name : names(count, seed)) result.emplace_back(name.c_str());
  return result;
}
template <>
std::vector<std::u16string> texts(int64_t count, unsigned seed) {
  std::vector<std::u16string> result;
  for (const std::string& name : names(count, seed)) result.emplace_back(name.begin(), name.end());
  return result;
}

void put(StrStrMap& map, const String& key, const String& value) {
  map.put(key, value);
}
void put(StdMap& map, const std::u16string& key, const std::u16string& value) {
  map.insert_or_assign(key, value);
}

bool get(const StrStrMap& map, const String& key, String& value) {
  return map.get(key, value);
}
bool get(const StdMap& map, const std::u16string& key, std::u16string& value) {
  const auto found = map.find(key);
  if (found == map.end()) return false;
  value = found->second;
  return true;
}

/// A new map each time, its end included.
template <class Map, class Text>
void putAll(benchmark::State& state) {
  const auto keys = texts<Text>(state.range(0), 1);
  const auto values = texts<Text>(state.range(0), 2);
  for (auto _ : state) {
    Map map;
    for (size_t i = 0; i < keys.size(); ++i) put(map, keys[i], values[i]);
    benchmark::DoNotOptimize(map);
  }
  state.SetItemsProcessed(state.iterations() * state.range(0));
}

template <class Map, class Text>
void replaceAll(benchmark::State& state) {
  const auto keys = texts<Text>(state.range(0), 1);
  const auto values = texts<Text>(state.range(0), 2);
  Map map;
  for (size_t i = 0; i < keys.size(); ++i) put(map, keys[i], values[i]);
  for (auto _ : state) {
    for (size_t i = 0; i < keys.size(); ++i) put(map, keys[i], values[keys.size() - 1 - i]);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * state.range(0));
}

template <class Map, class Text>
void getAll(benchmark::State& state, unsigned seed) {
  const auto keys = texts<Text>(state.range(0), 1);
  const auto values = texts<Text>(state.range(0), 2);
  const auto asked = texts<Text>(state.range(0), seed);
  Map map;
  for (size_t i = 0; i < keys.size(); ++i) put(map, keys[i], values[i]);
  Text value;
  for (auto _ : state) {
    for (const Text& key : asked) benchmark::DoNotOptimize(get(map, key, value));
  }
  state.SetItemsProcessed(state.iterations() * state.range(0));
}

template <class Map, class Text>
void getPresent(benchmark::State& state) {
  getAll<Map, Text>(state, 1);
}
template <class Map, class Text>
void getAbsent(benchmark::State& state) {
  getAll<Map, Text>(state, 3);
}

BENCHMARK(putAll<StrStrMap, String>)->Name("put/vmq")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(putAll<StdMap, std::u16string>)->Name("put/std")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(replaceAll<StrStrMap, String>)->Name("put_again/vmq")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(replaceAll<StdMap, std::u16string>)->Name("put_again/std")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(getPresent<StrStrMap, String>)->Name("get/vmq")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(getPresent<StdMap, std::u16string>)->Name("get/std")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(getAbsent<StrStrMap, String>)->Name("get_absent/vmq")->Arg(8)->Arg(64)->Arg(1024);
BENCHMARK(getAbsent<StdMap, std::u16string>)->Name("get_absent/std")->Arg(8)->Arg(64)->Arg(1024);

}  // namespace
