// Requests and tools that are larger, stranger or more than usual: nothing is lost, and nothing is run that was
// not asked.

#include <sys/stat.h>

#include <algorithm>
#include <clocale>
#include <fstream>
#include <thread>

#include "bss1.h"
#include "mgmt/initialize.h"
#include "tests/mgmt/deployment_case.h"
#include "tests/mgmt/fresh_process.h"

namespace {

using testing::ElementsAre;
using testing::ElementsAreArray;

constexpr char kInventory[] = R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END)";
constexpr char kTranslator[] = "zlpqor6/lx8266/bin/vmq_xa";

std::map<std::string, std::string> translating(const std::string& body) {
  return {{"bin/qinfo", kInventory}, {kTranslator, body}};
}

std::vector<std::string> afterLookup(std::vector<std::string> commands) {
  commands.insert(commands.begin(), {"~/bin/qinfo -d ", "~/bin/qinfo -d "});
  return commands;
}

const std::string kMuch = "head -c 1048576 /dev/zero | tr '\\0' e";
/// As long as a value of a query may be.
const std::string kConfiguration = "INSTANCE=inst1\n" + std::string(65535 - 15 - 6, 'k') + "=last\n";
const std::string kSet = "~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux";
const std::string kGet = "~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux";

std::vector<RequestDetail::Predicate> setting(const std::string& context) {
  return asked("SETCONFIG", {equal("PRODUCT", "ux"), equal("CONTEXT", context)});
}

AnswerRow answerTo(const std::string& command, const std::string& context = "", const std::string& product = "ux") {
  return {.originnode = kNode, .transid = "t1", .command = command, .product = product, .context = context};
}

StatusEvent ended(const std::string& command, int retval = 0, const std::string& parameter = "") {
  return {.originnode = kNode,
          .transid = "t1",
          .command = command,
          .retval = retval,
          .retmsgid = retval == 0 ? "" : "VMQ" + std::to_string(retval) + "E",
          .retmsgparm = parameter};
}

// ---- much of everything --------------------------------------------------------------------------------------------

const DeploymentCase kMuchOfEverything[] = {
    {.situation = "a translator that reads a long configuration gets all of it",
     .request = setting(kConfiguration),
     .tools = translating("cat > ~/given"),
     .commands = afterLookup({kSet}),
     .answer = answerTo("SETCONFIG", kConfiguration),
     .events = {ended("SETCONFIG")},
     .leaves = {{"given", kConfiguration}}},
    {.situation = "a translator that ignores a long configuration is judged by its exit code",
     .request = setting(kConfiguration),
     .tools = translating("exit 0"),
     .commands = afterLookup({kSet}),
     .answer = answerTo("SETCONFIG", kConfiguration),
     .events = {ended("SETCONFIG")}},
    {.situation = "a translator that reads the beginning of a long configuration",
     .request = setting(kConfiguration),
     .tools = translating("head -c 15 > ~/given"),
     .commands = afterLookup({kSet}),
     .answer = answerTo("SETCONFIG", kConfiguration),
     .events = {ended("SETCONFIG")},
     .leaves = {{"given", "INSTANCE=inst1\n"}}},
    {.situation = "a translator that prints much before it reads",
     .request = setting(kConfiguration),
     .tools = translating(kMuch + "; " + kMuch + " >&2; cat > ~/given"),
     .commands = afterLookup({kSet}),
     .answer = answerTo("SETCONFIG", kConfiguration),
     .events = {ended("SETCONFIG")},
     .leaves = {{"given", kConfiguration}}},
    {.situation = "a translator that fails with much on its standard error",
     .request = setting("INSTANCE=inst1\n"),
     .tools = translating(kMuch + " >&2; exit 65"),
     .commands = afterLookup({kSet}),
     .answer = answerTo("SETCONFIG", "INSTANCE=inst1\n"),
     .events = {ended("SETCONFIG", 1008, "SETCONFIG,ux,65," + kSet + "," + std::string(1048576, 'e'))},
     .errors = {"VMQ1008E Received bad return code [65] from two-way translator command [" + kSet + "], STDERR=[" +
                std::string(1048576, 'e') + "]"}},
    {.situation = "a configuration is taken from between much else",
     .request = asked("GETCONFIG", {equal("PRODUCT", "ux")}),
     .tools = translating(kMuch + " >&2; " + kMuch + "; echo; echo INSTANCE=inst1; echo A=1; " + kMuch + " >&2"),
     .commands = afterLookup({kGet}),
     .answer = answerTo("GETCONFIG", "INSTANCE=inst1\nA=1\n")},
    {.situation = "a configuration longer than its column is cut",
     .request = asked("GETCONFIG", {equal("PRODUCT", "ux")}),
     .tools = translating("echo INSTANCE=inst1; " + kMuch),
     .commands = afterLookup({kGet}),
     .answer = answerTo("GETCONFIG", "INSTANCE=inst1\n" + std::string(1048576, 'e'))},
    {.situation = "an installer that prints much",
     .request =
         asked("INSTALL", {equal("PRODUCT", "ux"), equal("VERSION", "06.20"), equal("CONTEXT", "|DEPOTDIR|i.sh")}),
     .tools = {{"depot/i.sh", kMuch + " >&2; " + kMuch}},
     .commands = {"~/depot/i.sh"},
     .answer = {.originnode = kNode,
                .transid = "t1",
                .command = "INSTALL",
                .product = "ux",
                .context = "|DEPOTDIR|i.sh",
                .version = "06.20"},
     .events = {ended("INSTALL")}},
};
/// What the installer's exit code file may hold. "missing": nothing of that name; "directory": a directory.
DeploymentCase completed(const char* situation, const std::string& rc_txt, const std::string& parameter = "") {
  AnswerRow row = answerTo("COMPLETE_INSTALL", "", "");
  if (!parameter.empty()) {
    row.retval = 1031;
    row.retmsgid = "VMQ1031E";
    row.retmsgparm = "~/depot/rc.txt," + parameter;
  }
  DeploymentCase c{.situation = situation, .request = asked("COMPLETE_INSTALL", {}), .answer = row};
  c.files = {{rc_txt == "directory" ? "depot/rc.txt/file" : "depot/rc.txt", rc_txt}};
  return c;
}

