#include "tasks/uninstall.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "tasks/task_manager.h"
#include "test_seam.h"
#include "tests/support/scoped_variable.h"
#include "tests/tasks/installation_home.h"

namespace {

using testing::ElementsAre;
using VMQ::String;

class Removals : public testing::Test {
 protected:
  Removals() { depotDir = String(home.depot().c_str()); }
  ~Removals() override { depotDir = String(); }

  std::string replaced(const char* text, const char* product = "ux", const char* version = "06.20.00") {
    return replaceTokens(text, product, version).toNarrow();
  }

  const ScopedVariable architecture{"QOR_BINARCH", std::nullopt};
  InstallationHome home;
  TaskQueueElem request;
  TEST_TraceCapture trace;
};

// ---- placeholders --------------------------------------------------------------------------------------------------

TEST_F(Removals, TextWithoutPlaceholdersStaysAsItIs) {
  for (const char* text : {"", "./install.sh -q", "|", "|DEPLOYDIR", "DEPLOYDIR|", "|deploydir|", "|DEPLOYDIR |"})
    EXPECT_EQ(replaced(text), text);
}

TEST_F(Removals, EveryPlaceholderIsReplaced) {
  const std::string deploy = home.depot() + "ux/06.20.00";
  EXPECT_EQ(replaced("|DEPLOYDIR|/a |DEPLOYDIR|/b"), deploy + "/a " + deploy + "/b");
  EXPECT_EQ(replaced("|CORVELHOME||CORVELHOME|"), home.path() + home.path());
  EXPECT_EQ(replaced("|DEPOTDIR|x|DEPOTDIR|"), home.depot() + "x" + home.depot());
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Received String is [|DEPOTDIR|x|DEPOTDIR|]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Resolved String is [" + home.depot() + "x" + home.depot() + "]"));
}

TEST_F(Removals, ProductCiIsDeployedWithoutItsVersion) {
  EXPECT_EQ(replaced("|DEPLOYDIR|", "ci"), home.depot() + "ci");
  EXPECT_EQ(replaced("|DEPLOYDIR|", "CI"), home.depot() + "CI/06.20.00");
}

TEST_F(Removals, LaterPlaceholdersInAReplacementAreReplacedToo) {
  EXPECT_EQ(replaced("|DEPLOYDIR|", "ux", "|CORVELHOME|"), home.depot() + "ux/" + home.path());
  EXPECT_EQ(replaced("|DEPLOYDIR|", "ux", "|DEPLOYDIR|"), home.depot() + "ux/|DEPLOYDIR|");
}

// ---- the architecture of what is removed ---------------------------------------------------------------------------

TEST_F(Removals, ArchitectureIsTheOneThatEndsLikeTheConfiguredOne) {
  home.tool("bin/qinfo", R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","aix533","062000000","100"
"ux","Unix agent","lx8266","062000000","100"
"ux","Unix agent","hpi116","062000000","100"
END)");
  home.tool("bin/uninstall.sh", "exit 0");
  request.product = "ux";
  EXPECT_EQ(uninstall(request), TASK_OK);
  architecture.put("li6266");
  EXPECT_EQ(uninstall(request), TASK_OK);
  EXPECT_THAT(commandLines(trace),
              ElementsAre(home.path() + "/bin/qinfo -d ", home.path() + "/bin/qinfo -d ",
                          home.path() + "/bin/uninstall.sh -i ux aix533", home.path() + "/bin/qinfo -d ",
                          home.path() + "/bin/qinfo -d ", home.path() + "/bin/uninstall.sh -i ux lx8266"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "UnInstall command is [" + home.path() + "/bin/uninstall.sh -i ux lx8266]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "UnInstall returned 0 return code."));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 0"));
}

TEST_F(Removals, ProductWhoseDescriptionHasACommaIsRemovedByTheCommandOfTheRequest) {
  home.tool("bin/qinfo", R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix, and more","lx8266","062000000","100"
END)");
  home.tool("depot/remove.sh", "exit 0");
  request.product = "ux";
  request.context = "|DEPOTDIR|remove.sh";
  EXPECT_EQ(uninstall(request), TASK_OK);
  EXPECT_THAT(commandLines(trace), ElementsAre(home.path() + "/bin/qinfo -d ", home.depot() + "remove.sh"));
}

TEST_F(Removals, EveryResponseFileIsTurnedIntoTheOneForRemoving) {
  request.product = "zz";
  request.context = "un.sh a_Silent_Install.txt b_Silent_Install.txt c_silent_install.txt";
  EXPECT_EQ(uninstall(request), TASK_UNINSTALL_NOT_STARTED);
  EXPECT_EQ(request.retmsgparm.toNarrow(), "un.sh a_silent_uninstall.txt b_silent_uninstall.txt c_silent_install.txt");
}

TEST_F(Removals, EmptyCommandCannotBeStarted) {
  request.product = "zz";
  EXPECT_EQ(uninstall(request), TASK_UNINSTALL_NOT_STARTED);
  EXPECT_EQ(request.retmsgid.toNarrow(), "VMQ1033E");
  EXPECT_EQ(request.retmsgparm.toNarrow(), "");
}

// ---- instances -----------------------------------------------------------------------------------------------------

TEST_F(Removals, TranslatorIsAskedForAnInstanceWithoutAName) {
  home.tool("bin/qinfo", R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END)");
  const std::string translator = home.path() + "/zlpqor6/lx8266/bin/vmq_xa";
  home.tool("zlpqor6/lx8266/bin/vmq_xa", "[ \"$*\" = '-r -pc ux' ]");
  request.product = "ux";
  EXPECT_EQ(removeInstance(request), TASK_OK);
  EXPECT_EQ(commandLines(trace).back(), translator + " -r  -pc ux");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 0"));
}

}  // namespace
