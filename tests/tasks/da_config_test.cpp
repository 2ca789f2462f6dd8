// What SETCONFIG for the data agent does when the system refuses what mostly works. Its requests, as a server sends
// them, are in tests/mgmt.
#include "tasks/da_config.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>

#include "tasks/task_manager.h"
#include "test_seam.h"
#include "tests/support/system_faults.h"
#include "tests/tasks/installation_home.h"

namespace {

using VMQ::String;

TEST(DataAgentScripts, WhoseModeCannotBeSetAreTracedAndTheNextIsCopied) {
  const InstallationHome home;
  home.tool("bin/qinfo", "echo 'Platform codes:'; echo 'lx8266 Product (um)'");
  home.file("config/um.config",
            "KUMP_META_PATH=" + home.path() + "/meta\nKUM_WORK_PATH=" + home.path() + "/work/um\nKUMP_RB_PATH=rb\n");
  for (const char* name : {"depot/s1.sh", "depot/s2.sh", "work/scripts/.keep"}) home.file(name, name);
  depotDir = String(home.depot().c_str());
  TaskQueueElem request;
  request.product = "um";
  request.dascript = "s1.sh,s2.sh";
  const TEST_TraceCapture trace;
  {
    const SystemFault failing(SystemCall::kChmod, EPERM);
    EXPECT_EQ(setDaconfig(request), TASK_OK);
  }
  depotDir = String();
  const std::string scripts = home.path() + "/work/scripts/";
  EXPECT_EQ(trace.texts(RAS1_ERROR),
            std::vector{"Failed to set permissions on file [" + scripts + "s1.sh] to [504]"});  // 0770
  EXPECT_EQ(readWholeFile(scripts + "s1.sh"), "depot/s1.sh");
  EXPECT_EQ(readWholeFile(scripts + "s2.sh"), "depot/s2.sh");
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 0"));
}

TEST(DataAgentConfiguration, TracesTheCodeOfAFailure) {
  const InstallationHome home;
  TaskQueueElem request;
  request.product = "um";
  request.daconfig = "m.mdl";
  const TEST_TraceCapture trace;
  EXPECT_EQ(setDaconfig(request), TASK_NO_AGENT_CONFIG);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Return code is 1020"));
}

}  // namespace
