// Operations on the two maps and on std::maps. The values of the map of pointers are counted.

#include <map>
#include <memory>
#include <string>

#include "fuzz/support.h"
#include "util/str_ptr_map.h"
#include "util/str_str_map.h"

using namespace VMQ;

namespace {

constexpr unsigned mostSteps = 60;

/// What the map of pointers owns: the count of them that live.
int living = 0;

int* newValue(int value) {
  ++living;
  return new int(value);
}
void freeValue(void* value) {
  --living;
  delete static_cast<int*>(value);
}

template <typename Map, typename Twin>
void requireKeys(const Map& map, const Twin& twin) {
  const Array<String> keys = map.getKeys();
  fuzz::require(map.getSize() == twin.size() && keys.getSize() == twin.size(), "there are as many keys");
  for (unsigned index = 0; index < keys.getSize(); ++index) {
    fuzz::require(twin.contains(keys[index].toNarrow()), "each of them is in the twin");
  }
}

void requireTexts(const StrStrMap& map, const std::map<std::string, std::string>& twin) {
  requireKeys(map, twin);
  for (const auto& [key, value] : twin) {
    String found;
    fuzz::require(map.get(key.c_str(), found) && found.toNarrow() == value, "a key has its value");
  }
}

/// Of few letters, so that keys return.
std::string keyFrom(fuzz::Input& input) {
  std::string key(input.below(3), 'a');
  for (char& letter : key) letter = static_cast<char>('a' + input.below(8));
  return key;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  std::map<std::string, std::string> texts;
  std::map<std::string, int> numbers;
  {
    StrStrMap textMap;
    StrPtrMap pointerMap;
    pointerMap.setAutoDeleteValues(true);
    pointerMap.setFreeValueFunc(reinterpret_cast<void*>(freeValue));
    for (unsigned step = 0; step < mostSteps && !input.empty(); ++step) {
      const unsigned operation = input.below(8);
      const std::string key = keyFrom(input);
      const unsigned value = input.byte();
      const String untouched("untouched");
      String found(untouched);
      void* pointer = nullptr;
      switch (operation) {
        case 0:
          textMap.remove(key.c_str());
          texts.erase(key);
          break;
        case 1:
          pointerMap.remove(key.c_str());
          numbers.erase(key);
          break;
        case 2:
          if (value != 0) break;
          textMap.removeAll();
          pointerMap.removeAll();
          texts.clear();
          numbers.clear();
          break;
        case 3:
          requireTexts(StrStrMap(textMap), texts);
          break;
        default:
          textMap.put(key.c_str(), std::to_string(value).c_str());
          texts[key] = std::to_string(value);
          pointerMap.put(key.c_str(), newValue(static_cast<int>(value)));
          numbers[key] = static_cast<int>(value);
          if (pointerMap.get(key.c_str(), &pointer)) pointerMap.put(key.c_str(), pointer);  // changes nothing
      }
      fuzz::require(textMap.get(key.c_str(), found) == texts.contains(key), "a text is found when it is there");
      fuzz::require(texts.contains(key) || found == untouched, "what is not found stays untouched");
      fuzz::require(pointerMap.get(key.c_str(), &pointer) == numbers.contains(key), "and so is a pointer");
      fuzz::require(!numbers.contains(key) || *static_cast<int*>(pointer) == numbers[key], "with its value");
      fuzz::require(living == static_cast<int>(numbers.size()), "no more values live than the map has");
    }
    requireTexts(textMap, texts);
    requireKeys(pointerMap, numbers);
  }
  fuzz::require(living == 0, "a map takes its values along");
  return 0;
}
