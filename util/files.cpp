// Small work on files and directories.
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>
#include <new>
#include <string>
#include <system_error>
#include <utility>

#include "util/stream.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/files"};

struct Freer {
  void operator()(char* memory) const { std::free(memory); }
};
using Buffer = std::unique_ptr<char, Freer>;

bool isDirectory(const char* path) {
  std::error_code ignored;  // what cannot be looked at is no directory
  return std::filesystem::is_directory(path, ignored);
}

// Why a stream is in error, for calls made with errno cleared.
int errorOfStream() {
  return errno != 0 ? errno : EIO;
}

// ---- createDir ---------------------------------------------------------------------------------------------------

constexpr mode_t directoryMode = 0770;  // before the umask; on purpose

// `announcement`: what is traced before the directory is made, without the path.
int makeDirectory(const Trace& trace, const char* path, const char* announcement) {
  if (isDirectory(path)) return 0;
  TRACE_DETAIL(trace, "%s %s", announcement, path);
  if (mkdir(path, directoryMode) == 0) return 0;
  const int error = errno;
  if (error == EEXIST && isDirectory(path)) return 0;  // somebody else made it meanwhile
  TRACE_ERROR(trace, "Failed to make directory %s, return code status", path);
  return error;
}

// ---- readFile ----------------------------------------------------------------------------------------------------

/// A directory is refused: the C library opens it and reports a length of its own invention. 0, or an errno value.
int openForReading(const char* path, Stream& stream) {
  Stream opened(std::fopen(path, "rbe"));
  if (opened == nullptr) return errno;
  struct stat status;
  if (fstat(fileno(opened.get()), &status) != 0) return errno;
  if (S_ISDIR(status.st_mode)) return EISDIR;
  stream = std::move(opened);
  return 0;
}

int readStream(const Trace& trace, FILE* stream, const char* path, char** contents, unsigned long* size) {
  if (std::fseek(stream, 0, SEEK_END) != 0) return errno;
  const long length = std::ftell(stream);
  if (length < 0) return errno;
  std::rewind(stream);
  if (length < 1) return 0;

  Buffer buffer(static_cast<char*>(std::malloc(static_cast<size_t>(length) + 1)));
  if (!buffer) {
    const int error = errno;
    TRACE_ERROR(trace, "Unable to read file: %s", path);
    return error;
  }
  errno = 0;
  const size_t count = std::fread(buffer.get(), 1, static_cast<size_t>(length), stream);
  if (std::ferror(stream) != 0) return errorOfStream();
  if (count == 0) return 0;
  buffer.get()[count] = '\0';  // behind what came: the file may have been cut meanwhile
  *contents = buffer.release();
  if (size != nullptr) *size = count;
  return 0;
}

// ---- copying -----------------------------------------------------------------------------------------------------

constexpr size_t copyBlockBytes = 1024;

bool isSameFile(FILE* open, const std::string& path) {
  struct stat one;
  struct stat other;
  return fstat(fileno(open), &one) == 0 && stat(path.c_str(), &other) == 0 && one.st_dev == other.st_dev &&
         one.st_ino == other.st_ino;
}

int copyStream(const Trace& trace, FILE* from, FILE* to, const String& source, const String& destination) {
  char block[copyBlockBytes];
  for (;;) {
    errno = 0;
    const size_t count = std::fread(block, 1, sizeof block, from);
    if (std::ferror(from) != 0) {
      const int error = errorOfStream();
      TRACE_ERROR(trace, "Error reading from file %s, error code: %s", source.c_str().get(), std::strerror(error));
      return error;
    }
    if (count == 0) return 0;
    std::clearerr(to);
    errno = 0;
    if (std::fwrite(block, 1, count, to) != count || std::ferror(to) != 0) {
      const int error = errorOfStream();
      TRACE_ERROR(trace, "Error writing to file %s, error code: %s", destination.c_str().get(), std::strerror(error));
      return error;
    }
  }
}

int closeStream(const Trace& trace, Stream stream, const String& path) {
  errno = 0;
  if (std::fclose(stream.release()) == 0) return 0;
  const int error = errorOfStream();
  TRACE_ERROR(trace, "Failed to close stream for file %s, error code: %s", path.c_str().get(), std::strerror(error));
  return error;
}

