// Ctrl-C through a descriptor.

#include "apps/vmqctl/interrupts.h"

#include <poll.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <system_error>

namespace vmqctl {

Interrupts::Interrupts() {
  sigset_t signals;
  sigemptyset(&signals);
  for (const int number : {SIGINT, SIGTERM}) {
    struct sigaction current = {};
    // A blocked signal is kept even when it is ignored, so an ignored one must not be blocked.
    if (sigaction(number, nullptr, &current) == 0 && current.sa_handler != SIG_IGN) sigaddset(&signals, number);
  }
  descriptor_ = signalfd(-1, &signals, SFD_CLOEXEC | SFD_NONBLOCK);
  if (descriptor_ < 0) throw std::system_error(errno, std::generic_category(), "signalfd");
  if (sigprocmask(SIG_BLOCK, &signals, nullptr) != 0) {
    const int error = errno;
    (void)close(descriptor_);  // nothing was written to it
    throw std::system_error(error, std::generic_category(), "sigprocmask");
  }
}

// The signals stay blocked: one that is already pending would end the process on its way out, with another exit code.
Interrupts::~Interrupts() {
  (void)close(descriptor_);
}

bool Interrupts::arrived() const {
  pollfd entry = {descriptor_, POLLIN, 0};
  return poll(&entry, 1, 0) == 1;
}

}  // namespace vmqctl
