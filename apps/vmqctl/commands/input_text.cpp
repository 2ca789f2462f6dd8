// Text that a person hands over for a request.

#include "apps/vmqctl/commands/input_text.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>

#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/predicates.h"

namespace vmqctl {
namespace {

struct CloseFile {
  void operator()(std::FILE* file) const {
    if (file != stdin) (void)std::fclose(file);  // only read from
  }
};

}  // namespace

std::string inputText(const std::string& file) {
  const std::string name = file == "-" ? "standard input" : file;
  const std::unique_ptr<std::FILE, CloseFile> stream(file == "-" ? stdin : std::fopen(file.c_str(), "rbe"));
  if (!stream) throw Failure(ExitCode::Usage, "Cannot open " + name + ": " + std::strerror(errno) + ".", "");
  std::string text;
  char block[4096];
  while (const std::size_t count = std::fread(block, 1, sizeof block, stream.get())) {
    text.append(block, count);
    if (text.size() > maximumValueBytes) {
      throw Failure(ExitCode::Usage,
                    name + " is too long: a request holds at most " + std::to_string(maximumValueBytes) + " bytes.",
                    "");
    }
  }
  if (std::ferror(stream.get()) != 0)
    throw Failure(ExitCode::Usage, "Cannot read " + name + ": " + std::strerror(errno) + ".", "");
  if (text.find('\0') != std::string::npos)
    throw Failure(ExitCode::Usage, name + " holds a zero byte, so it is no text.", "");
  return text;
}

}  // namespace vmqctl
