// The sample bundles: what is sent, and what lies in the depot when it has arrived.

#include <gmock/gmock.h>

#include <filesystem>

#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::Not;

class Bundles : public testing::Test {
 protected:
  Outcome assemble(const std::string& arguments) {
    return runShell("VMQ_EXPORTER=/bin/true " VMQ_SOURCE_DIR "/examples/bundles/assemble " + arguments);
  }

  TemporaryDirectory folder;
};

TEST_F(Bundles, AreSentWithDosLineEnds) {
  const Outcome outcome = assemble(quoted(folder / "sent"));
  ASSERT_EQ(outcome.exit_code, 0) << outcome.output;
  for (const char* file : {"ux/010100000/install.sh", "ux/010100000/uninstall.sh", "ux/010100000/ux_Silent_Install.txt",
                           "ux/010100000/ux_silent_uninstall.txt", "load.mdl"}) {
    const std::string text = readWholeFile(folder / "sent/" + file);
    for (size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n', end + 1))
      ASSERT_EQ(text[end - 1], '\r') << file;
    EXPECT_TRUE(text.ends_with("\r\n")) << file;
  }
}

TEST_F(Bundles, AreReceivedAsATransferLeavesThem) {
  const Outcome outcome = assemble("--received " + quoted(folder / "depot"));
  ASSERT_EQ(outcome.exit_code, 0) << outcome.output;
  for (const char* converted : {"ux/010100000/install.sh", "ux/010100000/uninstall.sh", "load.mdl"})
    EXPECT_THAT(readWholeFile(folder / "depot/" + converted), Not(HasSubstr("\r"))) << converted;
  EXPECT_EQ(readWholeFile(folder / "depot/ux/010100000/ux_Silent_Install.txt"), "ACTION=install\r\nPORT=19100\r\n");
  unsigned files = 0;
  for (const auto& entry : fs::recursive_directory_iterator(folder / "depot")) {
    if (!entry.is_regular_file()) continue;
    EXPECT_EQ(entry.status().permissions(), fs::perms(0770)) << entry.path();
    ++files;
  }
  EXPECT_EQ(files, 7U);
}

TEST_F(Bundles, AssemblingWhatIsNotUnderstoodIsUsage) {
  for (const char* arguments : {"", "--received", "one two", "--sent folder", "''"}) {
    const Outcome outcome = assemble(arguments);
    EXPECT_EQ(outcome.exit_code, 64) << arguments;
    EXPECT_THAT(outcome.output, HasSubstr("assemble --received DEPOT")) << arguments;
  }
}

}  // namespace
