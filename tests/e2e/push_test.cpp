// Files sent by vmqctl to the real daemon, as they then lie in the depot.

#include <sys/stat.h>

#include <csignal>
#include <filesystem>
#include <functional>
#include <future>
#include <map>
#include <random>

#include "tests/e2e/deployment.h"
#include "tests/support/process_memory.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
namespace fs = std::filesystem;

constexpr std::size_t chunkBytes = 1022 * 4096;  // of the largest packet by default

class PushTest : public Deployment {
 protected:
  [[nodiscard]] std::string inDepot(const std::string& name) const { return daemon->depot() + "/" + name; }

  /// Bytes of every value, the same for the same seed.
  static std::string randomBytes(std::size_t count, unsigned seed) {
    std::mt19937 generator(seed);
    std::string text(count, '\0');
    for (char& c : text) c = static_cast<char>(generator());
    return text;
  }
  /// True when the file in the depot holds these bytes (which may be too many to be shown).
  [[nodiscard]] bool holds(const std::string& name, const std::string& bytes) const {
    return readWholeFile(inDepot(name)) == bytes;
  }

  /// Kills the daemon where the condition holds: it stands still while it is looked at.
  void killDaemonWhere(const std::function<bool()>& condition) {
    ASSERT_TRUE(soon([&] {
      daemon->process().signal(SIGSTOP);
      if (condition()) return true;
      daemon->process().signal(SIGCONT);
      return false;
    })) << "the push was over before that";
    daemon->kill();
  }

  TemporaryDirectory source_;
};

TEST_F(PushTest, FolderLiesInTheDepotByteForByte) {
  startDaemon();
  const std::map<std::string, std::string> files = {
      {"ux/empty", ""},
      {"ux/one", "\x1A"},
      {"ux/block", randomBytes(4096, 1)},
      {"ux/chunk", randomBytes(chunkBytes, 2)},
      {"ux/deep/er/chunk and a byte", randomBytes(chunkBytes + 1, 3)},
      {"ux/three chunks", randomBytes(3 * chunkBytes, 4)},
  };
  for (const auto& [name, bytes] : files) source_.writeFile(name, bytes);
  const Outcome outcome = vmqctl("push --verify " + quoted(source_ / "ux"));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  for (const auto& [name, bytes] : files) {
    EXPECT_TRUE(holds(name, bytes)) << name;
    struct stat found = {};
    ASSERT_EQ(stat(inDepot(name).c_str(), &found), 0) << name;
    EXPECT_EQ(found.st_mode & 07777, 0770U) << name;
  }
}

TEST_F(PushTest, ScriptsArriveWithTheLineEndsOfUnix) {
  startDaemon();
  std::string written;
  std::string expected;
  for (int line = 0; written.size() < 2 * chunkBytes; ++line) {
    written += "line " + std::to_string(line) + "\r\n";
    expected += "line " + std::to_string(line) + "\n";
  }
  written += '\x1A';
  const Outcome outcome =
      vmqctl("push --verify --to b " + quoted(source_.writeFile("install.sh", written)) + " " +
             quoted(source_.writeFile("sales.mdl", "a\r\nb")) + " " + quoted(source_.writeFile("kept.txt", "a\r\nb")));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_TRUE(holds("b/install.sh", expected));
  EXPECT_TRUE(holds("b/sales.mdl", "a\nb"));
  EXPECT_TRUE(holds("b/kept.txt", "a\r\nb"));
}

TEST_F(PushTest, VerifyNoticesThatAConversionFailed) {
  fs::remove_all(home / "tmp");
  startDaemon();
  const std::string script = quoted(source_.writeFile("install.sh", "a\r\n"));
  EXPECT_EQ(vmqctl("push " + script).exit_code, 0);
  const Outcome outcome = vmqctl("push --verify " + script);
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("What was stored is not what was sent: it has 3 bytes"));
}

TEST_F(PushTest, RepeatedPushReplacesWhatWasThere) {
  startDaemon();
  const std::string file = source_.writeFile("a", randomBytes(2 * chunkBytes, 1));
  ASSERT_EQ(vmqctl("push " + quoted(file)).exit_code, 0);
  ASSERT_EQ(vmqctl("push " + quoted(file)).exit_code, 0);
  EXPECT_TRUE(holds("a", randomBytes(2 * chunkBytes, 1)));
  source_.writeFile("a", "short");
  ASSERT_EQ(vmqctl("push --verify " + quoted(file)).exit_code, 0);
  EXPECT_TRUE(holds("a", "short"));
}

