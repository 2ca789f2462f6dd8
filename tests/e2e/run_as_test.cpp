// Agents that run as another user, as the file config/HOST_vmqrunas.cfg says.

#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"
#include "tests/support/scratch_file_system.h"

namespace {

namespace fs = std::filesystem;

/// A user whom only this process and its children know, by an /etc/passwd of their own: nobody else's login files are
/// run. Where that cannot be had it is root, as whom a process of root's may run anything too.
class OwnUser {
 public:
  OwnUser() {
    if (geteuid() != 0 || !canMount()) return;
    useOwnMountTable();
    const std::string line = "vmq-test:*:54321:54321::" + directory_.path().string() + ":/bin/sh\n";
    const std::string accounts = directory_.writeFile("passwd", readWholeFile("/etc/passwd") + line);
    mounted_ = mount(accounts.c_str(), "/etc/passwd", nullptr, MS_BIND, nullptr) == 0;
    fs::permissions(directory_.path(), fs::perms(0755));
    fs::permissions(accounts, fs::perms(0644));
  }
  ~OwnUser() {
    if (mounted_) {
      EXPECT_EQ(umount2("/etc/passwd", MNT_DETACH), 0);
    }
  }
  OwnUser(const OwnUser&) = delete;
  OwnUser& operator=(const OwnUser&) = delete;

  [[nodiscard]] std::string name() const { return mounted_ ? "vmq-test" : "root"; }
  [[nodiscard]] uid_t id() const { return mounted_ ? 54321 : 0; }

 private:
  const TemporaryDirectory directory_;
  bool mounted_ = false;
};

class RunAs : public Deployment {
 protected:
  RunAs() {
    home.openToEveryUser();
    startDaemon();
  }

  [[nodiscard]] std::string file() const {
    std::array<char, 256> host{};
    gethostname(host.data(), host.size() - 1);
    const std::string name = host.data();
    return home / ("config/" + name.substr(0, name.find('.')) + "_vmqrunas.cfg");
  }

  void write(const std::string& text) const { std::ofstream(file()) << text; }

  /// A file that names this user for the agent "ux" without an instance.
  void nameUser(const std::string& user) const {
    write("<runas>\n\t<agent>\n\t\t<productCode>ux</productCode>\n\t\t<instance>\n\t\t\t<name></name>\n\t\t\t<user>" +
          user + "</user>\n\t\t</instance>\n\t</agent>\n</runas>\n");
  }

  [[nodiscard]] std::string wrapped(const std::string& user, const std::string& rest) const {
    return "/usr/bin/su - " + user + " -c \"" + command(rest) + "\"";
  }

  Json start() { return carryOut({{"COMMAND", "START"}, {"TRANSID", "t1"}, {"PRODUCT", "ux"}}); }

  /// Whether the agent got the daemon's environment, which `su -` does not pass on.
  [[nodiscard]] bool environmentIsTheDaemons() const {
    return readWholeFile("/proc/" + std::to_string(home.pid("ux").value()) + "/environ").find("CORVELHOME=") !=
           std::string::npos;
  }

  const OwnUser own_user;  // known before the daemon starts, which then knows it too
};

TEST_F(RunAs, WithoutAFileTheAgentRunsAsTheDaemonsUser) {
  EXPECT_THAT(start(), Succeeded());
  EXPECT_TRUE(environmentIsTheDaemons());
}

TEST_F(RunAs, FileThatCannotBeReadCountsAsNone) {
  fs::create_directory(file());  // root could read any file
  EXPECT_THAT(start(), Succeeded());
  EXPECT_TRUE(environmentIsTheDaemons());
}

TEST_F(RunAs, MalformedFileCountsAsNone) {
  nameUser("no-such-user");
  const std::string whole = readWholeFile(file());
  write(whole.substr(0, whole.size() - 3));
  EXPECT_THAT(start(), Succeeded());
  EXPECT_TRUE(environmentIsTheDaemons());
}

TEST_F(RunAs, UserOfAnotherProductOrInstanceIsNotThisAgents) {
  for (const char* text :
       {"<runas><agent><productCode>lz</productCode><instance><name></name><user>no-such-user</user></instance></agent>"
        "</runas>",
        "<runas><agent><productCode>ux</productCode><instance><name>inst1</name><user>no-such-user</user></instance>"
        "</agent></runas>"}) {
    write(text);
    EXPECT_THAT(start(), Succeeded());
  }
}

TEST_F(RunAs, UserWhomSuRefusesFailsTheStartWithTheWholeCommand) {
  nameUser("no-such-user");
  EXPECT_THAT(start(), Failed(1024, wrapped("no-such-user", "start ux")));
}

TEST_F(RunAs, UserWithoutALoginShellFailsTheStop) {
  ASSERT_THAT(start(), Succeeded());
  nameUser("nobody");
  EXPECT_THAT(carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}),
              Failed(1024, wrapped("nobody", "-c stop ux")));
  EXPECT_TRUE(isRunning(home.pid("ux").value()));
}

TEST_F(RunAs, AgentRunsAsTheUserNamedForIt) {
  nameUser(own_user.name());
  if (geteuid() != 0) {
    EXPECT_THAT(start(), Failed(1024, wrapped(own_user.name(), "start ux"))) << "su ran without a password";
    return;
  }
  ASSERT_THAT(start(), Succeeded());
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_FALSE(environmentIsTheDaemons());
  struct stat process {};
  ASSERT_EQ(stat(("/proc/" + std::to_string(home.pid("ux").value())).c_str(), &process), 0);
  EXPECT_EQ(process.st_uid, own_user.id());

  EXPECT_THAT(carryOut({{"COMMAND", "STOP"}, {"TRANSID", "t2"}, {"PRODUCT", "ux"}}), Succeeded());
  EXPECT_FALSE(answers(home.port("ux")));
}

// The file is read anew for each request.
TEST_F(RunAs, ChangedFileHoldsFromTheNextRequestOn) {
  nameUser("no-such-user");
  EXPECT_EQ(start()["RETVAL"], 1024);
  fs::remove(file());
  EXPECT_THAT(start(), Succeeded());
}

}  // namespace
