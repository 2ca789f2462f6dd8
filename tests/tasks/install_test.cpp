#include "tasks/install.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tasks/task_manager.h"
#include "test_seam.h"
#include "tests/tasks/installation_home.h"

namespace {

using testing::ElementsAre;
using testing::IsSubsetOf;
using VMQ::String;

class Installing : public testing::Test {
 protected:
  Installing() {
    depotDir = String(home.depot().c_str());
    home.file("depot/.keep", "");
    home.tool("bin/qinfo", R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END)");
    home.tool("zlpqor6/lx8266/bin/vmq_xa", "exit 0");
    home.tool("install.sh", "exit 0");
    home.tool("qorpatch", "exit 0");
    request.product = "ux";
    request.context = "|CORVELHOME|/install.sh -q";
  }
  ~Installing() override { depotDir = String(); }

  bool keepsPipes(const char* product, const char* command) {
    request.product = product;
    request.context = command;
    trace.clear();
    EXPECT_EQ(install(request), TASK_OK);
    return trace.has(RAS1_DETAIL, "Patch being applied to oy or or, setting nonblocking io flag to true");
  }

  InstallationHome home;
  TaskQueueElem request;
  TEST_TraceCapture trace;
  TEST_RecordedSleeps sleeps;
};

TEST_F(Installing, TracesEachStep) {
  request.optional = "INSTANCE";
  EXPECT_EQ(install(request), TASK_OK);
  const std::string command = home.path() + "/install.sh -q";
  EXPECT_THAT((std::vector<std::string>{"Install command is [" + command + "]", "Executing install command " + command,
                                        "Install returned 0 return code.", "SetRMS for product [ux] was successfull.",
                                        "Return code is 0"}),
              IsSubsetOf(trace.texts(RAS1_DETAIL)));
  EXPECT_THAT(sleeps.seconds(), ElementsAre());
}

TEST_F(Installing, WithRestartTracesEachStepAndSleepsBeforeItsEvent) {
  request.optional = "REQUIRES_RESTART";
  EXPECT_EQ(install(request), TASK_OK);
  const std::string script = home.depot() + "runcmd.sh";
  const std::string translator = home.path() + "/zlpqor6/lx8266/bin/vmq_xa -setRMS ux";
  const std::string command = "/bin/sh " + script + " " + home.path() + "/install.sh -q";
  EXPECT_THAT((std::vector<std::string>{"Using Two-Way Translator " + translator, "Generating post install script",
                                        "Constructing install and two-way script " + script,
                                        "Two Way Translator is: " + translator, "Sleeping for 5 seconds...",
                                        "Returning aysnc status return code [0], message id [] parms []",
                                        "Install command is [" + command + "]"}),
              IsSubsetOf(trace.texts(RAS1_DETAIL)));
  EXPECT_THAT(sleeps.seconds(), ElementsAre(5u, 1u));
}

TEST_F(Installing, ScriptWithoutATranslatorOnlyInstalls) {
  String command("do it"), none;
  setupForRestart(command, none, request);
  EXPECT_EQ(command.toNarrow(), "/bin/sh " + home.depot() + "runcmd.sh do it");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Constructing install only script " + home.depot() + "runcmd.sh"));
  EXPECT_EQ(readWholeFile(home.depot() + "runcmd.sh").find("vmq_xa"), std::string::npos);
}

TEST_F(Installing, ScriptRemovesTheProductInLowerCase) {
  request.product = "OQ";
  String command("do it"), none;
  setupForRestart(command, none, request);
  EXPECT_NE(readWholeFile(home.depot() + "runcmd.sh").find("rm -rf " + home.depot() + "oq >"), std::string::npos);
}

TEST_F(Installing, PatchesOfTwoProductsKeepThePipes) {
  for (const char* product : {"oy", "or", "OY", "Or"})
    EXPECT_TRUE(keepsPipes(product, "|CORVELHOME|/qorpatch")) << product;
  for (const char* product : {"ux", "o", "oyx"}) EXPECT_FALSE(keepsPipes(product, "|CORVELHOME|/qorpatch")) << product;
  for (const char* command :
       {"|CORVELHOME|/install.sh", "|CORVELHOME|/install.sh qorpatc", "|CORVELHOME|/install.sh QORPATCH"})
    EXPECT_FALSE(keepsPipes("oy", command)) << command;
}

TEST_F(Installing, CompletionSleepsTenSecondsAndLeavesTheFile) {
  home.file("depot/rc.txt", " 3 \n");
  EXPECT_EQ(completeInstallAfterRestart(request), TASK_INSTALL_FAILED);
  EXPECT_THAT(sleeps.seconds(), ElementsAre(10u));
  EXPECT_EQ(readWholeFile(home.depot() + "rc.txt"), " 3 \n");
}

TEST_F(Installing, CompletionWithoutAnExitCodeIsTraced) {
  EXPECT_EQ(completeInstallAfterRestart(request), TASK_INSTALL_FAILED);
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Unable to read rc.txt for install's return code"));
}

}  // namespace
