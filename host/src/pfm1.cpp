// Exception frames of a thread.

#include <exception>

#include "rpc.h"

namespace {

thread_local PFM1_ThreadData threadData{nullptr};

}  // namespace

PFM1_ThreadData& PFM1_Thread() {
  return threadData;
}

void PFM1__Raise(uint32_t status) {
  if (threadData.innermost == nullptr) std::terminate();
  throw PFM1_Fault{status};  // unwinding destroys the frames, innermost first
}

PFM1_Frame::PFM1_Frame(void (*cleanUp)(void*), void* argument)
    : thread_(threadData), outer_(thread_.innermost), clean_up_(cleanUp), argument_(argument) {
  thread_.innermost = this;
}

PFM1_Frame::~PFM1_Frame() {
  if (thread_.innermost != this) return;  // dropped
  thread_.innermost = outer_;
  if (clean_up_ != nullptr) clean_up_(argument_);
}

void PFM1__DropFrame(PFM1_Frame& frame) {
  frame.thread_.innermost = frame.outer_;
}
