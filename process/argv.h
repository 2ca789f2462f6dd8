#pragma once
// From a command line to the words that a program is started with.

#include "util/string.h"

namespace VMQ {

/// The most words that a command line may have: the count that MakeArgv returns is a `char`.
inline constexpr int kMaximumWords = 127;

/// Splits a command line at its blanks. A stretch between two quotes (single or double, not told apart) keeps its
/// blanks. Stores a new null-terminated list of new words in `*argv`, which the caller frees with freeArgv. Returns the
/// number of words, or -1 with `errno` EINVAL, and a trace, when an argument is null; then nothing is stored.
///
/// Kept on purpose:
/// - The count is a `char`. Above 127 words it does not fit and means nothing; the list itself is complete. Whoever may
///   meet such a line counts the list (Process::start refuses it).
/// - A quote inside a word ends the word that is counted, so `ab"cd"` gives only `ab`.
/// - Blanks at the end give one empty word. A line that begins with a blank or a quote gives an empty first word.
/// - A backslash before a quote makes it an ordinary character and stays in the word.
char MakeArgv(const String* command, char*** argv);

/// Frees a list made by MakeArgv; null is ignored.
void freeArgv(char** argv);

}  // namespace VMQ
