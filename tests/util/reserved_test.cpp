// The reserved column of a product record.
#include <gtest/gtest.h>

#include "test_seam.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Util;

namespace {

struct Parsed {
  bool ok = false;
  std::string agentLevel, agentArch, axVersion, axArch, commonVersion;
};

Parsed parse(const char* reserved) {
  String level, arch, ax_version, ax_arch, common;
  Parsed parsed;
  parsed.ok = Util::parseReserved(String(reserved), level, arch, ax_version, ax_arch, common);
  parsed.agentLevel = level.toNarrow();
  parsed.agentArch = arch.toNarrow();
  parsed.axVersion = ax_version.toNarrow();
  parsed.axArch = ax_arch.toNarrow();
  parsed.commonVersion = common.toNarrow();
  return parsed;
}

TEST(ReservedTest, ThreeProductsAreTakenApart) {
  const TEST_TraceCapture trace;
  const Parsed parsed = parse("A=1:x;C=2.5:y;G=3.0:z");
  EXPECT_TRUE(parsed.ok);
  EXPECT_EQ(parsed.agentLevel, "1");
  EXPECT_EQ(parsed.agentArch, "x");
  EXPECT_EQ(parsed.axVersion, "25");
  EXPECT_EQ(parsed.axArch, "y");
  EXPECT_EQ(parsed.commonVersion, "30");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "reserved=[A=1:x;C=2.5:y;G=3.0:z]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "agentLevel=1,agentArch=x"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "axVersion=25,axArch=y"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "commonVersion=30"));
}

TEST(ReservedTest, DotsStayInTheAgentsLevelOnly) {
  const Parsed parsed = parse("A=06.2.0:lx8266;C=06.2.1.0:aix;G=01.02:any");
  EXPECT_TRUE(parsed.ok);
  EXPECT_EQ(parsed.agentLevel, "06.2.0");
  EXPECT_EQ(parsed.axVersion, "06210");
  EXPECT_EQ(parsed.commonVersion, "0102");
}

TEST(ReservedTest, OrderAndExtraSeparatorsDoNotMatter) {
  const Parsed parsed = parse(";;G=3:z;;C::2=y;A=:1:x;");
  EXPECT_TRUE(parsed.ok);
  EXPECT_EQ(parsed.agentLevel, "1");
  EXPECT_EQ(parsed.axArch, "y");
  EXPECT_EQ(parsed.commonVersion, "3");
}

struct Malformed {
  const char* reserved;
  const char* error;
};

class MalformedReservedTest : public testing::TestWithParam<Malformed> {};

TEST_P(MalformedReservedTest, FailsAndSaysWhy) {
  const TEST_TraceCapture trace;
  EXPECT_FALSE(parse(GetParam().reserved).ok);
  EXPECT_EQ(trace.texts(RAS1_ERROR), std::vector<std::string>{GetParam().error});
}

INSTANTIATE_TEST_SUITE_P(All, MalformedReservedTest,
                         testing::Values(Malformed{"", "wrong number of products in RESERVED column:0"},
                                         Malformed{";", "wrong number of products in RESERVED column:0"},
                                         Malformed{"A=1:x;C=2.5:y", "wrong number of products in RESERVED column:2"},
                                         Malformed{"A=1:x;C=2:y;G=3:z;A=4:w",
                                                   "wrong number of products in RESERVED column:4"},
                                         Malformed{"A=1:x;B=2:y;G=3:z", "unknown product in RESERVED column"},
                                         Malformed{"a=1:x;C=2:y;G=3:z", "unknown product in RESERVED column"},
                                         Malformed{"A=1:x; C=2:y;G=3:z", "unknown product in RESERVED column"},
                                         Malformed{"A=1;C=2:y;G=3:z", "wrong number of tokens in A product:2"},
                                         Malformed{"A=1:x:y;C=2:y;G=3:z", "wrong number of tokens in A product:4"},
                                         Malformed{"A=1:x;C;G=3:z", "wrong number of tokens in C product:1"},
                                         Malformed{"A=1:x;C=2:y;G=3", "wrong number of tokens in G product:2"}));

}  // namespace
