#pragma once
// A file system of a test's own, to fill up or to make read-only.

#include <string>

/// True when this process may have a mount table of its own, which takes root's rights.
bool canMount();

/// Gives this process, which must still have one thread only, a mount table of its own: what it mounts nobody else
/// sees, and it is gone when the process is.
void useOwnMountTable();

/// 64 KiB in memory in place of a directory, empty at first, while it lives. What the directory held is there again
/// afterwards.
class SmallFileSystem {
 public:
  explicit SmallFileSystem(std::string directory);
  ~SmallFileSystem();
  SmallFileSystem(const SmallFileSystem&) = delete;
  SmallFileSystem& operator=(const SmallFileSystem&) = delete;

  /// Files can still be made, but nothing can be written into them.
  void fill() const;
  void makeReadOnly() const;

 private:
  const std::string directory_;
};