const DeploymentCase kExitCodeFiles[] = {
    completed("a directory in place of the exit code", "directory", "NOTFOUND"),
    completed("a negative exit code", "-1\n", "-1"),
    completed("an exit code behind much white space", std::string(1 << 20, ' ') + "3\n", "3"),
    completed("a file of digits without end", std::string(1 << 20, '9')),
    completed("the largest number, which does not convert", "2147483647\n"),
    completed("a larger number, which does", "3000000000\n", "-1294967296"),
    completed("two numbers", "3 4\n"),
    completed("a number with its unit", "3x\n"),
    completed("lines behind the number", "3\nmore\n"),
    completed("an exit code of another system's line end", "3\r\n", "3"),
    completed("a file that begins with a zero byte", std::string("\0003\n", 3)),
};

// ---- codes that a shell would not read as they are ------------------------------------------------------------------

std::vector<DeploymentCase> productsThatMustNotStandInTheScript() {
  std::vector<DeploymentCase> cases;
  // What they would remove or run, were they let into the script, is harmless.
  for (const char* product :
       {".",       "..",  "/",       "u/x",   "../ux",  "u vmq-none", " ",  "u\tvmq-none", "u\nvmq-none",
        "ux;true", "ux&", "ux|true", "$HOME", "`true`", "$(true)",    "u*", "u?",          "[u]",
        "{u,x}",   "ux>", "ux<",     "u'x",   "u\"x",   "u\\x",       "#",  "~u"}) {
    cases.push_back(
        {.situation = product,
         .request = asked("INSTALL", {equal("PRODUCT", product), equal("VERSION", "1"),
                                      equal("CONTEXT", "|DEPOTDIR|i.sh"), equal("OPTIONAL", "REQUIRES_RESTART")}),
         .tools = translating("exit 0"),
         .commands = afterLookup({}),
         .answer = {.originnode = kNode,
                    .transid = "t1",
                    .command = "INSTALL",
                    .product = product,
                    .context = "|DEPOTDIR|i.sh",
                    .optional = "REQUIRES_RESTART",
                    .version = "1"},
         .events = {ended("INSTALL", 1031, "~/depot/i.sh")},
         .absent = {"depot/runcmd.sh"}});
    if (std::string(product) == "~u") continue;  // in the expected texts that is a path in the home
    cases.back().errors = {std::string("VMQ1031E Product code [") + product + "] must not stand in a script"};
  }
  return cases;
}

