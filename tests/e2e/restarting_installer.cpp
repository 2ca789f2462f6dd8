#include "tests/e2e/restarting_installer.h"

#include <poll.h>
extern "C" {
#include <sys/pidfd.h>  // in glibc 2.36 without C++ linkage of its own
}
#include <signal.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

namespace fs = std::filesystem;

SuccessorDaemon::SuccessorDaemon(const std::string& pid_file) {
  std::ifstream(pid_file) >> pid_;
  if (pid_ > 1) process_ = pidfd_open(pid_, 0);
  EXPECT_GE(process_, 0) << "no daemon is named in " << pid_file;
}

SuccessorDaemon::~SuccessorDaemon() {
  if (process_ < 0) return;
  (void)pidfd_send_signal(process_, SIGKILL, nullptr, 0);
  close(process_);
}

bool SuccessorDaemon::stop() {
  if (process_ < 0 || pidfd_send_signal(process_, SIGTERM, nullptr, 0) != 0) return false;
  pollfd watched{process_, POLLIN, 0};
  return poll(&watched, 1, 60000) == 1;
}

bool exitCodeIsKept(const DaemonFixture& daemon) {
  const std::string file = daemon.depot() + "/rc.txt";
  return soon([&] { return fs::exists(file) && fs::file_size(file) > 0; });
}

std::string stageRestartingInstaller(DaemonFixture& daemon, const SampleHome& home, const std::string& then) {
  // By a name in the home, so that the successor's command line tells whose it is.
  const std::string configuration = home / "vmqd.conf";
  fs::copy_file(daemon.config(), configuration, fs::copy_options::overwrite_existing);
  const std::string pid_file = home / "vmqd.pid";
  const std::string installer = daemon.depot() + "/ux/010100000/restart.sh";
  const std::string old = std::to_string(daemon.process().pid());
  std::ofstream(installer) << "#!/bin/sh\n"
                              "\"${0%/*}/install.sh\" \"$@\" || exit\n"
                              "kill " +
                                  old +
                                  "\n"
                                  "while kill -0 " +
                                  old +
                                  " 2>/dev/null; do sleep 0.1; done\n"
                                  "setsid " VMQ_PROGRAMS "/vmqd --config " +
                                  configuration + " </dev/null >>" + (home / "logs/vmqd.log") +
                                  " 2>&1 &\n"
                                  "echo $! >" +
                                  pid_file +
                                  "\n"
                                  "until " VMQ_PROGRAMS "/vmqctl status --socket " +
                                  // cppcheck-suppress ignoredReturnValue ; it is a part of the text
                                  daemon.socket() +
                                  " >/dev/null 2>&1; do sleep 0.1; done\n"
                                  "echo vmqd restarted\n" +
                                  then + "\n";
  fs::permissions(installer, fs::perms(0770));
  fs::create_directories(home / "logs");
  return pid_file;
}
