#include <gtest/gtest.h>

#include "tasks/da_config.h"
#include "test_seam.h"

namespace {

struct Case {
  const char* name;
  const char* instance;
  const char* host;
};

class ManagedSystemName : public testing::TestWithParam<Case> {};

TEST_P(ManagedSystemName, GivesInstanceAndHost) {
  const Case& c = GetParam();
  TEST_TraceCapture trace;
  EXPECT_EQ(getDaInstanceName(c.name), c.instance);
  EXPECT_TRUE(trace.has(
      RAS1_DETAIL, std::string("Returning instance <") + c.instance + "> for managed system name <" + c.name + ">"));
  EXPECT_EQ(getDaHostName(c.name), c.host);
  EXPECT_TRUE(trace.has(RAS1_DETAIL,
                        std::string("Returning hostname <") + c.host + "> for managed system name <" + c.name + ">"));
}

INSTANTIATE_TEST_SUITE_P(Forms, ManagedSystemName,
                         testing::Values(Case{"host1:DA", "", "host1"},             //
                                         Case{"inst1:host1:DA", "inst1", "host1"},  //
                                         Case{"inst1:host1", "", ""},               //
                                         Case{"", "", ""},                          //
                                         Case{":DA", "", ""},                       //
                                         Case{":host1:DA", "", ":host1"},           //
                                         Case{"inst1::DA", "inst1", ""},            //
                                         Case{"a:b:c:DA", "a", "b:c"},              //
                                         Case{"inst1:host1:DAX", "inst1", "host1"}, Case{"inst1:host1:da", "", ""}));

}  // namespace
