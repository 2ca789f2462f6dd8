#include "tasks/two_way_translator.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "test_seam.h"
#include "tests/tasks/installation_home.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class Translator : public testing::Test {
 protected:
  Translator() {
    home.tool("bin/qinfo", R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END)");
  }
  void translator(const std::string& body) { home.tool("zlpqor6/lx8266/bin/vmq_xa", body); }
  [[nodiscard]] std::string command(const std::string& name) const {
    return home.path() + "/zlpqor6/lx8266/bin/vmq_xa -i " + name + " -pc ux";
  }
  std::string of(const char* name, const char* product = "ux") { return getInstanceName(product, name).toNarrow(); }

  InstallationHome home;
  TEST_TraceCapture trace;
};

using InstanceName = Translator;

TEST_F(InstanceName, IsWhatTheTranslatorPrintsTrimmed) {
  translator("printf ' inst1\\n'");
  EXPECT_EQ(of("m1:UX"), "inst1");
  EXPECT_THAT(commandLines(trace),
              ElementsAre(home.path() + "/bin/qinfo -d ", home.path() + "/bin/qinfo -d ", command("m1:UX")));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Returning instance [inst1] for managed system name [m1:UX]"));
}

TEST_F(InstanceName, IsEmptyWhenTheTranslatorPrintsBlanksOnly) {
  translator("printf ' \\n\\t'");
  EXPECT_EQ(of("m1:UX"), "");
}

TEST_F(InstanceName, OfNoManagedSystemIsEmptyAndNobodyIsAsked) {
  translator("echo inst1");
  EXPECT_EQ(of(""), "");
  EXPECT_THAT(commandLines(trace), IsEmpty());
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Returning instance [] for managed system name []"));
}

TEST_F(InstanceName, OfTheDataAgentIsInTheNameItself) {
  translator("echo other");
  EXPECT_EQ(of("inst1:node7:DA", "um"), "inst1");
  EXPECT_EQ(of(" inst1 :node7:DA", "um"), "inst1");
  EXPECT_THAT(commandLines(trace), IsEmpty());
}

TEST_F(InstanceName, OfADataAgentInCapitalsIsAskedFor) {
  translator("echo other");
  EXPECT_EQ(of("inst1:node7:DA", "UM"), "other");
}

TEST_F(InstanceName, IsEmptyWithoutATranslator) {
  EXPECT_EQ(of("m1:UX"), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "No two-way translator found for product code [ux]"));
}

TEST_F(InstanceName, IsEmptyWhenTheTranslatorCannotBeRun) {
  home.file("zlpqor6/lx8266/bin/vmq_xa", "no program");
  EXPECT_EQ(of("m1:UX"), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to start two way translator using command [" + command("m1:UX") + "]"));
}

TEST_F(InstanceName, IsEmptyWhenTheTranslatorFailsWhateverItPrinted) {
  translator("echo inst1; exit 65");
  EXPECT_EQ(of("m1:UX"), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR,
                        "Received bad return code [65] from two-way translator command [" + command("m1:UX") + "]"));
}

TEST_F(Translator, ConfiguringTracesItsResult) {
  translator("exit 0");
  for (TASK_RC (*task)(TaskQueueElem&) : {getConfig, setConfig}) {
    trace.clear();
    TaskQueueElem request;
    request.product = "ux";
    // cppcheck-suppress legacyUninitvar ; does not understand the loop
    EXPECT_EQ(task(request), TASK_OK);
    EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 0"));
  }
}

TEST_F(Translator, ThatWasFoundIsTraced) {
  translator("exit 0");
  VMQ::String path("whatever");
  EXPECT_TRUE(getTwoWayTranslator(path));
  EXPECT_EQ(path.toNarrow(), home.path() + "/zlpqor6/lx8266/bin/vmq_xa");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Using default two-way translator [" + path.toNarrow() + "]"));
}

TEST_F(Translator, ThatIsMissingLeavesNoPath) {
  VMQ::String path("whatever");
  EXPECT_FALSE(getTwoWayTranslator(path));
  EXPECT_EQ(path.toNarrow(), "");
}

}  // namespace
