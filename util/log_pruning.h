#pragma once
// Keeps the number of trace logs in a directory bounded.

namespace VMQ {

/// The part of a path behind its last "/" or "\", pointing into `path`; the whole path without a separator; null when
/// the path ends with one.
const char* getFileName(const char* path);

/// When `directory` holds at least `keep` plain files whose names begin with `prefix`, deletes the one whose contents
/// changed longest ago; never more than one. Called before each new log, so that a directory settles at `keep` files.
/// Failures are traced and otherwise ignored.
void pruneLogs(const char* directory, const char* prefix, int keep);

}  // namespace VMQ
