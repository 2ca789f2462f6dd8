// Agents and daemons that come and go.

#include <signal.h>

#include <filesystem>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

class DaemonLife : public Deployment {
 protected:
  [[nodiscard]] std::string workingDirectory() const {
    return std::filesystem::read_symlink("/proc/" + std::to_string(daemon->process().pid()) + "/cwd");
  }
};

// So that a script of its own that removes a file by a bare name removes none elsewhere.
TEST_F(DaemonLife, WorksInItsDepot) {
  startDaemon();
  EXPECT_EQ(workingDirectory(), std::filesystem::canonical(daemon->depot()));
}

TEST_F(DaemonLife, AgentOutlivesAKilledDaemonAndTheNextOneCanStopIt) {
  startDaemon();
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  const pid_t agent = home.pid("ux").value();
  daemon->kill();
  EXPECT_TRUE(isRunning(agent));
  EXPECT_TRUE(answers(home.port("ux")));

  daemon->start();  // the socket of the killed one is still there
  EXPECT_THAT(carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_FALSE(isRunning(agent));
}

TEST_F(DaemonLife, AgentOutlivesADaemonThatIsStopped) {
  startDaemon();
  ASSERT_THAT(carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_EQ(daemon->stop(), 0);
  EXPECT_TRUE(answers(home.port("ux")));
}

TEST_F(DaemonLife, WatchEndsWithTheDaemon) {
  startDaemon();
  Watcher watcher(daemon->socket());
  EXPECT_EQ(daemon->stop(), 0);
  EXPECT_EQ(watcher.next(), nullptr);
}

}  // namespace
