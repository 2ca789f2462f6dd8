// Standard output and standard error.

#include "apps/vmqctl/console.h"

#include <langinfo.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>
#include <clocale>
#include <cstdlib>
#include <cstring>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

/// By custom, a variable set to nothing counts as not set.
bool isSet(const char* variable) {
  const char* value = std::getenv(variable);
  return value != nullptr && *value != '\0';
}

Stream look(std::FILE* file, bool utf8) {
  const char* term = std::getenv("TERM");
  Stream stream;
  stream.file = file;
  stream.terminal = isatty(fileno(file)) == 1;
  stream.sequences = stream.terminal && term != nullptr && std::strcmp(term, "dumb") != 0 && *term != '\0';
  stream.colour = stream.sequences && !isSet("NO_COLOR");
  stream.charset = stream.terminal && !utf8 ? Charset::Ascii : Charset::Utf8;
  return stream;
}

}  // namespace

std::size_t Stream::width() const {
  winsize size = {};
  return terminal && ioctl(fileno(file), TIOCGWINSZ, &size) == 0 ? size.ws_col : 0;
}

Console Console::ofThisProcess() {
  const bool utf8 = std::setlocale(LC_CTYPE, "") != nullptr && std::strcmp(nl_langinfo(CODESET), "UTF-8") == 0;
  useUtf8Characters();
  return {look(stdout, utf8), look(stderr, utf8)};
}

void Console::data(std::string_view text) const {
  if (std::fwrite(text.data(), 1, text.size(), out_.file) != text.size() || std::fflush(out_.file) != 0) {
    throw Failure(ExitCode::Failed, std::string("The output cannot be written: ") + std::strerror(errno) + ".");
  }
}

void Console::error(std::string_view sentence, std::string_view next) const {
  // Nobody is left to tell when standard error itself cannot be written.
  (void)std::fputs(err_.colour ? "\033[1;31mvmqctl:\033[0m " : "vmqctl: ", err_.file);
  line(next.empty() ? std::string(sentence) : std::string(sentence) + " " + std::string(next));
}

void Console::line(std::string_view text) const {
  const std::string shown = escaped(text, err_.charset) + "\n";
  (void)std::fputs(shown.c_str(), err_.file);
}

}  // namespace vmqctl
