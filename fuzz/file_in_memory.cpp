#include "fuzz/file_in_memory.h"

#include <sys/mman.h>
#include <unistd.h>

#include "fuzz/support.h"

namespace fuzz {

FileInMemory::FileInMemory() : descriptor_(memfd_create("input", MFD_CLOEXEC)) {
  require(descriptor_ >= 0, "there are files in memory");
}

void FileInMemory::hold(const uint8_t* data, size_t size) const {
  require(ftruncate(descriptor_, 0) == 0 && pwrite(descriptor_, data, size, 0) == static_cast<ssize_t>(size),
          "they can be written");
}

std::string trimmed(std::string text) {
  constexpr const char* white = " \t\n\v\f\r";
  text.erase(text.find_last_not_of(white) + 1);
  return text.erase(0, text.find_first_not_of(white));
}

}  // namespace fuzz
