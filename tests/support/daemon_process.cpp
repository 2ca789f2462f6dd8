#include "tests/support/daemon_process.h"

#include <fcntl.h>
#include <poll.h>
extern "C" {
#include <sys/pidfd.h>  // in glibc 2.36 without C++ linkage of its own
}
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <system_error>

namespace {

constexpr int patienceMilliseconds = 60000;

[[noreturn]] void fail(const char* what) {
  throw std::system_error(errno, std::generic_category(), what);
}

/// A name of the abstract name space, so that nothing is left in the file system.
std::string newNotifyName() {
  static std::atomic<unsigned> count{0};
  return "@vmq-test-" + std::to_string(getpid()) + "-" + std::to_string(count++);
}

int listenForNotifications(const std::string& name) {
  const int descriptor = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
  if (descriptor < 0) fail("socket");
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::memcpy(address.sun_path + 1, name.data() + 1, name.size() - 1);
  const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + name.size());
  if (bind(descriptor, reinterpret_cast<const sockaddr*>(&address), length) != 0) fail("bind");
  return descriptor;
}

/// The environment of this process, but for the one variable.
std::vector<std::string> environmentWith(const std::string& name, const std::string& value) {
  std::vector<std::string> variables{name + "=" + value};
  for (char** each = environ; *each != nullptr; ++each) {
    if (std::strncmp(*each, (name + "=").c_str(), name.size() + 1) != 0) variables.emplace_back(*each);
  }
  return variables;
}

std::vector<char*> pointersTo(const std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (const auto& text : texts) pointers.push_back(const_cast<char*>(text.c_str()));
  pointers.push_back(nullptr);
  return pointers;
}

}  // namespace

DaemonProcess::DaemonProcess(const std::vector<std::string>& arguments, const std::string& log) {
  const std::string name = newNotifyName();
  notifications_ = listenForNotifications(name);
  const int output = open(log.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600);
  if (output < 0) fail(log.c_str());
  std::vector<std::string> words{VMQ_DAEMON};
  words.insert(words.end(), arguments.begin(), arguments.end());
  const std::vector<char*> argv = pointersTo(words);
  const std::vector<std::string> variables = environmentWith("NOTIFY_SOCKET", name);
  const std::vector<char*> envp = pointersTo(variables);
  const pid_t parent = getpid();
  pid_ = fork();
  if (pid_ < 0) fail("fork");
  if (pid_ == 0) {
    // A test that crashes, or is killed for taking too long, leaves no daemon behind.
    if (prctl(PR_SET_PDEATHSIG, SIGKILL) != 0 || getppid() != parent) _exit(126);
    if (dup2(output, STDOUT_FILENO) < 0 || dup2(output, STDERR_FILENO) < 0) _exit(126);
    sigset_t none;
    sigemptyset(&none);
    (void)sigprocmask(SIG_SETMASK, &none, nullptr);
    execve(argv[0], argv.data(), envp.data());
    _exit(127);
  }
  close(output);
  process_ = pidfd_open(pid_, 0);
  if (process_ < 0) fail("pidfd_open");
}

DaemonProcess::~DaemonProcess() {
  if (!exit_code_) {
    (void)kill(pid_, SIGKILL);
    (void)waitpid(pid_, nullptr, 0);
  }
  close(notifications_);
  close(process_);
}

std::optional<std::string> DaemonProcess::nextNotification() {
  pollfd watched[] = {{notifications_, POLLIN, 0}, {process_, POLLIN, 0}};
  const int ready = poll(watched, 2, patienceMilliseconds);
  if (ready < 0) fail("poll");
  if (ready == 0) throw std::runtime_error("vmqd does not tell whether it is ready");
  if (watched[0].revents == 0) return std::nullopt;
  char text[4096];
  const ssize_t size = recv(notifications_, text, sizeof text, 0);
  if (size < 0) fail("recv");
  return std::string(text, static_cast<size_t>(size));
}

bool DaemonProcess::waitUntilReady() {
  while (const auto text = nextNotification()) {
    if (*text == "READY=1") return true;
  }
  return false;
}

void DaemonProcess::signal(int number) const {
  if (!exit_code_ && kill(pid_, number) != 0) fail("kill");
}

int DaemonProcess::wait() {
  if (exit_code_) return *exit_code_;
  pollfd watched{process_, POLLIN, 0};
  const int ready = poll(&watched, 1, patienceMilliseconds);
  if (ready < 0) fail("poll");
  if (ready == 0) throw std::runtime_error("vmqd does not end");
  int status;
  if (waitpid(pid_, &status, 0) != pid_) fail("waitpid");
  exit_code_ = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  return *exit_code_;
}

int DaemonProcess::stop() {
  signal(SIGTERM);
  return wait();
}
