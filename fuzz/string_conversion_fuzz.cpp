// Bytes as text and back, and texts that are numbers.

#include <cerrno>
#include <cstdlib>
#include <string>

#include "fuzz/support.h"
#include "util/string.h"

using VMQ::String;

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string bytes = fuzz::upToNull(data, size);
  const String text(bytes.c_str());
  fuzz::require(text.toNarrow() == bytes, "in the plain locale every byte comes back");
  fuzz::require(String(bytes.c_str(), static_cast<unsigned>(size / 2)).toNarrow() == bytes.substr(0, size / 2),
                "so does each of a part");
  fuzz::require(bytes == text.c_str().get(), "and of a name");

  char* end = nullptr;
  errno = 0;
  const long value = std::strtol(bytes.c_str(), &end, 10);
  const bool isNumber = *end == 0 && errno == 0 && value != INT32_MAX && value != INT32_MIN;
  int number = 1;
  fuzz::require(String::isNumber(text) == isNumber, "a number is one");
  fuzz::require(String::convertToInt(text, &number) == isNumber, "and can be converted");
  fuzz::require(number == (isNumber ? static_cast<int>(value) : 0), "to its low 32 bits");
  return 0;
}
