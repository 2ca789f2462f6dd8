// Ten thousand commands, as a host runs them in months.
#include <gtest/gtest.h>

#include "tests/process/command_fixture.h"

namespace {

using CommandEndurance = CommandFixture;

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int kCommands = 1'000;  // a tenth of the speed
#else
constexpr int kCommands = 10'000;
#endif

TEST_F(CommandEndurance, TenThousandCommandsLeaveNothingBehind) {
  ASSERT_EQ(run("/bin/true"), success(""));
  const ProcessResources before = ProcessResources::now();
  for (int i = 0; i < kCommands; ++i) ASSERT_EQ(run("/bin/true"), success("")) << i;
  EXPECT_TRUE(eventually([&] { return ProcessResources::now() == before; }));
}

TEST_F(CommandEndurance, CommandsThatFailOrAreGivenUpLeaveNothingBehind) {
  const std::string talker = script("yes | head -c 100000; yes | head -c 100000 >&2");
  const std::string missing = directory / "missing";
  for (int i = 0; i < kCommands / 100; ++i) {
    ASSERT_EQ(run(talker, std::string(100'000, 'x')).rc, 0);
    ASSERT_FALSE(run(missing).started);
    ASSERT_EQ(run(directory.path().string()).rc, 0);
  }
}

}  // namespace
