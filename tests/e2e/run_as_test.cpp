// Agents that run as another user, as the file config/HOST_vmqrunas.cfg says.

#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "tests/e2e/deployment.h"
#include "tests/e2e/loopback.h"

namespace {

namespace fs = std::filesystem;

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

  /// Someone as whom `su -` runs commands: not root where the machine has such a user, else root; nobody when this
  /// process is not root and so would be asked for a password.
  static std::string userWithShell() {
    if (geteuid() != 0) return "";
    std::string found = "root";
    setpwent();
    while (const passwd* entry = getpwent()) {
      const std::string user = entry->pw_name;
      if (entry->pw_uid == 0 || !std::string(entry->pw_shell).ends_with("sh")) continue;
      if (runShell("/usr/bin/su - " + user + " -c true </dev/null").exit_code != 0) continue;
      found = user;
      break;
    }
    endpwent();
    return found;
  }

  /// Whether the agent got the daemon's environment, which `su -` does not pass on.
  [[nodiscard]] bool environmentIsTheDaemons() const {
    return readWholeFile("/proc/" + std::to_string(home.pid("ux").value()) + "/environ").find("CORVELHOME=") !=
           std::string::npos;
  }
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
  const std::string user = userWithShell();
  if (user.empty()) {
    nameUser("root");
    EXPECT_THAT(start(), Failed(1024, wrapped("root", "start ux"))) << "su ran without a password";
    return;
  }
  nameUser(user);
  ASSERT_THAT(start(), Succeeded());
  EXPECT_TRUE(answers(home.port("ux")));
  EXPECT_FALSE(environmentIsTheDaemons());
  struct stat process {};
  ASSERT_EQ(stat(("/proc/" + std::to_string(home.pid("ux").value())).c_str(), &process), 0);
  EXPECT_EQ(process.st_uid, getpwnam(user.c_str())->pw_uid) << user;

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
