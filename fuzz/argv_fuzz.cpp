// A command line, against a plain reading of how it is split.

#include <cstring>
#include <string>
#include <vector>

#include "fuzz/support.h"
#include "process/argv.h"

namespace {

/// What separates is made a zero byte; a word counts for each run of unquoted blanks that does not begin the line.
std::vector<std::string> wordsOf(std::string line) {
  size_t count = 1;
  char quoted = 0;
  std::string separated = line;
  for (size_t index = 0; index < line.size(); ++index) {
    const bool quote = (line[index] == '"' || line[index] == '\'') && (index == 0 || line[index - 1] != '\\');
    const bool blank = line[index] == ' ' && quoted == 0;
    if (quote || blank) separated[index] = '\0';
    if (quote) quoted ^= 1;
    // The run begins here when what stands in front is no unquoted blank.
    if (blank && index > 0 && !(line[index - 1] == ' ' && separated[index - 1] == '\0')) ++count;
  }
  std::vector<std::string> words;
  size_t position = 0;
  while (words.size() < count) {
    const size_t end = std::min(separated.find('\0', position), separated.size());
    words.push_back(separated.substr(position, end - position));
    position = std::min(separated.find_first_not_of('\0', end), separated.size());
  }
  return words;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string line = fuzz::upToNull(data, size);
  const VMQ::String command(line.c_str());
  char** argv = nullptr;
  const char count = VMQ::MakeArgv(&command, &argv);
  const auto expected = wordsOf(line);
  fuzz::require(count == static_cast<char>(expected.size()), "the count is the number of words, as a char");
  for (size_t index = 0; index < expected.size(); ++index) {
    fuzz::require(argv[index] != nullptr && argv[index] == expected[index], "each word is what it has to be");
  }
  fuzz::require(argv[expected.size()] == nullptr, "null ends the list");
  VMQ::freeArgv(argv);
  return 0;
}