class DeploymentLimits : public DeploymentRun {};

TEST_P(DeploymentLimits, AreKept) {
  run(GetParam());
}

INSTANTIATE_TEST_SUITE_P(Size, DeploymentLimits, testing::ValuesIn(kMuchOfEverything));
INSTANTIATE_TEST_SUITE_P(ExitCodeFile, DeploymentLimits, testing::ValuesIn(kExitCodeFiles));

/// In the installation home as the current directory: a script that is wrong may remove what it finds there.
class ProductInScript : public DeploymentRun {
 protected:
  ProductInScript() { std::filesystem::current_path(home.path()); }
  ~ProductInScript() override { std::filesystem::current_path(before_); }

 private:
  const std::filesystem::path before_ = std::filesystem::current_path();
};

TEST_P(ProductInScript, IsRefusedUnlessItIsOneWordOfTheShell) {
  run(GetParam());
}

INSTANTIATE_TEST_SUITE_P(All, ProductInScript, testing::ValuesIn(productsThatMustNotStandInTheScript()));

TEST_F(DeploymentLimits, ShellCharactersReachTheControlScriptAsTheyAre) {
  home.controlScript("exit 0");
  StatusEvents events;
  const std::string owned = home.path() + "/owned";
  for (const std::string& product :
       {"ux;touch " + owned, "$(touch " + owned + ")", "`touch " + owned + "`", "ux&&touch " + owned,
        "ux|touch " + owned, "ux>" + owned, "ux\ntouch " + owned, std::string("../../*")}) {
    ask({equal("COMMAND", "START"), equal("TRANSID", "t1"), equal("PRODUCT", product)});
    EXPECT_EQ(events.next(), ended("START").bytes());
    EXPECT_EQ(readWholeFile(home.path() + "/runs"), "-h " + home.path() + " start " + product + "\n");
    std::filesystem::remove(home.path() + "/runs");
    EXPECT_FALSE(std::filesystem::exists(owned)) << product;
  }
}

TEST_F(DeploymentLimits, ShellCharactersReachTheTranslatorAsTheyAre) {
  home.tool("bin/qinfo", kInventory);
  home.tool(kTranslator, "for word; do echo \"[$word]\"; done > '" + home.path() + "/words'; echo INSTANCE=x");
  ask(asked("GETCONFIG", {equal("PRODUCT", "u x"), equal("TARGETMSN", "$(touch owned);`id`|cat>f&")}));
  EXPECT_EQ(readWholeFile(home.path() + "/words"), "[-g]\n[$(touch]\n[owned);`id`|cat>f&]\n[-pc]\n[u]\n[x]\n");
}

// ---- parameters that are longer than their columns -----------------------------------------------------------------

TEST_F(DeploymentLimits, LongParametersAreWholeForTheTaskAndCutInItsRows) {
  const std::string transaction(100, 't'), version(20, 'v'), target(100, 'm');
  home.tool("depot/ux/" + version + "/i.sh", "echo ran > '" + home.path() + "/ran'");
  StatusEvents events;
  const AnswerRow answer{.originnode = kNode,
                         .transid = std::string(84, 't'),
                         .command = "INSTALL",
                         .product = "ux",
                         .context = "|DEPLOYDIR|/i.sh",
                         .version = std::string(12, 'v'),
                         .targetmsn = std::string(64, 'm')};
  EXPECT_THAT(ask({equal("COMMAND", "INSTALL"), equal("TRANSID", transaction), equal("PRODUCT", "ux"),
                   equal("VERSION", version), equal("CONTEXT", "|DEPLOYDIR|/i.sh"), equal("TARGETMSN", target)}),
              ElementsAre(answer.bytes()));
  const StatusEvent event{
      .originnode = kNode, .transid = std::string(84, 't'), .command = "INSTALL", .targetmsn = std::string(64, 'm')};
  EXPECT_EQ(events.next(), event.bytes());
  EXPECT_EQ(readWholeFile(home.path() + "/ran"), "ran\n");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Result data \"" + version + "\" was truncated to \"" + std::string(12, 'v') +
                                        "\" because it exceeded the maximum size of 12 characters"));
}

