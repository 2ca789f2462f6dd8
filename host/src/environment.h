#pragma once
// The environment for this library's own use: without the test seam.

#include "bss1.h"

namespace vmqhost {

/// See BSS1_GetEnv.
const char* environmentValue(const char* name, const char* defaultValue);

/// A text with this content that is never freed. Few texts come this way, again and again, so each is kept once.
/// Throws std::bad_alloc.
const char* keptText(const char* text);

/// Taken before every other lock of this library.
extern constinit BSS1_Lock environmentLock;

}  // namespace vmqhost
