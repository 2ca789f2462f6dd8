// The life of a product in one go, by all nine commands.

#include <filesystem>

#include "tests/e2e/loopback.h"
#include "tests/e2e/restarting_installer.h"

namespace {

namespace fs = std::filesystem;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

class ProductLife : public Deployment {
 protected:
  /// vmqctl with these arguments, which must succeed; what it writes to standard output.
  std::string done(const std::string& arguments) const {
    const Outcome outcome = vmqctl(arguments + " 2>/dev/null");
    EXPECT_EQ(outcome.exit_code, 0) << arguments << "\n" << outcome.output << daemon->log();
    return outcome.output;
  }
};

TEST_F(ProductLife, FromInstallToRemoval) {
  startHurriedDaemon();
  sendBundles();
  const std::string program = home / "zlpqor6/lx8266/ux/bin/prometheus-node-exporter";

  // Installed by an installer that restarts the daemon; the daemon after it knows how that went.
  const std::string pid_file = stageRestartingInstaller(*daemon, home);
  done(
      "install ux --version 010100000 --restart --command '|DEPLOYDIR|/restart.sh |CORVELHOME| "
      "|DEPLOYDIR|/ux_Silent_Install.txt'");
  EXPECT_EQ(daemon->process().wait(), 0);
  ASSERT_TRUE(exitCodeIsKept(*daemon));
  SuccessorDaemon successor(pid_file);
  done("complete-install");
  EXPECT_THAT(done("inventory ux"), HasSubstr("010100000"));

  // Started, configured for another port, restarted there.
  done("start ux");
  done("start ux --instance inst1");
  const std::string configuration = done("get-config ux --target inst1");
  EXPECT_THAT(configuration, StartsWith("INSTANCE=inst1\nPORT="));
  EXPECT_THAT(configuration, EndsWith("\nPROGRAM=" + program + "\n"));
  const uint16_t before = home.port("ux_inst1");
  const uint16_t after = freePort();
  ASSERT_EQ(runShell("printf 'INSTANCE=inst1\\nPORT=%s\\nPROGRAM=%s\\n' " + std::to_string(after) + " " +
                     quoted(program) + " >" + quoted(home / "new.cfg"))
                .exit_code,
            0);
  done("set-config ux --target inst1 " + quoted(home / "new.cfg"));
  EXPECT_TRUE(answers(before)) << "an agent that runs goes on as it is";
  done("restart ux --target inst1:node7:UX");
  EXPECT_FALSE(answers(before));
  EXPECT_TRUE(answers(after));
  EXPECT_TRUE(answers(home.port("ux")));

  // Away with the instance, then with the agent, then with the product.
  done("remove-instance ux inst1");
  EXPECT_FALSE(answers(after));
  done("stop ux");
  EXPECT_FALSE(answers(home.port("ux")));
  done("uninstall ux");
  EXPECT_FALSE(fs::exists(program));
  EXPECT_THAT(done("inventory"), Not(HasSubstr("ux ")));
  EXPECT_TRUE(successor.stop());
}

}  // namespace
