#include "tests/faults/faults.h"

#include <cerrno>

#include "rpc.h"

const FailingFunction kAllocation{"allocation", SystemCall::kAllocate, ENOMEM, FailingFunction::kThrows};

const std::vector<FailingFunction>& failingFunctions() {
  static const auto& kFunctions = *new std::vector<FailingFunction>{
      // ---- a child and its pipes
      {"pipe2", SystemCall::kPipe2, EMFILE},
      {"mmap", SystemCall::kMmap, ENOMEM},
      {"clone", SystemCall::kClone, EAGAIN},
      {"eventfd", SystemCall::kEventfd, EMFILE},
      {"pthread_create", SystemCall::kPthreadCreate, EAGAIN},
      {"pthread_mutex_init", SystemCall::kPthreadMutexInit, ENOMEM},
      {"pthread_cond_init", SystemCall::kPthreadCondInit, ENOMEM},
      {"dup3", SystemCall::kDup3, EBADF, FailingFunction::kIsTraced},
      {"close_range", SystemCall::kCloseRange, ENOSYS},
      {"execve", SystemCall::kExecve, ENOMEM, FailingFunction::kIsTraced},
      {"waitid", SystemCall::kWaitid, ECHILD},
      {"waitpid", SystemCall::kWaitpid, ECHILD},
      {"poll", SystemCall::kPoll, ENOMEM},
      {"read", SystemCall::kRead, EIO, FailingFunction::kIsTraced},
      {"write", SystemCall::kWrite, EIO, FailingFunction::kIsTraced},
      {"writev", SystemCall::kWritev, EIO},
      {"fcntl", SystemCall::kFcntl, EBADF, FailingFunction::kIsTraced},
      {"BSS1_TimedWait", SystemCall::kTimedWait, EINVAL},
      // ---- files and directories
      {"access", SystemCall::kAccess, EACCES},
      {"stat", SystemCall::kStat, EIO},
      {"mkdir", SystemCall::kMkdir, ENOSPC},
      {"chmod", SystemCall::kChmod, EPERM},
      {"unlink", SystemCall::kUnlink, EPERM},
      {"link", SystemCall::kLink, EMLINK},
      {"uname", SystemCall::kUname, EFAULT},
      {"open", SystemCall::kOpen, EMFILE},
      {"close", SystemCall::kClose, EIO},
      {"fopen", SystemCall::kFopen, EMFILE},
      {"fdopen", SystemCall::kFdopen, ENOMEM},
      {"fseek", SystemCall::kFseek, EINVAL},
      {"ftell", SystemCall::kFtell, EOVERFLOW},
      {"fread", SystemCall::kFread, EISDIR},
      {"fwrite", SystemCall::kFwrite, ENOSPC},
      {"fclose", SystemCall::kFclose, EIO},
      {"strdup", SystemCall::kStrdup, ENOMEM},
      // ---- the host
      {"BSS1_GetEnv", {}},
      {"BSS1_GetLock", {}, EDEADLK, FailingFunction::kLosesEvent},
      {"BSS1_ReleaseLock", {}, EPERM},
      {"FSI1_NewList", {}, EIO},
      {"FSI1_FetchList", {}, EIO},
      {"FSI1_DeleteList", {}, EIO},
      {"XML1_ParserCreate", {}},
      {"XML1_GetBuffer", {}},
      {"XML1_ParseBuffer", {}, 1},
      {"InsertRow", {}, ENOMEM, FailingFunction::kLosesRow},
      {"Dispatch", {}, EIO, FailingFunction::kLosesRow},
      {"rpc__malloc", {}},
  };
  return kFunctions;
}

Fault::Fault(const FailingFunction& function, int nth) {
  if (function.call) {
    system_.emplace(*function.call, function.status, nth);
  } else {
    service_.emplace(function.name, static_cast<unsigned>(nth), function.status);
  }
}

bool Fault::happened() const {
  return system_ ? system_->happened() : service_->happened();
}
