// A file of "key=value" lines, against a plain reading of it. The file lies in memory.

#include <sys/mman.h>
#include <unistd.h>

#include <map>
#include <string>

#include "fuzz/support.h"
#include "util/resource_bundle.h"

using namespace VMQ;

namespace {

constexpr char comment = '*';

/// One file that holds one input after the other.
class FileInMemory {
 public:
  FileInMemory() : descriptor_(memfd_create("bundle", MFD_CLOEXEC)) {
    fuzz::require(descriptor_ >= 0, "there are files in memory");
  }
  void hold(const uint8_t* data, size_t size) const {
    fuzz::require(ftruncate(descriptor_, 0) == 0 && pwrite(descriptor_, data, size, 0) == static_cast<ssize_t>(size),
                  "they can be written");
  }
  [[nodiscard]] std::string path() const { return "/proc/self/fd/" + std::to_string(descriptor_); }

 private:
  const int descriptor_;
};

/// Up to a zero byte, which ends a narrow text.
std::string trimmed(std::string text) {
  constexpr const char* white = " \t\n\v\f\r";
  text.resize(text.find('\0') == std::string::npos ? text.size() : text.find('\0'));
  text.erase(text.find_last_not_of(white) + 1);
  return text.erase(0, text.find_first_not_of(white));
}

std::map<std::string, std::string> entriesOf(std::string text) {
  std::map<std::string, std::string> entries;
  while (!text.empty()) {
    const size_t end = text.find('\n');
    const std::string line = text.substr(0, end);
    text.erase(0, end == std::string::npos ? end : end + 1);
    const size_t equals = line.find('=');
    if (equals != std::string::npos && line[0] != comment) {
      entries[trimmed(line.substr(0, equals))] = trimmed(line.substr(equals + 1));
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
  static const FileInMemory file;
  file.hold(data, size);
  const ResourceBundle bundle(file.path().c_str(), comment);
  const auto expected = entriesOf(std::string(reinterpret_cast<const char*>(data), size));
  requireEntries(bundle, expected);
  requireEntries(ResourceBundle(bundle), expected);
  return 0;
}
