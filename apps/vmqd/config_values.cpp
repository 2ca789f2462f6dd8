// The values a configuration file may give to its keys.

#include "apps/vmqd/config_values.h"

#include <sys/un.h>

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <limits>
#include <system_error>

namespace vmqd {
namespace {

constexpr size_t nodeBytes = 64;

/// False also for signs and blanks, which from_chars would take or leave.
template <typename Number>
bool parse(std::string_view text, Number* result) {
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), *result);
  return error == std::errc() && end == text.data() + text.size() && text.front() != '-';
}

}  // namespace

std::string_view trimmed(std::string_view text) {
  constexpr std::string_view blanks = " \t\r";
  const size_t first = text.find_first_not_of(blanks);
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

std::string absolutePath(std::string_view value) {
  if (value.empty() || value.front() != '/') throw BadValue("must be an absolute path");
  return std::string(value);
}

std::string existingDirectory(std::string_view value) {
  std::string path = absolutePath(value);
  std::error_code error;
  if (!std::filesystem::is_directory(path, error)) {
    throw BadValue(path + (error ? ": " + error.message() : " is not a directory"));
  }
  return path;
}

std::string plainPath(std::string_view value) {
  std::string path = absolutePath(value);
  if (path.find_first_of(" \t|&;<>()$`\\\"'*?[]{}!^#~") != std::string::npos) {
    throw BadValue("must not hold white space or characters that a shell interprets");
  }
  return path;
}

std::string socketPath(std::string_view value) {
  std::string path = absolutePath(value);
  constexpr size_t longest = sizeof(sockaddr_un::sun_path) - 1;
  if (path.size() > longest) throw BadValue("must be at most " + std::to_string(longest) + " bytes long");
  if (path.back() == '/') throw BadValue("must name a socket, not a directory");
  return path;
}

unsigned number(std::string_view value, unsigned minimum, unsigned maximum) {
  unsigned result = 0;
  if (value.empty() || !parse(value, &result) || result < minimum || result > maximum) {
    throw BadValue("must be a number from " + std::to_string(minimum) + " to " + std::to_string(maximum));
  }
  return result;
}

std::vector<uid_t> userIds(std::string_view value) {
  std::vector<uid_t> ids;
  for (size_t begin = 0; begin <= value.size();) {
    const size_t end = std::min(value.find(',', begin), value.size());
    const std::string_view item = trimmed(value.substr(begin, end - begin));
    uid_t id = 0;
    // The highest number stands for "no user" in the system's calls.
    if (item.empty() || !parse(item, &id) || id == std::numeric_limits<uid_t>::max()) {
      throw BadValue("must be numbers of users joined by \",\"");
    }
    ids.push_back(id);
    begin = end + 1;
  }
  return ids;
}

std::string nodeName(std::string_view value) {
  if (value.empty() || value.size() > nodeBytes || value.find_first_of(" \t") != std::string_view::npos) {
    throw BadValue("must be a name of 1 to " + std::to_string(nodeBytes) + " bytes without blanks");
  }
  return std::string(value);
}

}  // namespace vmqd
