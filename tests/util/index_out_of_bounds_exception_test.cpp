// Range errors: what they say, and that it reaches the trace.
#include "util/index_out_of_bounds_exception.h"

#include <gtest/gtest.h>

#include <string>

#include "test_seam.h"
#include "util/current_exception.h"

using VMQ::IndexOutOfBoundsException;

namespace {

RAS1_Unit traceUnit{"tests/index_out_of_bounds_exception"};

TEST(IndexOutOfBoundsExceptionTest, TextNamesLineAndFile) {
  EXPECT_STREQ(IndexOutOfBoundsException(17, "vmqstr").getText(), "line: 17, file: vmqstr");
}

TEST(IndexOutOfBoundsExceptionTest, TextLongerThanTheBufferIsCut) {
  const std::string text = IndexOutOfBoundsException(1, std::string(600, 'x').c_str()).getText();
  EXPECT_EQ(text.size(), 511u);
  EXPECT_EQ(text.substr(0, 18), "line: 1, file: xxx");
}

TEST(IndexOutOfBoundsExceptionTest, ErrorThatGoesNoFurtherIsTracedWithItsPlace) {
  const TEST_TraceCapture capture;
  const VMQ::Trace trace(traceUnit);
  try {
    throw IndexOutOfBoundsException(17, "vmqstr");
  } catch (...) {
    VMQ::traceCurrentException(trace, "testing");
  }
  EXPECT_TRUE(capture.has(RAS1_ERROR, "Exception while testing: line: 17, file: vmqstr"));
}

}  // namespace
