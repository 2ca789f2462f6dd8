#pragma once
// Which files are sent, in which order, and what they are called in the depot. All of it is settled, and everything
// that cannot be sent is refused, before the first byte goes out.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace vmqctl {

struct PlannedFile {
  std::string source;       ///< where it is here
  std::string name;         ///< path relative to the depot, with "/"
  std::uint64_t bytes = 0;  ///< when it was looked at
};

/// Every routine that throws throws a Failure of usage.
class PushPlan {
 public:
  /// Adds a file, or a folder with everything in it, under its own name in a folder of the depot ("" for the depot).
  /// Links to files are sent as the files that they point to. Throws for what is neither file nor folder, what cannot
  /// be read, links that lead to no file, and names that cannot be sent.
  void add(const std::string& source, const std::string& folder);

  /// Adds everything in a folder, under the names that it has there, in a folder of the depot.
  void addContents(const std::string& directory, const std::string& folder);

  /// Throws when there is nothing to send, when two files have one name in the depot, or a file
  /// has that of a folder.
  void check() const;

  /// Throws when a path under this depot (ending with "/") is too long, or a file has more chunks than can be numbered.
  void checkFits(const std::string& depot, std::size_t chunkBytes) const;

  /// By arguments as they were added; in a folder by the bytes of the names.
  [[nodiscard]] const std::vector<PlannedFile>& files() const { return files_; }
  [[nodiscard]] std::uint64_t bytes() const { return bytes_; }
  /// Folders in which there is no file: nothing of them arrives.
  [[nodiscard]] const std::vector<std::string>& emptyFolders() const { return emptyFolders_; }

 private:
  void addFile(const std::string& source, const std::string& name, std::uint64_t bytes);
  void addFolder(const std::string& source, const std::string& folder);

  std::vector<PlannedFile> files_;
  std::uint64_t bytes_ = 0;
  std::vector<std::string> emptyFolders_;
};

/// A folder of the depot as it was typed, without "/" at its ends and without empty and "." components. Throws a
/// Failure of usage when it leaves the depot.
std::string cleanFolder(std::string_view folder);

/// How many calls a file takes. REQUIRES: chunkBytes is not 0.
std::uint64_t chunksOf(std::uint64_t bytes, std::size_t chunkBytes);

}  // namespace vmqctl
