// The daemon's configuration file. What is wrong is told in one line with its place; other line ends, blank lines and
// comments make no difference.

#include <string>

#include "apps/vmqd/config.h"
#include "fuzz/support.h"

namespace {

constexpr std::string_view file = "vmqd.conf";

struct Outcome {
  std::string error;
  vmqd::Configuration configuration;
};

Outcome read(const std::string& text) {
  Outcome outcome;
  try {
    outcome.configuration = vmqd::parseConfiguration(std::string(file), text);
  } catch (const vmqd::ConfigurationError& wrong) {
    outcome.error = wrong.what();
    fuzz::require(outcome.error.starts_with(std::string(file) + ":"), "an error begins with the file");
    fuzz::require(outcome.error.find('\n') == std::string::npos, "and is one line");
  }
  return outcome;
}

bool areSame(const Outcome& one, const Outcome& other) {
  const vmqd::Configuration& a = one.configuration;
  const vmqd::Configuration& b = other.configuration;
  return one.error == other.error && a.socket == b.socket && a.library == b.library && a.node == b.node &&
         a.home == b.home && a.variables == b.variables && a.allowed_uids == b.allowed_uids &&
         a.event_buffer_rows == b.event_buffer_rows && a.maximum_request_bytes == b.maximum_request_bytes &&
         a.maximum_packet_bytes == b.maximum_packet_bytes && a.packet_memory_bytes == b.packet_memory_bytes &&
         a.maximum_connections == b.maximum_connections && a.client_seconds == b.client_seconds &&
         a.stop_seconds == b.stop_seconds && a.places == b.places;
}

std::string withDosLineEnds(const std::string& text) {
  std::string result;
  for (const char c : text) result += c == '\n' ? "\r\n" : std::string(1, c);
  return result;
}

void requireLimits(const vmqd::Configuration& configuration) {
  fuzz::require(!configuration.home.empty() && configuration.home.front() == '/', "the home is an absolute path");
  fuzz::require(configuration.socket.front() == '/' && configuration.socket.size() < 108, "the socket has an address");
  fuzz::require(configuration.packet_memory_bytes >= configuration.maximum_packet_bytes, "a packet has room");
  fuzz::require(configuration.maximum_connections >= 4 && configuration.event_buffer_rows >= 1 &&
                    configuration.client_seconds >= 1 && configuration.client_seconds <= 24 * 3600,
                "numbers have limits");
  for (const auto& [name, value] : configuration.variables) {
    fuzz::require(!name.empty() && name.find_first_of(std::string_view("=\0", 2)) == std::string::npos &&
                      value.find('\0') == std::string::npos,
                  "variables can be put into the environment");
  }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  const Outcome outcome = read(text);
  if (outcome.error.empty()) requireLimits(outcome.configuration);
  fuzz::require(areSame(outcome, read(withDosLineEnds(text))), "DOS line ends make no difference");
  fuzz::require(areSame(outcome, read(text + "\n# comment\n\n \t\n")), "what says nothing makes no difference");
  return 0;
}
