#include "tests/rpc/failing_files.h"

#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>

namespace {

struct Plan {
  std::atomic<int> callsUntilFailure = 0;  ///< 0: none is planned
  std::atomic<int> error = 0;
  std::atomic<bool> happened = false;
};
Plan plans[static_cast<int>(FileCall::kCount)];

Plan& planOf(FileCall call) {
  return plans[static_cast<int>(call)];
}

bool fails(FileCall call) {
  Plan& plan = planOf(call);
  if (plan.callsUntilFailure == 0 || --plan.callsUntilFailure > 0) return false;
  plan.happened = true;
  errno = plan.error;
  return true;
}

}  // namespace

FailingFile::FailingFile(FileCall call, int error, int nth) : call_(call) {
  Plan& plan = planOf(call);
  plan.happened = false;
  plan.error = error;
  plan.callsUntilFailure = nth;
}

FailingFile::~FailingFile() {
  planOf(call_).callsUntilFailure = 0;
}

bool FailingFile::happened() const {
  return planOf(call_).happened;
}

// The names are the linker's: what the component calls, and what it would have called. Visible, because the linker asks
// for that when a shared library (such as a sanitizer's) calls the same functions.
#pragma GCC visibility push(default)
extern "C" {

int __real_chmod(const char*, mode_t);
int __real_unlink(const char*);
int __real_link(const char*, const char*);
int __real_fclose(FILE*);
ssize_t __real_writev(int, const iovec*, int);

int __wrap_chmod(const char* path, mode_t mode) {
  return fails(FileCall::kChmod) ? -1 : __real_chmod(path, mode);
}

int __wrap_unlink(const char* path) {
  return fails(FileCall::kUnlink) ? -1 : __real_unlink(path);
}

int __wrap_link(const char* from, const char* to) {
  return fails(FileCall::kLink) ? -1 : __real_link(from, to);
}

int __wrap_fclose(FILE* stream) {
  const int result = __real_fclose(stream);
  return fails(FileCall::kFclose) ? EOF : result;
}

ssize_t __wrap_writev(int descriptor, const iovec* pieces, int count) {
  return fails(FileCall::kWritev) ? write(descriptor, pieces->iov_base, pieces->iov_len / 2)
                                  : __real_writev(descriptor, pieces, count);
}

}  // extern "C"
#pragma GCC visibility pop
