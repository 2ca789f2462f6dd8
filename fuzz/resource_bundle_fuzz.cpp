// A file of "key=value" lines, against a plain reading of it. The file lies in memory.

#include <map>
#include <string>

#include "fuzz/file_in_memory.h"
#include "fuzz/support.h"
#include "util/resource_bundle.h"

using namespace VMQ;

namespace {

constexpr char comment = '*';

/// Up to a zero byte, which ends a narrow text.
std::string partOf(const std::string& text) {
  return fuzz::trimmed(text.substr(0, text.find('\0')));
}

std::map<std::string, std::string> entriesOf(std::string text) {
  std::map<std::string, std::string> entries;
  while (!text.empty()) {
    const size_t end = text.find('\n');
    const std::string line = text.substr(0, end);
    text.erase(0, end == std::string::npos ? end : end + 1);
    const size_t equals = line.find('=');
    if (equals != std::string::npos && line[0] != comment) {
      entries[partOf(line.substr(0, equals))] = partOf(line.substr(equals + 1));
    }
  }
  return entries;
}

void requireEntries(const ResourceBundle& bundle, const std::map<std::string, std::string>& expected) {
  const Array<String> keys = bundle.getKeys();
  fuzz::require(keys.getSize() == expected.size(), "there are as many keys");
  for (unsigned index = 0; index < keys.getSize(); ++index) {
    const auto entry = expected.find(keys[index].toNarrow());
    fuzz::require(entry != expected.end(), "each key is one of the file's");
    fuzz::require(bundle.getValue(keys[index])->toNarrow() == entry->second, "and has its last value");
  }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const fuzz::FileInMemory file;
  file.hold(data, size);
  const ResourceBundle bundle(file.path().c_str(), comment);
  const auto expected = entriesOf(std::string(reinterpret_cast<const char*>(data), size));
  requireEntries(bundle, expected);
  requireEntries(ResourceBundle(bundle), expected);
  return 0;
}
