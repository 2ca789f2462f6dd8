#include "rpc/dos_to_unix.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <string>
#include <utility>

#include "util/stream.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::Stream;
using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"rpc/dos_to_unix"};

constexpr mode_t convertedMode = 0770;
constexpr mode_t workMode = 0600;  // until it is whole

/// The work file is one for all.
constinit std::mutex oneAtATime;

String workFileName() {
  String name;
  if (!Util::getCorvelHomeDir(name)) return ".vmqtemp";
  name.append(String("/tmp/.vmqtemp"));
  return name;
}

/// True when the two names are one and the same entry of a directory.
bool isSameName(FILE* open, const std::string& name) {
  struct stat one;
  struct stat other;
  return fstat(fileno(open), &one) == 0 && lstat(name.c_str(), &other) == 0 && one.st_dev == other.st_dev &&
         one.st_ino == other.st_ino && one.st_nlink == 1;
}

/// A new file in place of whatever had that name: nothing that somebody has put there is written to.
Stream createWorkFile(const std::string& name) {
  (void)unlink(name.c_str());  // mostly there is none; what cannot be removed is in the way of the next call
  const int descriptor = open(name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, workMode);
  if (descriptor < 0) return nullptr;
  Stream stream(fdopen(descriptor, "w"));
  if (stream == nullptr) (void)close(descriptor);  // nothing was written
  return stream;
}

/// False when reading or writing has failed.
bool copyConverted(FILE* from, FILE* to) {
  constexpr int carriageReturn = 13;
  constexpr int endOfFileMark = 26;
  int c;
  while ((c = getc_unlocked(from)) != EOF) {
    if (c == carriageReturn || c == endOfFileMark) continue;
    if (putc_unlocked(c, to) == EOF) return false;
  }
  return std::ferror(from) == 0;
}

bool closeStream(const Trace& trace, Stream stream, const String& name) {
  if (std::fclose(stream.release()) == 0) return true;
  TRACE_ERROR(trace, "Could not close [%s].", name.c_str().get());
  return false;
}

bool convertInto(const Trace& trace, const String& path, const String& work) {
  Stream from(std::fopen(path.toNarrow().c_str(), "re"));
  if (from == nullptr) {
    TRACE_ERROR(trace, "Could not open [%s] for reading.", path.c_str().get());
    return false;
  }
  const std::string workName = work.toNarrow();
  Stream to = isSameName(from.get(), workName) ? nullptr : createWorkFile(workName);
  if (to == nullptr) {
    TRACE_ERROR(trace, "Could not open [%s] for writing.", work.c_str().get());
    (void)closeStream(trace, std::move(from), path);
    return false;
  }
  const bool copied = copyConverted(from.get(), to.get());
  if (!copied) TRACE_ERROR(trace, "Could not copy [%s] to [%s].", path.c_str().get(), work.c_str().get());
  const bool fromClosed = closeStream(trace, std::move(from), path);
  const bool toClosed = closeStream(trace, std::move(to), work);
  return copied && fromClosed && toClosed;
}

/// Makes the work file the file at `path`.
bool putInPlace(const Trace& trace, const String& work, const String& path) {
  const std::string workName = work.toNarrow();
  const std::string name = path.toNarrow();
  if (chmod(workName.c_str(), convertedMode) != 0) {
    TRACE_ERROR(trace, "Failed to set permissions on file [%s] to [%d]", work.c_str().get(), int{convertedMode});
    return false;
  }
  if (unlink(name.c_str()) != 0) {
    const int error = errno;
    TRACE_ERROR(trace, "Failed to unlink file [%s]. ERRNO: %d - %s", path.c_str().get(), error, std::strerror(error));
    return false;
  }
  if (link(workName.c_str(), name.c_str()) != 0) {
    const int error = errno;
    TRACE_ERROR(trace, "Failed to link file [%s] to [%s]. ERRNO: %d - %s", work.c_str().get(), path.c_str().get(),
                error, std::strerror(error));
    return false;
  }
  if (unlink(workName.c_str()) != 0) {
    const int error = errno;
    TRACE_ERROR(trace, "Failed to unlink temp file [%s]. ERRNO: %d - %s", work.c_str().get(), error,
                std::strerror(error));
    return false;
  }
  return true;
}

}  // namespace

// NOLINTNEXTLINE(performance-unnecessary-value-param): the interface passes it by value
int32_t convertDOS2Unix(String path) {
  const Trace trace(traceUnit);
  const std::lock_guard guard(oneAtATime);
  const String work = workFileName();
  TRACE_DETAIL(trace, "tempfile name: [%s]", work.c_str().get());
  return convertInto(trace, path, work) && putInPlace(trace, work, path) ? 0 : -1;
}
