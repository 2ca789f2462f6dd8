#pragma once
// A small file system of the test's own, for what happens when one is full, read-only or another one.

#include <cstddef>
#include <string>

/// True when this process may have a mount table of its own: as root, and as another user where users may have
/// namespaces.
bool canMount();

/// Gives this process a mount table of its own: what it mounts nobody else sees, and it is gone with the process at the
/// latest. Threads that there are already keep the old one. Does nothing the second time. Throws std::system_error when
/// the system refuses. REQUIRES: canMount().
void useOwnMountTable();

/// A file system in memory in place of a directory, empty at first. What the directory held is there again afterwards.
/// Throws std::system_error when the system refuses. REQUIRES: canMount().
class ScratchFileSystem {
 public:
  /// The directory is made when it is not there.
  explicit ScratchFileSystem(std::string directory, unsigned kibibytes = 64);
  ~ScratchFileSystem();
  ScratchFileSystem(const ScratchFileSystem&) = delete;
  ScratchFileSystem& operator=(const ScratchFileSystem&) = delete;

  /// Files can still be made, but nothing can be written into them.
  void fill() const;
  void makeReadOnly() const;

 private:
  const std::string directory_;
  const size_t bytes_;
};
