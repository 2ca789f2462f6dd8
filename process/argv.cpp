#include "process/argv.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>

#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/argv"};

/// Overwrites what separates words with NULs and returns the number of words.
size_t separateWords(std::string& text) {
  size_t words = 1;
  bool quoted = false;
  bool afterBlank = true;
  char previous = '\0';
  for (char& c : text) {
    const char current = c;
    if (current == ' ' && !quoted) {
      c = '\0';
      if (!afterBlank) ++words;
      afterBlank = true;
    } else {
      if ((current == '"' || current == '\'') && previous != '\\') {
        c = '\0';
        quoted = !quoted;
      }
      afterBlank = false;
    }
    previous = current;
  }
  return words;
}

}  // namespace

char MakeArgv(const String* command, char*** argv) {
  const Trace trace(traceUnit);
  if (command == nullptr || argv == nullptr) {
    TRACE_ERRNO(trace, EINVAL);
    errno = EINVAL;
    return -1;
  }
  std::string text = command->toNarrow();
  const size_t words = separateWords(text);

  auto** list = static_cast<char**>(calloc(words + 1, sizeof(char*)));
  if (list == nullptr) throw std::bad_alloc();
  const char* position = text.c_str();
  const char* const end = position + text.size();
  for (size_t i = 0; i < words; ++i) {
    list[i] = strdup(position);
    if (list[i] == nullptr) {
      freeArgv(list);
      throw std::bad_alloc();
    }
    position += strlen(position);
    while (position < end && *position == '\0') ++position;
  }
  *argv = list;
  return static_cast<char>(words);
}

void freeArgv(char** argv) {
  const Trace trace(traceUnit);
  if (argv == nullptr) return;
  for (char** word = argv; *word != nullptr; ++word) free(*word);
  free(argv);
}

}  // namespace VMQ
