#pragma once
// Whole text files and parts of paths, for the deployment tasks. Nothing here throws on a missing file; every failure
// is told by the result and a trace line. For any thread.

#include "util/string.h"

/// The text of a file, converted from the host code page as one piece; empty when it is empty or cannot be read.
VMQ::String readFile(VMQ::String path);

/// Creates or truncates the file and writes the whole text in the host code page. True when all of it was written and
/// the file closed.
bool writeFile(const VMQ::String& path, const VMQ::String& text);

/// Removes a file; false when that failed.
bool deleteFile(VMQ::String path);

/// Everything before the last "/". False, with `directory` unchanged, when there is none or it is the first character.
bool getDirectoryFromPath(const VMQ::String& path, VMQ::String& directory);

/// Everything behind the last "/"; the whole path when there is none or it is the first character.
VMQ::String getFilenameFromPath(const VMQ::String& path);
