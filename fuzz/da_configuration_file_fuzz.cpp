// The data agent's configuration file, against a plain reading of it. The file lies in memory.

#include <algorithm>
#include <map>
#include <string>

#include "fuzz/file_in_memory.h"
#include "fuzz/support.h"
#include "tasks/da_configuration_file.h"

using namespace VMQ;

namespace {

constexpr char comment = '*';

/// A zero byte ends the text.
std::map<std::string, std::string> entriesOf(std::string text) {
  text.resize(std::min(text.size(), text.find('\0')));
  std::map<std::string, std::string> entries;
  while (!text.empty()) {
    const size_t end = text.find('\n');
    const std::string line = fuzz::trimmed(text.substr(0, end));
    text.erase(0, end == std::string::npos ? end : end + 1);
    const size_t equals = line.find('=');
    if (equals == std::string::npos || line[0] == comment || equals == 0 || equals + 1 == line.size()) continue;
    entries[line.substr(0, equals)] = line.substr(equals + 1);
  }
  return entries;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const fuzz::FileInMemory file;
  file.hold(data, size);
  StrStrMap map;
  populateHashMapFromFile(file.path().c_str(), comment, map);
  const auto expected = entriesOf(std::string(reinterpret_cast<const char*>(data), size));
  fuzz::require(map.getSize() == expected.size(), "there are as many keys");
  for (const auto& [key, value] : expected) {
    String found;
    fuzz::require(map.get(key.c_str(), found), "each key of the file is there");
    fuzz::require(found.toNarrow() == value, "and has its last value");
  }
  return 0;
}
