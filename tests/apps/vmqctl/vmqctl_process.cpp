#include "tests/apps/vmqctl/vmqctl_process.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <pty.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <system_error>

namespace {

[[noreturn]] void fail(const char* what) {
  throw std::system_error(errno, std::generic_category(), what);
}

void makePipe(int& readEnd, int& writeEnd) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) fail("pipe2");
  readEnd = ends[0];
  writeEnd = ends[1];
}

void makeTerminal(unsigned short columns, int& master, int& slave) {
  winsize size = {};
  size.ws_row = 24;
  size.ws_col = columns;
  if (openpty(&master, &slave, nullptr, nullptr, &size) != 0) fail("openpty");
  for (const int end : {master, slave}) (void)fcntl(end, F_SETFD, FD_CLOEXEC);  // cannot fail on a descriptor just made
}

void closeIf(int& descriptor) {
  if (descriptor >= 0) (void)close(descriptor);  // only read from
  descriptor = -1;
}

std::vector<std::string> childEnvironment(const std::vector<std::string>& added) {
  std::vector<std::string> result;
  for (char** entry = environ; *entry != nullptr; ++entry) {
    const std::string text = *entry;
    const std::string name = text.substr(0, text.find('='));
    const bool ours =
        name == "TERM" || name == "LANG" || name.rfind("LC_", 0) == 0 || name == "NO_COLOR" || name == "VMQ_SOCKET";
    if (!ours) result.push_back(text);
  }
  result.insert(result.end(), {"TERM=xterm", "LANG=C.UTF-8"});
  for (const std::string& text : added) {  // in place of one of the same name
    const std::string start = text.substr(0, text.find('=') + 1);
    std::erase_if(result, [&](const std::string& other) { return other.rfind(start, 0) == 0; });
    result.push_back(text);
  }
  return result;
}

std::vector<char*> pointers(std::vector<std::string>& texts) {
  std::vector<char*> result;
  for (std::string& text : texts) result.push_back(text.data());
  result.push_back(nullptr);
  return result;
}

}  // namespace

VmqctlProcess::VmqctlProcess(std::vector<std::string> arguments, VmqctlOptions options) {
  int childOut = -1;
  int childErr = -1;
  if (options.terminal == Terminal::None) {
    makePipe(err_, childErr);
  } else {
    makeTerminal(options.columns, err_, childErr);
  }
  if (options.terminal == Terminal::ForBoth) {
    std::swap(out_, err_);  // one stream, kept as the output
    childOut = childErr;
  } else if (options.outputFile.empty()) {
    makePipe(out_, childOut);
  } else {
    childOut = open(options.outputFile.c_str(), O_WRONLY | O_CLOEXEC);
    if (childOut < 0) fail("open");
  }

  arguments.insert(arguments.begin(), options.program);
  if (options.asNobody && geteuid() == 0) {
    arguments.insert(arguments.begin(), {"setpriv", "--reuid=65534", "--regid=65534", "--clear-groups", "--"});
  }
  std::vector<std::string> environment = childEnvironment(options.environment);

  posix_spawn_file_actions_t files;
  posix_spawnattr_t attributes;
  posix_spawn_file_actions_init(&files);
  posix_spawn_file_actions_adddup2(&files, childOut, STDOUT_FILENO);
  posix_spawn_file_actions_adddup2(&files, childErr, STDERR_FILENO);
  posix_spawnattr_init(&attributes);
  sigset_t signals;
  sigemptyset(&signals);
  posix_spawnattr_setsigmask(&attributes, &signals);
  for (const int number : {SIGINT, SIGTERM, SIGPIPE}) sigaddset(&signals, number);
  posix_spawnattr_setsigdefault(&attributes, &signals);  // whoever runs the tests may ignore them
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF);
  const int error = posix_spawnp(&pid_, arguments.front().c_str(), &files, &attributes, pointers(arguments).data(),
                                 pointers(environment).data());
  posix_spawn_file_actions_destroy(&files);
  posix_spawnattr_destroy(&attributes);
  closeIf(childErr);
  if (options.terminal != Terminal::ForBoth) closeIf(childOut);
  if (error != 0) throw std::system_error(error, std::generic_category(), arguments.front());
}

VmqctlProcess::~VmqctlProcess() {
  if (pid_ > 0) {
    (void)kill(pid_, SIGKILL);  // not reaped yet, so the id is still its own
    (void)waitpid(pid_, nullptr, 0);
  }
  closeIf(out_);
  closeIf(err_);
}

bool VmqctlProcess::read() {
  if (out_ < 0 && err_ < 0) return false;
  pollfd entries[] = {{out_, POLLIN, 0}, {err_, POLLIN, 0}};
  if (poll(entries, 2, 30000) <= 0) {
    ADD_FAILURE() << "vmqctl has been silent for 30 seconds; so far: " << result_.out << "\n" << result_.err;
    return false;
  }
  int* const descriptors[] = {&out_, &err_};
  std::string* const texts[] = {&result_.out, &result_.err};
  for (int i = 0; i < 2; ++i) {
    if (entries[i].revents == 0) continue;
    char buffer[4096];
    const ssize_t count = ::read(*descriptors[i], buffer, sizeof buffer);
    if (count > 0) {
      texts[i]->append(buffer, static_cast<std::size_t>(count));
    } else if (count == 0 || errno != EINTR) {
      closeIf(*descriptors[i]);  // a terminal ends with EIO
    }
  }
  return true;
}

void VmqctlProcess::await(const std::string& stream, const std::string& text) {
  while (stream.find(text) == std::string::npos) {
    if (!read()) {
      ADD_FAILURE() << "never came: " << text << "\nonly: " << stream;
      return;
    }
  }
}

void VmqctlProcess::awaitOutput(const std::string& text) {
  await(result_.out, text);
}
void VmqctlProcess::awaitErrors(const std::string& text) {
  await(result_.err, text);
}

void VmqctlProcess::signal(int number) const {
  ASSERT_EQ(kill(pid_, number), 0) << std::strerror(errno);
}

VmqctlResult VmqctlProcess::finish() {
  while (read()) {
  }
  if (testing::Test::HasFailure()) (void)kill(pid_, SIGKILL);  // do not wait for one that hangs
  int status = 0;
  if (waitpid(pid_, &status, 0) != pid_) fail("waitpid");
  pid_ = -1;
  result_.code = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  return result_;
}

VmqctlResult runVmqctl(std::vector<std::string> arguments, VmqctlOptions options) {
  return VmqctlProcess(std::move(arguments), std::move(options)).finish();
}

std::string copyOfVmqctl(const TemporaryDirectory& directory) {
  namespace fs = std::filesystem;
  const std::string copy = directory / "vmqctl";
  const fs::perms forAll = fs::perms::owner_all | fs::perms::group_read | fs::perms::group_exec |
                           fs::perms::others_read | fs::perms::others_exec;
  fs::copy_file(VMQCTL_PROGRAM, copy);
  fs::permissions(copy, forAll);
  fs::permissions(directory.path(), forAll);
  return copy;
}
