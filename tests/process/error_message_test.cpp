#include "process/error_message.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <memory>
#include <string>

#include "tests/support/system_faults.h"

namespace {

std::string messageOf(int error) {
  const std::unique_ptr<char, decltype(&free)> message(VMQ::getErrorMsg(error), &free);
  return message.get();
}

TEST(GetErrorMsg, NamesTheNumberAndItsText) {
  EXPECT_EQ(messageOf(ENOENT), "Error occurred: ERRNO:2 No such file or directory");
}

TEST(GetErrorMsg, NumberWithoutAMeaningIsStillNamed) {
  EXPECT_EQ(messageOf(99999), "Error occurred: ERRNO:99999 Unknown error 99999");
}

TEST(GetErrorMsg, WithoutItsTextTheErrorIsUnknown) {
  const SystemFault fault(SystemCall::kStrdup, ENOMEM);
  EXPECT_EQ(messageOf(-2147483647 - 1), "Unknown Error occurred: ERRNO:-2147483648 ");
}

}  // namespace
