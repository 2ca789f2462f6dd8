// Reads the configuration file.

#include "apps/vmqd/config.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>

#include "apps/vmqd/config_values.h"
#include "apps/vmqd/descriptor.h"
#include "apps/vmqd/log.h"

namespace vmqd {
namespace {

constexpr std::string_view environmentPrefix = "environment.";
constexpr size_t largestFileBytes = 1 << 20;
constexpr unsigned smallestPacket = 8192;  // holds at least one block of a file

struct Key {
  std::string_view name;
  std::string_view variable;  ///< the environment variable that the value is also put into; empty: none
  void (*set)(Configuration& configuration, std::string_view value);
  std::string_view help;
};

/// For what only goes into a variable.
template <auto check>
void checked(Configuration&, std::string_view value) {
  (void)check(value);
}
std::string anyText(std::string_view value) {
  return std::string(value);
}
std::string pathOrNothing(std::string_view value) {
  return value.empty() ? std::string() : absolutePath(value);
}
unsigned commandTimeout(std::string_view value) {
  return number(value, 1, 7 * 24 * 3600);
}

constexpr Key keys[] = {
    {"socket", "", [](auto& c, auto v) { c.socket = socketPath(v); },
     "path of the socket (/run/vmqd/vmqd.sock); its directory must exist"},
    {"library", "", [](auto& c, auto v) { c.library = absolutePath(v); },
     "path of libvmq.so (the one installed with this program)"},
    {"home", "CORVELHOME", [](auto& c, auto v) { c.home = existingDirectory(plainPath(v)); },
     "installation home of the agents; required"},
    {"depot", "QORDEPLOY_AGENTDEPOT", checked<plainPath>, "where deployed files arrive (the home)"},
    {"node", "", [](auto& c, auto v) { c.node = nodeName(v); }, "name of this node (the host name)"},
    {"trace", "KBB_RAS1", checked<anyText>, "what the component traces, such as error,tasks/=all (error)"},
    {"trace_log", "KBB_RAS1_LOG", checked<pathOrNothing>, "file that traces are appended to (standard error)"},
    {"command_timeout_seconds", "TIMEOUT", checked<commandTimeout>, "how long a command of a task may run (no limit)"},
    {"allowed_uids", "", [](auto& c, auto v) { c.allowed_uids = userIds(v); },
     "numbers of the users who may connect beside root and the daemon's own, joined by \",\""},
    {"event_buffer_rows", "", [](auto& c, auto v) { c.event_buffer_rows = number(v, 1, 1000000); },
     "rows kept for a watcher that is slow to read (1000)"},
    {"maximum_request_bytes", "", [](auto& c, auto v) { c.maximum_request_bytes = number(v, 1024, 1 << 28); },
     "largest body of a request (1048576)"},
    {"maximum_packet_bytes", "", [](auto& c, auto v) { c.maximum_packet_bytes = number(v, smallestPacket, 1 << 28); },
     "largest packet of a remote call, such as a piece of a pushed file (4194304)"},
    {"packet_memory_bytes", "", [](auto& c, auto v) { c.packet_memory_bytes = number(v, smallestPacket, 1u << 31); },
     "packets of all clients together; calls beyond it are told to wait (33554432)"},
    {"maximum_connections", "", [](auto& c, auto v) { c.maximum_connections = number(v, 4, 10000); },
     "clients at a time; at most three quarters of them may watch (256)"},
    {"client_seconds", "", [](auto& c, auto v) { c.client_seconds = number(v, 1, 24 * 3600); },
     "how long a client may take for its next request, and for reading its reply (60)"},
    {"stop_seconds", "", [](auto& c, auto v) { c.stop_seconds = number(v, 0, 3600); },
     "how long a stop waits for queries that still run (5)"},
};

bool isVariableName(std::string_view name) {
  constexpr std::string_view letters = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ_";
  if (name.empty() || letters.find(name.front()) == std::string_view::npos) return false;
  return std::all_of(name.begin(), name.end(),
                     [&](char c) { return letters.find(c) != std::string_view::npos || (c >= '0' && c <= '9'); });
}

void setVariable(Configuration& configuration, std::string_view name, std::string_view value) {
  if (!isVariableName(name)) throw BadValue("is not the name of an environment variable");
  for (const Key& key : keys) {
    if (key.variable == name) throw BadValue("is set by the key \"" + std::string(key.name) + "\"");
  }
  configuration.variables.emplace_back(name, value);
}

void set(Configuration& configuration, std::string_view name, std::string_view value) {
  const auto isControl = [](char c) { return (static_cast<unsigned char>(c) < 0x20 && c != '\t') || c == 0x7F; };
  if (std::any_of(value.begin(), value.end(), isControl)) throw BadValue("must not hold control characters");
  if (value.find(" #") != std::string_view::npos || value.find("\t#") != std::string_view::npos) {
    throw BadValue("a comment needs a line of its own");
  }
  if (name.substr(0, environmentPrefix.size()) == environmentPrefix) {
    return setVariable(configuration, name.substr(environmentPrefix.size()), value);
  }
  for (const Key& key : keys) {
    if (key.name != name) continue;
    key.set(configuration, value);
    if (!key.variable.empty()) configuration.variables.emplace_back(key.variable, value);
    return;
  }
  throw BadValue("is not a known key");
}

void readLine(Configuration& configuration, const std::string& place, std::string_view line) {
  line = trimmed(line);
  if (line.empty() || line.front() == '#') return;
  const size_t equals = line.find('=');
  if (equals == std::string_view::npos || equals == 0)
    throw ConfigurationError(place + ": is not of the form \"key = value\"");
  const std::string name(trimmed(line.substr(0, equals)));
  const std::string where = place + ": " + name;
  try {
    if (!configuration.places.emplace(name, where).second) throw BadValue("is set twice");
    set(configuration, name, trimmed(line.substr(equals + 1)));
  } catch (const BadValue& wrong) {
    throw ConfigurationError(where + ": " + wrong.what());
  }
}

/// A packet for which there is never room could never be sent.
void checkPacketMemory(const Configuration& configuration, const std::string& file) {
  if (configuration.packet_memory_bytes >= configuration.maximum_packet_bytes) return;
  const auto& places = configuration.places;
  auto place = places.find("packet_memory_bytes");
  if (place == places.end()) place = places.find("maximum_packet_bytes");
  throw ConfigurationError((place == places.end() ? file : place->second) + ": packet_memory_bytes (" +
                           std::to_string(configuration.packet_memory_bytes) +
                           ") must not be less than maximum_packet_bytes (" +
                           std::to_string(configuration.maximum_packet_bytes) + ")");
}

}  // namespace

Configuration parseConfiguration(const std::string& file, std::string_view text) {
  Configuration configuration;
  unsigned number = 0;
  for (size_t begin = 0; begin < text.size();) {
    const size_t end = std::min(text.find('\n', begin), text.size());
    readLine(configuration, file + ":" + std::to_string(++number), text.substr(begin, end - begin));
    begin = end + 1;
  }
  if (configuration.home.empty()) throw ConfigurationError(file + ": home: is missing");
  checkPacketMemory(configuration, file);
  return configuration;
}

Configuration readConfiguration(const std::string& file) {
  const Descriptor opened(open(file.c_str(), O_RDONLY | O_CLOEXEC));
  if (!opened) throw ConfigurationError(withReason(file, errno));
  struct stat status;
  if (fstat(opened.get(), &status) != 0) throw ConfigurationError(withReason(file, errno));
  if (!S_ISREG(status.st_mode)) throw ConfigurationError(file + ": is not a file");
  // It names the library that the daemon loads, mostly as root.
  if ((status.st_mode & S_IWOTH) != 0) throw ConfigurationError(file + ": every user may write to it");
  std::string text;
  char block[4096];
  ssize_t count;
  while ((count = read(opened.get(), block, sizeof block)) > 0) {
    text.append(block, static_cast<size_t>(count));
    if (text.size() > largestFileBytes) throw ConfigurationError(file + ": is larger than any configuration");
  }
  if (count < 0) throw ConfigurationError(withReason(file, errno));
  return parseConfiguration(file, text);
}

std::vector<std::pair<std::string_view, std::string_view>> configurationKeys() {
  std::vector<std::pair<std::string_view, std::string_view>> result;
  for (const Key& key : keys) result.emplace_back(key.name, key.help);
  result.emplace_back("environment.NAME", "value of any other environment variable");
  return result;
}

}  // namespace vmqd