TEST_F(DeploymentLimits, LongFileNamesAreCopiedWhole) {
  const std::string model(60, 'm');
  std::string scripts;
  for (int i = 100; i < 200; ++i) scripts += (i == 100 ? "" : ",") + std::string("script") + std::to_string(i) + ".sh";
  for (int i = 100; i < 200; ++i) home.file("depot/script" + std::to_string(i) + ".sh", std::to_string(i));
  home.file("depot/" + model, "model");
  home.file("config/um.config", atHome("KUMP_META_PATH=~/meta\nKUM_WORK_PATH=~/work/um\nKUMP_RB_PATH=~/rb\n"
                                       "KUMA_STARTUP_DP=asfs\n"));
  home.file("meta/.keep", "");
  home.file("work/scripts/.keep", "");
  home.tool("bin/qinfo", "echo 'Platform codes:'; echo 'lx8266 Product (um)'");
  home.tool("bin/um_console", "echo asfs");
  StatusEvents events;
  AnswerRow answer = answerTo("SETCONFIG", "", "um");
  answer.daconfig = model.substr(0, 32);
  answer.dascript = scripts.substr(0, 512);
  EXPECT_THAT(ask(asked("SETCONFIG", {equal("PRODUCT", "um"), equal("DACONFIG", model), equal("DASCRIPT", scripts)})),
              ElementsAre(answer.bytes()));
  EXPECT_EQ(events.next(), ended("SETCONFIG").bytes());
  EXPECT_EQ(readWholeFile(home.path() + "/meta/" + model), "model");
  for (int i = 100; i < 200; ++i)
    EXPECT_EQ(readWholeFile(home.path() + "/work/scripts/script" + std::to_string(i) + ".sh"), std::to_string(i));
}

// ---- configurations in other languages -----------------------------------------------------------------------------

/// Puts a configuration, gets it back and compares the bytes, in a process that begins with the locale.
void configureThereAndBack(const char* locale, const std::string& configuration) {
  ASSERT_NE(std::setlocale(LC_ALL, locale), nullptr) << locale;
  const InstallationHome home;
  const TEST_RecordedSleeps sleeps;
  vmqhost::setOriginNode(kNode);
  Initialize_Mgmt_Functions();
  home.tool("bin/qinfo", kInventory);
  home.tool(kTranslator, "cd '" + home.path() + "'\ncase $1 in -p) cat > kept ;; -g) cat kept ;; esac");
  StatusEvents events;
  EXPECT_THAT(ask(setting(configuration)), ElementsAre(answerTo("SETCONFIG", configuration).bytes()));
  EXPECT_EQ(events.next(), ended("SETCONFIG").bytes());
  EXPECT_EQ(readWholeFile(home.path() + "/kept"), configuration);
  EXPECT_THAT(ask(asked("GETCONFIG", {equal("PRODUCT", "ux")})),
              ElementsAre(answerTo("GETCONFIG", configuration).bytes()));
}

const std::string kInAllLanguages =
    "INSTANCE=größe\nπ=3,14\nパス=/日本/語\nmood=\U0001F600\U0001D11E\ncombined=e\u0301\nend=\u00FF\u0100\uFFFD";

TEST(ConfigurationInAllLanguages, ComesBackUnchangedInUtf8) {
  IN_FRESH_PROCESS(configureThereAndBack("C.UTF-8", kInAllLanguages));
}

TEST(ConfigurationInAllLanguages, ComesBackUnchangedInThePlainLocale) {
  IN_FRESH_PROCESS(configureThereAndBack("C", kInAllLanguages));
}

std::string everyByte() {
  std::string bytes = "INSTANCE=";
  for (int byte = 1; byte < 256; ++byte) bytes += static_cast<char>(byte);
  return bytes;
}

TEST(ConfigurationOfEveryByte, ComesBackUnchangedInThePlainLocale) {
  IN_FRESH_PROCESS(configureThereAndBack("C", everyByte()));
}

// ---- many requests -------------------------------------------------------------------------------------------------

std::string numbered(int number) {
  return "r" + std::to_string(1000 + number);
}

