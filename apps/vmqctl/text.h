#pragma once
// Text from elsewhere, made fit for a person's terminal: nothing in it can move the cursor, colour or hide anything.

#include <cstdint>
#include <string>
#include <string_view>

namespace vmqctl {

enum class Charset { Utf8, Ascii };

/// The text (UTF-8) in one line: "\n", "\t", "\r", "\\", "\x1b" for control characters, "\u{202e}" for what does not
/// print or changes the direction of writing, "\xff" for bytes that are not UTF-8. With Charset::Ascii every character
/// above 126 is escaped, for terminals that do not read UTF-8 and would take a part of a character as a command.
std::string escaped(std::string_view text, Charset charset);

/// "1 second", "2 seconds".
std::string counted(std::uint64_t count, const char* what);

struct Extent {
  std::size_t bytes = 0;
  std::size_t columns = 0;
};

/// The longest beginning of text that takes at most `limit` columns of a terminal.
/// REQUIRES: text is a result of escaped(), or printable UTF-8.
Extent within(std::string_view text, std::size_t limit);

/// How many columns of a terminal the text takes. REQUIRES: as above.
std::size_t displayWidth(std::string_view text);

/// Makes the routines above know the printable characters of UTF-8, whatever the user's locale is.
/// To be called once, before other threads.
void useUtf8Characters();

}  // namespace vmqctl
