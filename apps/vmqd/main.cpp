// vmqd: the process that the component runs in.

#include <limits.h>
#include <malloc.h>
#include <signal.h>
#include <sys/eventfd.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

#include "apps/vmqd/command_line.h"
#include "apps/vmqd/component_loader.h"
#include "apps/vmqd/config.h"
#include "apps/vmqd/environment.h"
#include "apps/vmqd/file_systems.h"
#include "apps/vmqd/http_server.h"
#include "apps/vmqd/listening_socket.h"
#include "apps/vmqd/log.h"
#include "apps/vmqd/notify.h"
#include "apps/vmqd/routes.h"
#include "apps/vmqd/service.h"

namespace {

using namespace vmqd;

/// Blocked, not ignored: children inherit what is ignored. Threads inherit what is blocked. SIGPIPE: a client or a
/// service manager that has gone must not end the daemon.
sigset_t blockSignals() {
  sigset_t ending;
  sigemptyset(&ending);
  sigaddset(&ending, SIGTERM);
  sigaddset(&ending, SIGINT);
  sigset_t blocked = ending;
  sigaddset(&blocked, SIGPIPE);
  if (const int error = pthread_sigmask(SIG_BLOCK, &blocked, nullptr)) {
    throw std::runtime_error(withReason("signals", error));
  }
  return ending;
}

/// Packets are large and come on many threads. Left to itself, the allocator would soon keep such blocks, for each
/// thread its own.
void giveLargeBlocksBack() {
  constexpr int large = 256 * 1024;
  (void)mallopt(M_MMAP_THRESHOLD, large);  // without it, more memory is kept
}

const char* waitForEnding(const sigset_t& ending) {
  int signal;
  while (true) {
    if (sigwait(&ending, &signal) == 0) return signal == SIGTERM ? "SIGTERM" : "SIGINT";
  }
}

std::string hostName() {
  char name[HOST_NAME_MAX + 1] = "";
  if (gethostname(name, sizeof name) != 0) throw std::runtime_error(withReason("the host has no name", errno));
  return name;
}

/// The users that the mode of the socket keeps out.
std::vector<uid_t> guestsOf(const Configuration& configuration) {
  std::vector<uid_t> guests = configuration.allowed_uids;
  guests.erase(std::remove_if(guests.begin(), guests.end(), [](uid_t user) { return user == 0 || user == geteuid(); }),
               guests.end());
  return guests;
}

/// Every client takes a descriptor and every watcher one more; the component takes some for each program it runs.
void warnOfTooFewDescriptors(unsigned maximum_connections) {
  constexpr rlim_t others = 64;
  const rlim_t needed = rlim_t{maximum_connections} * 2 + others;
  rlimit limit{};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0 || limit.rlim_cur >= needed) return;
  logWarning("maximum_connections may take " + std::to_string(needed) + " descriptors, but the process has only " +
             std::to_string(limit.rlim_cur));
}

void warn(const Service& service) {
  const std::string& depot = service.settings.depot.empty() ? service.settings.home : service.settings.depot;
  const std::string work = service.settings.home + "/tmp";  // where line ends of pushed files are converted
  if (onDifferentFileSystems(depot, work)) {
    logWarning("the depot " + depot + " and the home " + service.settings.home +
               " are on different file systems: files that are pushed with a conversion of line ends will fail");
  }
  std::error_code ignored;  // what cannot be looked at is no directory
  if (!std::filesystem::is_directory(work, ignored)) {
    logWarning("the home has no directory " + work + ": line ends of files that are pushed will not be converted");
  }
  if (service.tables.empty()) logWarning("the component has registered no tables");
}

/// The script around an installer that restarts the daemon removes the outcome of the one before by its bare name,
/// "rc.txt", so it has to begin in the depot: elsewhere it would spare that outcome, and remove what is none.
/// REQUIRES: everything that a relative path names is open, and the component has made the depot.
void workInDepot(const ServiceSettings& settings) {
  const std::string& depot = settings.depot.empty() ? settings.home : settings.depot;
  const bool is_relative = depot.front() != '/';  // from the environment that vmqd was started with
  if (is_relative || chdir(depot.c_str()) == 0 || errno == ENOENT) return;  // without a depot nothing is installed
  logWarning(withReason("the depot " + depot + " cannot be worked in", errno));
}

void tell(const ServiceManager& manager, const char* state) {
  if (const int error = manager.notify(state)) logWarning(withReason("the service manager", error));
}

int run(const Configuration& configuration) {
  giveLargeBlocksBack();
  const sigset_t ending = blockSignals();
  const ServiceManager manager;
  ListeningSocket socket(configuration.socket, guestsOf(configuration));
  const Descriptor stop(eventfd(0, EFD_CLOEXEC));
  if (!stop) throw std::runtime_error(withReason("no event descriptor", errno));

  ServiceSettings settings;
  settings.node = configuration.node.empty() ? hostName() : configuration.node;
  settings.event_buffer_rows = configuration.event_buffer_rows;
  settings.maximum_watchers = configuration.maximum_connections / 4 * 3;
  settings.maximum_packet_bytes = configuration.maximum_packet_bytes;
  settings.stop = stop.get();

  applyEnvironment(configuration);
  settings.home = configuration.home;
  settings.depot = environmentValue("QORDEPLOY_AGENTDEPOT");
  vmqhost::setOriginNode(settings.node);
  loadComponent(configuration.library.empty() ? defaultLibrary() : configuration.library);
  workInDepot(settings);

  Service service(settings, vmqhost::listTables());
  warn(service);
  warnOfTooFewDescriptors(configuration.maximum_connections);
  HttpServer server(
      socket, AdmittedUsers(configuration.allowed_uids),
      {configuration.maximum_request_bytes, configuration.maximum_packet_bytes, configuration.packet_memory_bytes,
       configuration.maximum_connections, configuration.client_seconds},
      carriesPacket, [&service](Request& request, Reply& reply) { answer(service, request, reply); });
  logLine("version " VMQ_VERSION " listening on " + socket.path());
  tell(manager, "READY=1");

  logLine(std::string("stopping: ") + waitForEnding(ending));
  tell(manager, "STOPPING=1");
  (void)eventfd_write(stop.get(), 1);
  const unsigned working = server.stop(std::chrono::seconds(configuration.stop_seconds));
  if (working > 0) {
    logWarning("stopped; queries that still run, and will not be answered: " + std::to_string(working));
    socket.remove();
    _exit(0);
  }
  logLine("stopped");
  return 0;
}

}  // namespace

int main(int count, char** arguments) {
  int exit_code = 0;
  const auto options = readCommandLine(count, arguments, &exit_code);
  if (!options) return exit_code;
  try {
    const Configuration configuration = readConfiguration(options->config);
    if (!options->check) return run(configuration);
    checkEnvironment(configuration);
    logLine(options->config + " is in order");
    return 0;
  } catch (const ConfigurationError& error) {
    logError(error.what());
    return exitUsage;
  } catch (const std::exception& error) {
    logError(error.what());
    return 1;
  }
}