class ManyRequests : public DeploymentRun {
 protected:
  static constexpr int kCount = 200;

  /// Requests from now on wait for open() behind an installer, which may take its time.
  void close() {
    const std::string gate = home.path() + "/gate";
    ASSERT_EQ(mkfifo(gate.c_str(), 0600), 0);
    home.controlScript("exit 0");
    home.tool("depot/wait.sh", "read go < '" + gate + "'");
    ask(asked("INSTALL", {equal("PRODUCT", "ux"), equal("VERSION", "1"), equal("CONTEXT", "|DEPOTDIR|wait.sh")}));
  }
  /// Ends the installer and takes its event.
  void open(StatusEvents& events) {
    std::ofstream(home.path() + "/gate") << "go\n";  // waits for the reader
    EXPECT_EQ(events.next(), ended("INSTALL").bytes());
  }
  static void queue(const std::string& name) {
    const AnswerRow accepted{.originnode = kNode, .transid = name, .command = "START", .product = name};
    EXPECT_THAT(ask({equal("COMMAND", "START"), equal("TRANSID", name), equal("PRODUCT", name)}),
                ElementsAre(accepted.bytes()));
  }
  static std::string event(const std::string& name) {
    return StatusEvent{.originnode = kNode, .transid = name, .command = "START"}.bytes();
  }
  std::string run(const std::string& name) const { return "-h " + home.path() + " start " + name; }
};

TEST_F(ManyRequests, KeepTheirOrderAndHaveOneEventEach) {
  StatusEvents events;
  close();
  std::vector<std::string> runs;
  for (int i = 0; i < kCount; ++i) {
    queue(numbered(i));
    runs.push_back(run(numbered(i)));
  }
  open(events);
  for (int i = 0; i < kCount; ++i) EXPECT_EQ(events.next(), event(numbered(i)));
  queue("last");
  EXPECT_EQ(events.next(), event("last"));
  runs.push_back(run("last"));
  EXPECT_THAT(home.runs(), ElementsAreArray(runs));
}

TEST_F(ManyRequests, OfManyClientsLoseNoneAndKeepTheOrderOfEachClient) {
  constexpr int kClients = 8;
  StatusEvents events;
  close();
  std::vector<std::thread> clients;
  for (int client = 0; client < kClients; ++client)
    clients.emplace_back([client] {
      for (int i = client * kCount / kClients; i < (client + 1) * kCount / kClients; ++i) queue(numbered(i));
    });
  for (std::thread& client : clients) client.join();
  open(events);
  std::vector<std::string> order;
  for (int i = 0; i < kCount; ++i) order.push_back(events.next());
  queue("last");
  EXPECT_EQ(events.next(), event("last"));
  for (int client = 0; client < kClients; ++client) {
    std::vector<std::string> expected, got;
    for (int i = client * kCount / kClients; i < (client + 1) * kCount / kClients; ++i)
      expected.push_back(event(numbered(i)));
    std::copy_if(order.begin(), order.end(), std::back_inserter(got),
                 [&](const std::string& row) { return std::count(expected.begin(), expected.end(), row) != 0; });
    EXPECT_EQ(got, expected) << "client " << client;
  }
}

TEST_F(ManyRequests, ThatAreAnsweredAtOnceGetTheirOwnAnswersWhileOthersWait) {
  constexpr int kClients = 8;
  constexpr int kEach = 5;
  home.tool("bin/qinfo", kInventory);
  home.tool(kTranslator, "echo \"INSTANCE=$2\"");
  StatusEvents events;
  close();
  std::vector<std::thread> clients;
  for (int client = 0; client < kClients; ++client) {
    clients.emplace_back([client] {
      for (int i = client * kEach; i < (client + 1) * kEach; ++i) {
        AnswerRow answer = answerTo("GETCONFIG", "INSTANCE=" + numbered(i) + "\n");
        answer.targetmsn = numbered(i);
        EXPECT_THAT(ask(asked("GETCONFIG", {equal("PRODUCT", "ux"), equal("TARGETMSN", numbered(i))})),
                    ElementsAre(answer.bytes()));
      }
    });
  }
  for (std::thread& client : clients) client.join();
  EXPECT_TRUE(events.none());
  open(events);
}

}  // namespace