TEST_F(PushTest, NamesInOtherLettersArriveAsTheyAre) {
  startDaemon();
  const std::string name = "\xC3\xBC\xE2\x82\xAC \xF0\x9F\x98\x80 'q'";
  const Outcome outcome =
      vmqctl("push --verify " + quoted(source_.writeFile(name + "/" + name, "x")) + " --to " + quoted(name));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_TRUE(holds(name + "/" + name, "x"));
}

TEST_F(PushTest, NameOf255BytesArrives) {
  startDaemon();
  // Four folders of 49 letters and a file: 255 bytes.
  std::string folder;
  for (int i = 0; i < 4; ++i) folder += std::string(49, static_cast<char>('a' + i)) + "/";
  const std::string name(55, 'f');
  const Outcome outcome = vmqctl("push --verify --to " + folder + " " + quoted(source_.writeFile(name, "x")));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_TRUE(holds(folder + name, "x"));
}

TEST_F(PushTest, ClientsAtOnceDoNotMixTheirFiles) {
  startDaemon();
  std::vector<std::future<Outcome>> pushes;
  for (unsigned client = 0; client < 2; ++client) {
    const std::string folder = "c" + std::to_string(client);
    source_.writeFile(folder + "/data", randomBytes(3 * chunkBytes + 5, client));
    for (int i = 0; i < 20; ++i) {
      source_.writeFile(folder + "/" + std::to_string(i) + "/install.sh", folder + "\r\n" + std::to_string(i) + "\r\n");
    }
    pushes.push_back(
        std::async(std::launch::async, [this, folder] { return vmqctl("push --verify " + quoted(source_ / folder)); }));
  }
  for (unsigned client = 0; client < 2; ++client) {
    const std::string folder = "c" + std::to_string(client);
    const Outcome outcome = pushes[client].get();
    EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
    EXPECT_TRUE(holds(folder + "/data", randomBytes(3 * chunkBytes + 5, client)));
    for (int i = 0; i < 20; ++i) {
      EXPECT_TRUE(holds(folder + "/" + std::to_string(i) + "/install.sh", folder + "\n" + std::to_string(i) + "\n"));
    }
  }
}

TEST_F(PushTest, ClientsThatFindNoRoomForTheirPacketsWait) {
  startDaemon({"maximum_packet_bytes = 1048576", "packet_memory_bytes = 1048576"});
  std::vector<std::future<Outcome>> pushes;
  for (unsigned client = 0; client < 3; ++client) {
    const std::string file = source_.writeFile("c" + std::to_string(client), randomBytes(5 * chunkBytes, client));
    pushes.push_back(
        std::async(std::launch::async, [this, file] { return vmqctl("push --timeout 60 " + quoted(file)); }));
  }
  for (unsigned client = 0; client < 3; ++client) {
    const Outcome outcome = pushes[client].get();
    EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
    EXPECT_TRUE(holds("c" + std::to_string(client), randomBytes(5 * chunkBytes, client)));
  }
}

TEST_F(PushTest, SmallPacketsCarryTheSameFile) {
  startDaemon({"maximum_packet_bytes = 8192"});
  const std::string bytes = randomBytes(100000, 1);
  const Outcome outcome = vmqctl("push --verify " + quoted(source_.writeFile("a", bytes)));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_THAT(outcome.output, HasSubstr(" 100000     25 "));  // bytes, calls
  EXPECT_TRUE(holds("a", bytes));
}

TEST_F(PushTest, ThatADaemonDidNotSurviveIsRepeated) {
  startDaemon({"maximum_packet_bytes = 8192"});  // one block in each
  const std::string bytes = randomBytes(std::size_t{16} << 20, 1);
  const std::string file = quoted(source_.writeFile("a", bytes));
  auto push = std::async(std::launch::async, [&] { return vmqctl("push " + file); });
  ASSERT_NO_FATAL_FAILURE(killDaemonWhere([&] {
    const std::uintmax_t arrived = fs::exists(inDepot("a")) ? fs::file_size(inDepot("a")) : 0;
    return arrived > 100000 && arrived < bytes.size();
  }));
  const Outcome broken = push.get();
  EXPECT_EQ(broken.exit_code, 7) << broken.output;
  EXPECT_THAT(broken.output, HasSubstr(" of 4096: "));
  EXPECT_THAT(broken.output, AllOf(HasSubstr("The file is incomplete on the machine."),
                                   HasSubstr("Push again: each file is begun anew.")));
  const std::string arrived = readWholeFile(inDepot("a"));
  EXPECT_LT(arrived.size(), bytes.size());
  EXPECT_TRUE(bytes.starts_with(arrived)) << "what had arrived is in order";

  daemon->start();
  const Outcome repeated = vmqctl("push --verify " + file);
  EXPECT_EQ(repeated.exit_code, 0) << repeated.output;
  EXPECT_TRUE(holds("a", bytes));
}

