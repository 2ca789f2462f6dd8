// vmqctl against the real daemon and a real agent.

#include <csignal>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

using testing::HasSubstr;

class Client : public Deployment {
 protected:
  Client() { startDaemon(); }
};

TEST_F(Client, StartsRestartsAndStopsAnAgent) {
  const Outcome started = vmqctl("start ux");
  EXPECT_EQ(started.exit_code, 0) << started.output;
  EXPECT_TRUE(answers(home.port("ux")));
  const pid_t first = home.pid("ux").value();

  const Outcome restarted = vmqctl("restart ux");
  EXPECT_EQ(restarted.exit_code, 0) << restarted.output;
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_NE(home.pid("ux").value(), first);

  const Outcome stopped = vmqctl("stop ux");
  EXPECT_EQ(stopped.exit_code, 0) << stopped.output;
  EXPECT_FALSE(answers(home.port("ux")));
}

TEST_F(Client, StartsAndStopsAnInstance) {
  EXPECT_EQ(vmqctl("start ux --instance inst1").exit_code, 0);
  EXPECT_TRUE(answers(home.port("ux_inst1")));
  EXPECT_EQ(vmqctl("stop ux --target inst1:node7:UX").exit_code, 0);
  EXPECT_FALSE(answers(home.port("ux_inst1")));
}

TEST_F(Client, FailureIsExplainedWithItsCommandLine) {
  const Outcome outcome = vmqctl("stop lz");
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1024E"));
  EXPECT_THAT(outcome.output, HasSubstr(command("-c stop lz")));
}

TEST_F(Client, SuccessfulRestartTellsThatItsStopFailed) {
  ASSERT_EQ(vmqctl("start ux").exit_code, 0);
  home.configure("ux", "WAIT_SECONDS=1");
  ASSERT_EQ(kill(home.pid("ux").value(), SIGSTOP), 0);
  const Outcome outcome = vmqctl("restart ux");
  EXPECT_EQ(outcome.exit_code, 0);
  EXPECT_THAT(outcome.output, HasSubstr("VMQ1024E"));
  EXPECT_THAT(outcome.output, HasSubstr(command("-c stop ux")));
}

TEST_F(Client, WatchShowsTheOutcomeOfARequestThatWasNotWaitedFor) {
  const TemporaryDirectory folder;
  const std::string told = quoted(folder / "told");
  const Outcome outcome = runShell(
      "export VMQ_SOCKET=" + quoted(daemon->socket()) + "; " VMQ_PROGRAMS "/vmqctl watch t1 --count 1 --timeout 60 2>" +
      told + " & until grep -qs watching " + told +
      " || ! kill -0 $!; do sleep 0.1; done; " VMQ_PROGRAMS "/vmqctl start ux --transid t1 --no-wait && wait $!");
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_THAT(outcome.output, HasSubstr("t1: START on " + std::string(DaemonFixture::node) + " done"));
}

TEST_F(Client, DaemonThatIsGoneIsNotReachable) {
  EXPECT_EQ(vmqctl("status").exit_code, 0);
  daemon->stop();
  const Outcome outcome = vmqctl("start ux");
  EXPECT_EQ(outcome.exit_code, 7) << outcome.output;
  EXPECT_THAT(outcome.output, HasSubstr(daemon->socket()));
}

}  // namespace
