#pragma once
// A small file system of the test's own, for what happens when one is full, read-only or another one.

#include <string>

/// A file system in memory, mounted where only this process (and its children) sees it, so that it goes with the
/// process at the latest. It needs root; without, isMounted() is false.
class ScratchFileSystem {
 public:
  /// `directory` is made.
  ScratchFileSystem(std::string directory, unsigned kibibytes);
  ~ScratchFileSystem();
  ScratchFileSystem(const ScratchFileSystem&) = delete;
  ScratchFileSystem& operator=(const ScratchFileSystem&) = delete;

  [[nodiscard]] bool isMounted() const { return mounted_; }
  /// False when it cannot be.
  [[nodiscard]] bool makeReadOnly() const;

 private:
  const std::string directory_;
  bool mounted_ = false;
};
