#include "rpc/binary_data_transfer.h"

#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <string>
#include <utility>

#include "rpc/dos_to_unix.h"
#include "util/current_exception.h"
#include "util/parent_component.h"
#include "util/stream.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::Stream;
using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"rpc/binary_data_transfer"};

enum Status : uint32_t {
  stored = 0,
  noDepot = 1,
  pathTooLong = 3,
  notOpened = 4,
  notWritten = 5,
  noDirectory = 6,
};

constexpr unsigned fileNameBytes = 255;
constexpr unsigned longestPath = 1024;
constexpr int longestPathTold = 1023;  // one less than is accepted, on purpose
constexpr int32_t firstChunk = 1;
constexpr mode_t fileMode = 0770;
constexpr const char* convertedNames[] = {"install.sh", "DeployLnk.sh", ".mdl"};

String cleaned(const char* fileName) {
  String name = String::replace(String(fileName, fileNameBytes), "\\", "/");
  if (name[0] == '/') name.erase(0, 1);
  return name;
}

bool makeDirectoryOf(const Trace& trace, const String& path) {
  const unsigned slash = path.rfind('/');
  if (slash == String::NPOS) return true;
  const String directory = path.substr(0, slash);
  if (Util::pathExists(directory)) return true;
  std::string name = directory.toNarrow();
  if (Util::createDir(name.data()) == 0) return true;
  TRACE_ERROR(trace, "Could not create destination directory %s", directory.c_str().get());
  return false;
}

bool isRegular(FILE* file) {
  struct stat status;
  return fstat(fileno(file), &status) == 0 && S_ISREG(status.st_mode);
}

Stream open(const Trace& trace, const String& path, int32_t chunkNumber) {
  const std::string name = path.toNarrow();
  const bool isFirst = chunkNumber == firstChunk;
  if (isFirst && unlink(name.c_str()) != 0) {
    TRACE_DETAIL(trace, "Failed to unlink file [%s]. File must not exist or we dont have perms to unlink it",
                 path.c_str().get());
  }
  const char* const mode = isFirst ? "wb" : "a+b";
  Stream file(std::fopen(name.c_str(), isFirst ? "wbe" : "a+be"));
  if (file && !isRegular(file.get())) file.reset();  // a conversion that waits for a pipe would hold up all others
  if (!file) {
    TRACE_ERROR(trace, "Failed to open file %s using mode \"%s\", check permissions", path.c_str().get(), mode);
    return file;
  }
  TRACE_DETAIL(trace, "Opened file %s for appending using mode %s", path.c_str().get(), mode);
  // A block is as large as a buffer: it goes out as it is. Nor does a stream that stays open hold anything back.
  (void)std::setvbuf(file.get(), nullptr, _IONBF, 0);
  return file;
}

bool isPossible(const DataBlock& block) {
  return static_cast<uint32_t>(block.length) <= sizeof block.data;  // negative lengths are not
}

/// Writes blocks in one call of the system, which costs a fraction of one call for each. Returns how many bytes it
/// took: those of all blocks but for impossible ones, those after them, those beyond the limit of such a call, and
/// failures.
size_t writeTogether(FILE* file, const DataBlock* blocks, int32_t count) {
  std::array<iovec, 1024> pieces;
  int used = 0;
  for (const DataBlock* block = blocks; block != blocks + count && isPossible(*block); ++block) {
    if (used == int{pieces.size()}) break;
    pieces[used++] = {const_cast<unsigned char*>(block->data), static_cast<size_t>(block->length)};
  }
  const ssize_t written = writev(fileno(file), pieces.data(), used);
  return written > 0 ? static_cast<size_t>(written) : 0;
}

/// Writes the blocks and closes the file, but for the one case in which it stays open. What cannot be written together
/// is written, and found wanting, block by block.
Status write(const Trace& trace, const String& path, Stream file, const DataBlock* blocks, int32_t lastBlockIndex) {
  for (int32_t index = 0; index <= lastBlockIndex; ++index) {
    size_t written = writeTogether(file.get(), blocks + index, lastBlockIndex - index + 1);
    while (index <= lastBlockIndex && isPossible(blocks[index]) && written >= static_cast<size_t>(blocks[index].length))
      written -= static_cast<size_t>(blocks[index++].length);
    if (index > lastBlockIndex) break;

    const DataBlock& block = blocks[index];
    if (!isPossible(block)) {
      TRACE_ERROR(trace, "Block %d has an impossible length of %d bytes", index, block.length);
      return notWritten;
    }
    std::clearerr(file.get());
    (void)std::fwrite(block.data + written, 1, static_cast<size_t>(block.length) - written, file.get());
    (void)std::fflush(file.get());
    if (const int error = std::ferror(file.get()); error != 0) {
      TRACE_ERROR(trace, "Error writing chunk %d, error number was %d", index, error);
      (void)file.release();  // stays open, on purpose
      return notWritten;
    }
  }
  if (std::fclose(file.release()) == 0) return stored;
  TRACE_ERROR(trace, "Could not close [%s].", path.c_str().get());
  return notWritten;
}

void convertIfInterested(const Trace& trace, const String& path) {
  for (const char* const name : convertedNames) {
    if (path.find(String(name), 0) == String::NPOS) continue;
    TRACE_DETAIL(trace, "Its a file we're interested in: %s", path.c_str().get());
    (void)convertDOS2Unix(path);  // has traced its failure; the file is there as it came, or in the work file
    return;
  }
}

Status store(const Trace& trace, const char* fileName, int32_t chunkNumber, int32_t lastBlockIndex,
             const DataBlock* blocks) {
  String depot;
  if (!Util::getAgentDepotDir(depot)) {
    TRACE_ERROR(trace, "No useable Agent Depot dir");
    return noDepot;
  }
  const String name = cleaned(fileName);
  TRACE_DETAIL(trace, "Destination path name is: %s", name.c_str().get());
  if (VMQ::hasParentComponent(name)) {
    TRACE_ERROR(trace, "File name [%s] is refused: \"..\" leads out of its directory", name.c_str().get());
    return notOpened;
  }
  const String path = depot + name;
  if (!makeDirectoryOf(trace, path)) return noDirectory;
  if (path.length() > longestPath) {
    TRACE_ERROR(trace, "Destination path name too long, max is %d characters", longestPathTold);
    return pathTooLong;
  }
  Stream file = open(trace, path, chunkNumber);
  if (!file) return notOpened;
  if (const Status status = write(trace, path, std::move(file), blocks, lastBlockIndex); status != stored)
    return status;
  if (chmod(path.toNarrow().c_str(), fileMode) != 0) {
    TRACE_ERROR(trace, "Failed to set permissions on file [%s] to [%d]", path.c_str().get(), int{fileMode});
  }
  convertIfInterested(trace, path);
  return stored;
}

}  // namespace

void BinaryDataTransfer(rpc__binding*, const char*, const char* fileName, int32_t, int32_t chunkNumber,
                        int32_t lastBlockIndex, const DataBlock* blocks, uint32_t* status) {
  const Trace trace(traceUnit);
  try {
    *status = store(trace, fileName, chunkNumber, lastBlockIndex, blocks);
  } catch (...) {
    VMQ::traceCurrentException(trace, "storing a chunk");
    *status = notOpened;
  }
}
