// The sample bundles as they are put together.

#include <gmock/gmock.h>

#include "tests/e2e/sample_home.h"

namespace {

using testing::HasSubstr;

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

TEST_F(Bundles, AssemblingWhatIsNotUnderstoodIsUsage) {
  for (const char* arguments : {"", "--help", "one two", "''"}) {
    const Outcome outcome = assemble(arguments);
    EXPECT_EQ(outcome.exit_code, 64) << arguments;
    EXPECT_THAT(outcome.output, HasSubstr("  assemble FOLDER\n")) << arguments;
  }
}

}  // namespace
