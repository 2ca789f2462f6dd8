#include "tests/apps/vmqd/test_daemon.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

Gate::Gate(const std::string& path) : path_(path) {
  if (mkfifo(path_.c_str(), 0600) != 0) throw std::system_error(errno, std::generic_category(), path_);
}

Gate::~Gate() {
  open();
}

void Gate::waitForQuery() {
  writer_ = ::open(path_.c_str(), O_WRONLY | O_CLOEXEC);  // comes back when there is a reader
  if (writer_ < 0) throw std::system_error(errno, std::generic_category(), path_);
}

void Gate::open() {
  if (writer_ >= 0) close(writer_);
  writer_ = -1;
}
