#pragma once
// A file of this machine while it is read for sending.

#include <sys/stat.h>
#include <sys/uio.h>

#include <cstdint>
#include <span>
#include <string>

namespace vmqctl {

/// Reads from the beginning to the end and notices when the file is not what it was. One thread.
/// Everything here throws a Failure that names the file.
class SourceFile {
 public:
  /// Opens a regular file.
  explicit SourceFile(const std::string& path);
  ~SourceFile();
  SourceFile(const SourceFile&) = delete;
  SourceFile& operator=(const SourceFile&) = delete;

  /// Its size when it was opened.
  [[nodiscard]] std::uint64_t bytes() const { return static_cast<std::uint64_t>(opened_.st_size); }

  /// Fills all pieces with what comes next. Fails when the file ends before that.
  void read(std::span<const iovec> pieces);

  /// Fails when the file has been written to since it was opened. To be called when all of bytes() has been read.
  void checkUnchanged() const;

 private:
  [[nodiscard]] struct stat look() const;

  const std::string path_;
  const int descriptor_;
  struct stat opened_ = {};
};

}  // namespace vmqctl
