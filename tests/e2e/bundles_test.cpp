// The sample bundles as they are put together.

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>

#include "tests/e2e/sample_home.h"

namespace {

namespace fs = std::filesystem;
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

// ---- the installer, as it runs when it has arrived: with the line ends of this system ----

class BundleInstaller : public Bundles {
 protected:
  BundleInstaller() {
    EXPECT_EQ(assemble(quoted(folder / "sent")).exit_code, 0);
    EXPECT_EQ(runShell("sed -i 's/\\r$//' " + quoted(bundle) + "/*.sh").exit_code, 0);
  }
  Outcome install(const std::string& environment = "") {
    return runShell(environment + " " + quoted(bundle + "/install.sh") + " " + quoted(home.path()));
  }
  /// What stands in a folder of the home, a name a line.
  std::string namesIn(const std::string& name) { return runShell("ls -A " + quoted(home / name)).output; }

  SampleHome home;
  const std::string bundle = folder / "sent/ux/010100000";
  const std::string products = home / "registry/products.tbl";
};

TEST_F(BundleInstaller, KeepsLinesThatAreNotUtf8) {
  const std::string other = "\"zz\",\"\xFCnix\",\"lx8266\",\"1\",\"1\"\n";
  const std::string setting = "# f\xFCr alle\n";
  std::ofstream(products, std::ios::app) << other;
  std::ofstream(home / "config/ux.config", std::ios::app) << setting;
  EXPECT_EQ(install("LC_ALL=C.UTF-8").exit_code, 0);
  EXPECT_THAT(readWholeFile(products), testing::EndsWith(other));
  EXPECT_THAT(readWholeFile(home / "config/ux.config"), HasSubstr(setting));
}

TEST_F(BundleInstaller, AddsItsLineToAConfigurationWithoutALineEndAtItsEnd) {
  std::ofstream(home / "config/ux_inst1.config") << "PROGRAM=/bin/false\nPORT=1";
  ASSERT_EQ(install().exit_code, 0);
  EXPECT_EQ(readWholeFile(home / "config/ux_inst1.config"),
            "PORT=1\nPROGRAM=" + (home / "zlpqor6/lx8266/ux/bin/prometheus-node-exporter") + "\n");
}

TEST_F(BundleInstaller, FullDiskLeavesTheInventoryAndTheConfigurationAsTheyWere) {
  for (const std::string file : {"registry/products.tbl", "config/ux.config", "config/ux_inst1.config"}) {
    const std::string before = readWholeFile(home / file);
    fs::create_symlink("/dev/full", (home / file) + ".new");
    const Outcome outcome = install();
    EXPECT_EQ(outcome.exit_code, 1) << file;
    EXPECT_THAT(outcome.output,
                HasSubstr("install.sh: cannot write in " + fs::path(home / file).parent_path().string()));
    ASSERT_FALSE(fs::is_symlink(home / file)) << file;
    EXPECT_EQ(readWholeFile(home / file), before);
    EXPECT_FALSE(fs::is_symlink((home / file) + ".new")) << "left behind";
  }
  EXPECT_EQ(install().exit_code, 0);
  EXPECT_EQ(namesIn("registry"), "archdsc.tbl\nproducts.tbl\n");
}

}  // namespace
