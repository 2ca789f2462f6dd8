#pragma once
// Texts that end up in shell command lines without quotes.

#include "util/string.h"

namespace VMQ {

/// True when a shell reads the text as part of one word and as nothing but itself: no white space, no control
/// character, nothing that quotes, expands, redirects or separates. An empty text is plain.
bool isPlainShellWord(const String& text);

}  // namespace VMQ
