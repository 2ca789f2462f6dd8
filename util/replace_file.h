#pragma once
// Writing a whole file so that it holds either its old or its new contents, whatever happens.

#include <string>

namespace VMQ {

/// Gives the file at `path` (created when missing; symbolic links are followed) new contents in one step, keeping its
/// mode and owner. For that a file of its own is made beside it, which takes its place once it is complete. What is not
/// a plain file is written directly. False, with an errno value in `error`, when the file or the one beside it could
/// not be opened for writing. Otherwise true: `error` is 0, or what went wrong afterwards. After either failure the old
/// contents are whole, and a file that was missing is missing again.
bool replaceFile(const std::string& path, const std::string& contents, int& error);

}  // namespace VMQ
