#pragma once
// A folder of a test's own, removed with everything in it when the object goes.

#include <filesystem>
#include <string>

class TemporaryDirectory {
 public:
  TemporaryDirectory();
  ~TemporaryDirectory();
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

  [[nodiscard]] const std::filesystem::path& path() const { return path_; }
  /// The path of something in it.
  [[nodiscard]] std::string operator/(const std::string& name) const { return (path_ / name).string(); }

  /// Writes a file (and the folders above it) and returns its path.
  std::string writeFile(const std::string& name, const std::string& text) const;
  /// Writes an executable script; `body` follows "#!/bin/sh\n".
  std::string writeScript(const std::string& name, const std::string& body) const;

 private:
  std::filesystem::path path_;
};

/// The bytes of a file. Fails the running test when it cannot be read.
std::string readWholeFile(const std::string& path);