int copyOneFile(const Trace& trace, const String& source, const String& destination) {
  Stream from;
  if (const int error = openForReading(source.toNarrow().c_str(), from); error != 0) {
    TRACE_ERROR(trace, "Failed to open source file %s using mode \"%s\", check permissions, error code: %s",
                source.c_str().get(), "rb", std::strerror(error));
    return error;
  }
  const std::string to_path = destination.toNarrow();
  // Opening the destination would empty the source.
  if (isSameFile(from.get(), to_path)) return closeStream(trace, std::move(from), source);

  Stream to(std::fopen(to_path.c_str(), "wbe"));
  if (to == nullptr) {
    const int error = errno;
    TRACE_ERROR(trace, "Failed to open destination file %s using mode \"%s\", check permissions, error code: %s",
                destination.c_str().get(), "wb", std::strerror(error));
    (void)closeStream(trace, std::move(from), source);  // the first error counts
    return error;
  }
  int rc = copyStream(trace, from.get(), to.get(), source, destination);
  for (const int closed :
       // cppcheck-suppress accessMoved ; takes the list for the body of the loop
       {closeStream(trace, std::move(from), source), closeStream(trace, std::move(to), destination)}) {
    if (rc == 0) rc = closed;
  }
  return rc;
}

}  // namespace

bool Util::pathExists(const String& path) {
  const Trace trace(traceUnit);
  if (access(path.toNarrow().c_str(), F_OK) == 0) {
    TRACE_DETAIL(trace, "Path [%s] exists", path.c_str().get());
    return true;
  }
  TRACE_DETAIL(trace, "Path [%s] does not exist", path.c_str().get());
  return false;
}

int Util::createDir(char* path) {
  const Trace trace(traceUnit);
  const char* const name = path + std::strspn(path, "/");
  if (*name == '\0') {
    TRACE_ERROR(trace, "Could not create directory %s, nothing to create", path);
    return -1;
  }
  for (const char* slash = std::strchr(name, '/'); slash != nullptr && slash[1] != '\0';
       slash = std::strchr(slash + 1, '/')) {
    const auto length = static_cast<size_t>(slash - path);
    const std::unique_ptr<char[]> prefix(new (std::nothrow) char[length + 1]);
    if (!prefix) {
      TRACE_ERROR(trace, "Malloc of %d bytes failed", static_cast<int>(length + 1));
      return ENOMEM;
    }
    std::memcpy(prefix.get(), path, length);
    prefix[length] = '\0';
    if (const int error = makeDirectory(trace, prefix.get(), "Making directory"); error != 0) return error;
  }
  return makeDirectory(trace, path, "Making final directory");
}

int Util::readFile(const char* path, char** contents, unsigned long* size) {
  const Trace trace(traceUnit);
  *contents = nullptr;
  if (size != nullptr) *size = 0;
  Stream stream;
  if (const int error = openForReading(path, stream); error != 0) return error;
  return readStream(trace, stream.get(), path, contents, size);
}

bool Util::deleteFile(const String& path) {
  const Trace trace(traceUnit);
  if (unlink(path.toNarrow().c_str()) == 0) return true;
  const int error = errno;
  TRACE_ERROR(trace, "Error deleting [%s]: %s", path.c_str().get(), std::strerror(error));
  return false;
}

int Util::copyFile(const String& source, const String& directory) {
  const Trace trace(traceUnit);
  const unsigned slash = source.rfind('/');
  if (slash == String::NPOS) return copyFile(source, directory, source);
  return copyFile(source, directory, slash + 1 < source.length() ? source.substr(slash + 1) : String());
}

int Util::copyFile(const String& source, const String& directory, const String& name) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Copying file [%s] to directory [%s]", source.c_str().get(), directory.c_str().get());
  String destination(directory);
  if (directory.length() > 0 && directory[directory.length() - 1] != '/') destination.append('/');
  destination.append(name);
  const int rc = _copyFile(source, destination);
  TRACE_DETAIL(trace, "Exit with return code (%d)", rc);
  return rc;
}

int Util::_copyFile(const String& source, const String& destination) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Source file [%s] destination file [%s]", source.c_str().get(), destination.c_str().get());
  const int rc = copyOneFile(trace, source, destination);
  TRACE_DETAIL(trace, "Exit with return code (%d)", rc);
  return rc;
}

int Util::fso_test(char* path) {
  const Trace trace(traceUnit);
  enum { directory = 0, somethingElse = 1, missing = 2 };
  path += std::strspn(path, "\"");
  size_t length = std::strlen(path);
  for (const char stripped : {'"', '/', '\\'}) {
    while (length > 0 && path[length - 1] == stripped) path[--length] = '\0';
  }
  struct stat status;
  if (stat(path, &status) != 0) return missing;
  return S_ISDIR(status.st_mode) ? directory : somethingElse;
}

}  // namespace VMQ
