#include "tasks/restart_script.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using VMQ::String;

// What both forms remove, for the product "oq".
const std::string kRemovals =
    "rm -rf /d/ui >/dev/null 2>&1\n"
    "rm -rf /d/ci >/dev/null 2>&1\n"
    "rm -rf /d/jr >/dev/null 2>&1\n"
    "rm -rf /d/gs >/dev/null 2>&1\n"
    "rm -rf /d/dd >/dev/null 2>&1\n"
    "rm -rf /d/ax >/dev/null 2>&1\n"
    "rm -rf /d/la >/dev/null 2>&1\n"
    "rm -rf /d/uf >/dev/null 2>&1\n"
    "rm -rf /d/ux >/dev/null 2>&1\n"
    "rm -rf /d/oq >/dev/null 2>&1\n";

TEST(RestartScript, InstallsOnly) {
  EXPECT_EQ(restartScript("/d/", "oq", "").toNarrow(),
            "#!/bin/sh\n"
            "trap \"true\" 13 15\n"
            "rm -f rc.txt >/dev/null 2>&1\n"
            "$* 2>/d/stderr.txt 1>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "export RETCODE\n" +
                kRemovals +
                "echo $RETCODE > /d/rc.txt\n"
                "exit $RETCODE\n");
}

TEST(RestartScript, InstallsAndRegisters) {
  EXPECT_EQ(restartScript("/d/", "oq", "/x/vmq_xa -setRMS oq").toNarrow(),
            "#!/bin/sh\n"
            "trap \"true\" 13 15\n"
            "rm -f rc.txt >/dev/null 2>&1\n"
            "$* 2>/d/stderr.txt 1>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "if [ \"$RETCODE\" -eq \"0\" ]; then\n"
            "/x/vmq_xa -setRMS oq 2>>/d/stderr.txt 1>>/d/stdout.txt\n"
            "RETCODE=$?\n"
            "fi\n" +
                kRemovals +
                "export RETCODE\n"
                "echo $RETCODE > /d/rc.txt\n"
                "exit $RETCODE\n");
}

TEST(RestartScript, RemovesTheDirectoryOfProductUxTwice) {
  const std::string script = restartScript("/d/", "ux", "").toNarrow();
  const std::string line = "rm -rf /d/ux >/dev/null 2>&1\n";
  EXPECT_NE(script.find(line + line), std::string::npos);
}

}  // namespace
