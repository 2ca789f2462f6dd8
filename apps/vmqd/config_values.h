#pragma once
// The values a configuration file may give to its keys. Each routine throws BadValue, whose text continues "KEY: ".

#include <sys/types.h>

#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace vmqd {

class BadValue : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// An absolute path.
std::string absolutePath(std::string_view value);
/// An absolute path of a directory that exists.
std::string existingDirectory(std::string_view value);
/// An absolute path that a shell reads as one word and as nothing but itself: command lines name the home, and
/// generated scripts the depot, unquoted.
std::string plainPath(std::string_view value);
/// An absolute path that fits into a socket's address.
std::string socketPath(std::string_view value);
/// A decimal number between the two, which count in.
unsigned number(std::string_view value, unsigned minimum, unsigned maximum);
/// Numbers joined by ",", blanks around them allowed.
std::vector<uid_t> userIds(std::string_view value);
/// At most as long as the node columns of the tables are wide, without blanks.
std::string nodeName(std::string_view value);

/// The text without blanks, tabs and carriage returns at its ends.
std::string_view trimmed(std::string_view text);

}  // namespace vmqd
