// The sample bundles on their way: sent by vmqctl, converted, installed and removed.

#include <filesystem>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::Not;

class BundleTransfer : public Deployment {
 protected:
  BundleTransfer() {
    startHurriedDaemon();
    assembleBundles(bundles_.path());
  }

  /// vmqctl with these arguments, which must succeed; what it prints.
  std::string done(const std::string& arguments) const {
    const Outcome outcome = vmqctl(arguments);
    EXPECT_EQ(outcome.exit_code, 0) << arguments << "\n" << outcome.output << daemon->log();
    return outcome.output;
  }

  TemporaryDirectory bundles_;
};

TEST_F(BundleTransfer, ArrivesByteForByteButForLineEnds) {
  done("push --verify " + quoted(bundles_.path()) + "/*");
  unsigned files = 0;
  unsigned converted = 0;
  for (const auto& entry : fs::recursive_directory_iterator(bundles_.path())) {
    if (!entry.is_regular_file()) continue;
    const std::string name = entry.path().lexically_relative(bundles_.path());
    const fs::path arrived = fs::path(daemon->depot()) / name;
    std::string expected = readWholeFile(entry.path());
    if (name.ends_with("install.sh") || name.ends_with(".mdl")) {
      EXPECT_THAT(expected, HasSubstr("\r\n")) << name;
      std::erase(expected, '\r');
      ++converted;
    }
    EXPECT_TRUE(readWholeFile(arrived) == expected) << name;
    EXPECT_EQ(fs::status(arrived).permissions(), fs::perms(0770)) << name;
    ++files;
  }
  EXPECT_EQ(files, 7U);
  EXPECT_EQ(converted, 3U);
  EXPECT_EQ(readWholeFile(daemon->depot() + "/ux/010100000/ux_Silent_Install.txt"), "ACTION=install\r\nPORT=19100\r\n");
}

TEST_F(BundleTransfer, ProductLivesFromPushToRemoval) {
  done("push " + quoted(bundles_ / "ux"));
  EXPECT_THAT(done("inventory ux"), Not(HasSubstr("010100000"))) << "sent is not installed";
  done(
      "install ux --version 010100000 --command '|DEPLOYDIR|/install.sh |CORVELHOME| "
      "|DEPLOYDIR|/ux_Silent_Install.txt'");
  EXPECT_THAT(done("inventory ux"), HasSubstr("ux       010100000 "));

  done("start ux");
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_THAT(done("inventory ux --running"), HasSubstr("RUNNING"));
  EXPECT_EQ(fs::read_symlink("/proc/" + std::to_string(home.pid("ux").value()) + "/exe"),
            home / "zlpqor6/lx8266/ux/bin/prometheus-node-exporter");
  done("stop ux");
  EXPECT_FALSE(answers(home.port("ux")));

  done("uninstall ux");
  EXPECT_THAT(done("inventory ux"), HasSubstr("no products"));
  EXPECT_FALSE(fs::exists(home / "zlpqor6/lx8266/ux"));
}

TEST_F(BundleTransfer, ProductIsDeployedInOneLine) {
  const std::string output = done("deploy --verify " + quoted(bundles_ / "ux/010100000") + " ux --version 010100000");
  EXPECT_THAT(output, HasSubstr("sent and verified ux/010100000/install.sh"));
  EXPECT_THAT(done("inventory ux"), HasSubstr("ux       010100000 "));
  EXPECT_TRUE(fs::exists(home / "zlpqor6/lx8266/ux/bin/prometheus-node-exporter"));
  done("uninstall ux");
  EXPECT_THAT(done("inventory ux"), HasSubstr("no products"));
}

}  // namespace
