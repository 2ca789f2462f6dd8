#include "tasks/file_helpers.h"

#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <utility>

#include "util/stream.h"
#include "util/trace.h"

using VMQ::Stream;
using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/file_helpers"};

constexpr size_t BLOCK_BYTES = 1024;

bool closeStream(const Trace& trace, Stream stream, const String& path) {
  if (fclose(stream.release()) == 0) return true;
  TRACE_ERROR(trace, "Failed to close stream for file %s", path.c_str().get());
  return false;
}

bool writeAll(const Trace& trace, FILE* stream, const String& path, const std::string& bytes) {
  size_t written = 0;
  while (written < bytes.size()) {
    const size_t count = fwrite(bytes.data() + written, 1, bytes.size() - written, stream);
    const int error = errno;
    if (ferror(stream) != 0) {
      TRACE_ERROR(trace, "Error writing to file %s, error code: %s", path.c_str().get(), strerror(error));
      return false;
    }
    if (count == 0) return false;
    written += count;
  }
  return true;
}

}  // namespace

// NOLINTNEXTLINE(performance-unnecessary-value-param): the interface passes it by value
String readFile(String path) {
  const Trace trace(traceUnit);
  Stream stream(fopen(path.toNarrow().c_str(), "rbe"));
  if (stream == nullptr) {
    TRACE_ERROR(trace, "Failed to open file %s using mode \"%s\", check permissions", path.c_str().get(), "rb");
    return String();
  }
  // Converted once at the end: a multibyte character may lie across two blocks.
  std::string bytes;
  char block[BLOCK_BYTES];
  while (true) {
    const size_t count = fread(block, 1, sizeof block, stream.get());
    if (ferror(stream.get()) != 0) {
      TRACE_ERROR(trace, "Error reading from file %s, error is %d", path.c_str().get(), ferror(stream.get()));
      bytes.clear();
      break;
    }
    if (count == 0) break;
    bytes.append(block, count);
    clearerr(stream.get());
  }
  (void)closeStream(trace, std::move(stream), path);  // what was read counts
  return String(bytes.c_str());
}

bool writeFile(const String& path, const String& text) {
  const Trace trace(traceUnit);
  Stream stream(fopen(path.toNarrow().c_str(), "wbe"));
  if (stream == nullptr) {
    // The mode named is not the mode used: kept on purpose.
    TRACE_ERROR(trace, "Failed to open file %s using mode \"%s\", check permissions", path.c_str().get(), "rb");
    return false;
  }
  const bool written = writeAll(trace, stream.get(), path, text.toNarrow());
  const bool closed = closeStream(trace, std::move(stream), path);
  return written && closed;
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): as above
bool deleteFile(String path) {
  const Trace trace(traceUnit);
  if (unlink(path.toNarrow().c_str()) != 0) {
    const int error = errno;
    TRACE_ERROR(trace, "Failed to delete file %s error was: %s", path.c_str().get(), strerror(error));
    return false;
  }
  TRACE_DETAIL(trace, "Successfully deleted file %s", path.c_str().get());
  return true;
}

// rfind never reports position 0, so a separator there counts as none, which is what both want.
bool getDirectoryFromPath(const String& path, String& directory) {
  const Trace trace(traceUnit);
  const unsigned separator = path.rfind(static_cast<unsigned short>('/'));
  if (separator == String::NPOS) {
    TRACE_ERROR(trace, "Directory [%s] cannot be parsed, no dir separator", path.c_str().get());
    return false;
  }
  directory = path.substr(0, separator);
  return true;
}

String getFilenameFromPath(const String& path) {
  const Trace trace(traceUnit);
  const unsigned separator = path.rfind(static_cast<unsigned short>('/'));
  if (separator == String::NPOS) return path;
  return separator + 1 == path.length() ? String() : path.substr(separator + 1);
}
