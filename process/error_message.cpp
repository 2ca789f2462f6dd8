#include "process/error_message.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <system_error>

#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/error_message"};

// Room for the longer of the two frames around the text, the number and the terminator.
constexpr size_t kFrameBytes = sizeof "Unknown Error occurred: ERRNO:-2147483648 ";

}  // namespace

char* getErrorMsg(int errnum) {
  const Trace trace(traceUnit);
  const std::unique_ptr<char, decltype(&free)> text(strdup(std::generic_category().message(errnum).c_str()), &free);
  const size_t size = kFrameBytes + 30 * (text != nullptr ? strlen(text.get()) : 0);
  auto* const message = static_cast<char*>(malloc(size));
  if (message == nullptr) return nullptr;
  if (text != nullptr) {
    (void)snprintf(message, size, "Error occurred: ERRNO:%d %s", errnum, text.get());  // `size` is ample
  } else {
    (void)snprintf(message, size, "Unknown Error occurred: ERRNO:%d ", errnum);
  }
  return message;
}

}  // namespace VMQ
