#pragma once
// What vmqd is told by its configuration file. docs/vmqd.md is the reference.

#include <sys/types.h>

#include <map>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace vmqd {

struct Configuration {
  std::string socket = "/run/vmqd/vmqd.sock";
  std::string library;  ///< empty: the one installed with this program
  std::string node;     ///< empty: the host's name
  std::string home;
  /// Environment variables, in the order of the file: NAME and value.
  std::vector<std::pair<std::string, std::string>> variables;
  std::vector<uid_t> allowed_uids;  ///< beside root and the daemon's own
  unsigned event_buffer_rows = 1000;
  unsigned maximum_request_bytes = 1 << 20;
  unsigned maximum_packet_bytes = 4 << 20;
  unsigned packet_memory_bytes = 32 << 20;
  unsigned maximum_connections = 256;
  unsigned client_seconds = 60;
  unsigned stop_seconds = 5;

  /// Where each key of the file stands, "FILE:LINE: KEY", for what turns out to be wrong later.
  std::map<std::string, std::string, std::less<>> places;
};

/// what() is "FILE:LINE: KEY: what is wrong", or "FILE: what is wrong".
class ConfigurationError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Reads and checks a whole file. Throws ConfigurationError at the first thing that is wrong.
Configuration readConfiguration(const std::string& file);

/// The same for a text that was read from `file`.
Configuration parseConfiguration(const std::string& file, std::string_view text);

/// Every key with one line of explanation, for --help.
std::vector<std::pair<std::string_view, std::string_view>> configurationKeys();

}  // namespace vmqd