TEST_F(PushTest, ThatADaemonDidNotSurviveAmidAConversionIsRepeated) {
  startDaemon({"maximum_packet_bytes = 8192"});
  std::string written;
  std::string expected;
  while (written.size() < 500000) {
    written += "echo\r\n";
    expected += "echo\n";
  }
  const std::string file = quoted(source_.writeFile("install.sh", written));
  auto push = std::async(std::launch::async, [&] { return vmqctl("push " + file); });
  // Each piece converts all that was there before it, so most of the time is that.
  ASSERT_NO_FATAL_FAILURE(
      killDaemonWhere([&] { return fs::exists(home / "tmp/.vmqtemp") && fs::exists(inDepot("install.sh")); }));
  EXPECT_EQ(push.get().exit_code, 7);

  daemon->start();
  const Outcome repeated = vmqctl("push --verify " + file);
  EXPECT_EQ(repeated.exit_code, 0) << repeated.output;
  EXPECT_TRUE(holds("install.sh", expected));
  EXPECT_FALSE(fs::exists(home / "tmp/.vmqtemp")) << "a work file is left";
}

TEST_F(PushTest, LargeFileTakesNoMoreMemoryThanItsPackets) {
  startDaemon();
  constexpr std::uintmax_t bytes = std::uintmax_t{256} << 20;
  const std::string file = source_.writeFile("large", "begin");
  fs::resize_file(file, bytes);
  // The shell's limit in KiB holds for vmqctl: it fails when it needs more.
  const std::string limit = memoryTells ? "ulimit -d 65536; " : "";
  const Outcome outcome = runShell(limit + "VMQ_SOCKET=" + quoted(daemon->socket()) +
                                   " " VMQ_PROGRAMS "/vmqctl push --verify " + quoted(file));
  EXPECT_EQ(outcome.exit_code, 0) << outcome.output;
  EXPECT_EQ(fs::file_size(inDepot("large")), bytes);
  if (memoryTells) {
    EXPECT_LT(memoryOf(daemon->process().pid(), "VmHWM"), 64 * 1024);
  }
}

TEST_F(PushTest, FileInTheWayOfAFolderIsToldByItsStatus) {
  startDaemon();
  const std::string file = quoted(source_.writeFile("a", "x"));
  ASSERT_EQ(vmqctl("push " + file).exit_code, 0);
  Outcome outcome = vmqctl("push --to a " + file);
  EXPECT_EQ(outcome.exit_code, 1);
  EXPECT_THAT(outcome.output, HasSubstr("a/a, chunk 1 of 1: The machine answers with status 4: "));
  outcome = vmqctl("push --to a/b " + file);
  EXPECT_THAT(outcome.output, HasSubstr("a/b/a, chunk 1 of 1: The machine answers with status 6: "));
  EXPECT_TRUE(holds("a", "x"));
}

TEST_F(PushTest, DaemonThatIsNotThereIsTold) {
  startDaemon();
  const std::string file = source_.writeFile("a", "x");
  const Outcome outcome =
      runShell("VMQ_SOCKET=" + quoted(daemon->socket() + ".none") + " " VMQ_PROGRAMS "/vmqctl push " + quoted(file));
  EXPECT_EQ(outcome.exit_code, 7);
  EXPECT_FALSE(fs::exists(inDepot("a")));
}

TEST_F(PushTest, ProductWhoseInstallerFailsIsToldSo) {
  startDaemon();
  source_.writeFile("bundle/install.sh", "exit 3\n");
  const Outcome deployed = vmqctl("deploy " + quoted(source_ / "bundle") + " zz --version 1");
  EXPECT_EQ(deployed.exit_code, 1);
  EXPECT_THAT(deployed.output, HasSubstr("VMQ1031E"));
  EXPECT_THAT(deployed.output, HasSubstr(inDepot("zz/1/install.sh") + " " + home.path() + ",3"));
}

}  // namespace
