// Installing, configuring and removing products: one case for each way in which each command can end.

#include "tests/mgmt/deployment_case.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

// ---- what the machine holds ----------------------------------------------------------------------------------------

constexpr char kInventory[] = R"(case $1 in -d) cat <<'END'
Installed products
"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"
END
esac)";
constexpr char kOnlySkippedLibraries[] = R"(cat <<'END'
"ProdCode","Description","Platform","Version","Release"
"ax","Shared libraries","sol278","062000000","100"
END)";
constexpr char kTranslator[] = "zlpqor6/lx8266/bin/vmq_xa";

/// A machine with an inventory and a translator that does `body`.
std::map<std::string, std::string> translating(const std::string& body) {
  return {{"bin/qinfo", kInventory}, {kTranslator, body}};
}

/// The commands that find the translator, then those given.
std::vector<std::string> afterLookup(std::vector<std::string> commands = {}) {
  commands.insert(commands.begin(), {"~/bin/qinfo -d ", "~/bin/qinfo -d "});
  return commands;
}

const auto kGet = asked("GETCONFIG", {equal("PRODUCT", "ux")});
const auto kSet = asked("SETCONFIG", {equal("PRODUCT", "ux"), equal("CONTEXT", "INSTANCE=inst1\nA=1\n")});
const auto kRemoveInstance = asked("REMOVEINSTANCE", {equal("PRODUCT", "ux"), equal("TARGETMSN", "inst1")});

AnswerRow answerTo(const std::string& command, const std::string& product = "ux") {
  return {.originnode = kNode, .transid = "t1", .command = command, .product = product};
}

// ---- GETCONFIG: answered at once -----------------------------------------------------------------------------------

AnswerRow getAnswer(int retval, const std::string& id, const std::string& parameter, const std::string& context = "") {
  AnswerRow row = answerTo("GETCONFIG");
  row.context = context;
  row.retval = retval;
  row.retmsgid = id;
  row.retmsgparm = parameter;
  return row;
}

// clang-format off
const DeploymentCase kGetConfig[] = {
    {.situation = "the configuration begins at its instance",
     .request = asked("GETCONFIG", {equal("PRODUCT", "ux"), equal("TARGETMSN", "m1:UX")}),
     .tools = translating("printf 'A=1\\nINSTANCE=inst1\\nB=2\\n'"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g m1:UX -pc ux"}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "GETCONFIG", .product = "ux",
                .context = "INSTANCE=inst1\nB=2\n", .targetmsn = "m1:UX"}},
    {.situation = "an empty target leaves two blanks; output without an instance is not taken",
     .request = kGet,
     .tools = translating("echo A=1"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"}),
     .answer = answerTo("GETCONFIG")},
    {.situation = "without an instance the context stays as it was asked with",
     .request = asked("GETCONFIG", {equal("PRODUCT", "ux"), equal("CONTEXT", "old")}),
     .tools = translating("echo A=1"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"}),
     .answer = getAnswer(0, "", "", "old")},
    {.situation = "the first mark that is whole counts",
     .request = kGet,
     .tools = translating("printf 'INSTANCES=2\\ninstance=inst0\\nINSTANCE=inst1\\nINSTANCE=inst2\\n'"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"}),
     .answer = getAnswer(0, "", "", "INSTANCE=inst1\nINSTANCE=inst2\n")},
    {.situation = "no inventory tool, so no translator",
     .request = kGet,
     .commands = afterLookup(),
     .answer = getAnswer(1007, "VMQ1007E", "GETCONFIG,ux"),
     .errors = {"Bad return code from Util::runCommand",
                "No two-way translator found, default translator [/vmq_xa] does not exist",
                "VMQ1007E No two-way translator found for product code [ux]"}},
    {.situation = "no translator",
     .request = kGet,
     .tools = {{"bin/qinfo", kInventory}},
     .commands = afterLookup(),
     .answer = getAnswer(1007, "VMQ1007E", "GETCONFIG,ux"),
     .errors = {"No two-way translator found, default translator [~/zlpqor6/lx8266/bin/vmq_xa] does not exist",
                "VMQ1007E No two-way translator found for product code [ux]"}},
    {.situation = "a translator that cannot be run",
     .request = kGet,
     .tools = {{"bin/qinfo", kInventory}},
     .files = {{kTranslator, "no program"}},
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"}),
     .answer = getAnswer(1009, "VMQ1009E", "GETCONFIG,ux,~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"),
     .errors = {"VMQ1009E Failed to start two way translator using command [~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux]"}},
    {.situation = "a translator that fails",
     .request = kGet,
     .tools = translating("exit 65"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"}),
     .answer = getAnswer(1008, "VMQ1008E", "GETCONFIG,ux,65,~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux"),
     .errors = {"VMQ1008E Received bad return code [65] from two-way translator "
                "command [~/zlpqor6/lx8266/bin/vmq_xa -g  -pc ux]"}},
};

// ---- SETCONFIG and REMOVEINSTANCE: the translator reads CONTEXT ----------------------------------------------------

AnswerRow setAnswer() {
  AnswerRow row = answerTo("SETCONFIG");
  row.context = "INSTANCE=inst1\nA=1\n";
  return row;
}

StatusEvent setEvent(int retval, const std::string& id, const std::string& parameter) {
  return {.originnode = kNode, .transid = "t1", .command = "SETCONFIG", .retval = retval, .retmsgid = id,
          .retmsgparm = parameter};
}

AnswerRow removeAnswer() {
  AnswerRow row = answerTo("REMOVEINSTANCE");
  row.targetmsn = "inst1";
  return row;
}

StatusEvent removeEvent(int retval, const std::string& id, const std::string& parameter) {
  return {.originnode = kNode, .transid = "t1", .command = "REMOVEINSTANCE", .retval = retval, .retmsgid = id,
          .retmsgparm = parameter, .targetmsn = "inst1"};
}

const DeploymentCase kSetConfig[] = {
    {.situation = "the translator is given the configuration, byte for byte",
     .request = kSet,
     .tools = translating("cat > ~/given"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux"}),
     .answer = setAnswer(),
     .events = {setEvent(0, "", "")},
     .leaves = {{"given", "INSTANCE=inst1\nA=1\n"}}},
    {.situation = "no translator",
     .request = kSet,
     .commands = afterLookup(),
     .answer = setAnswer(),
     .events = {setEvent(1007, "VMQ1007E", "SETCONFIG,ux")},
     .errors = {"VMQ1007E No two-way translator found for product code [ux]"}},
    {.situation = "a translator that cannot be run",
     .request = kSet,
     .tools = {{"bin/qinfo", kInventory}},
     .files = {{kTranslator, "no program"}},
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux"}),
     .answer = setAnswer(),
     .events = {setEvent(1009, "VMQ1009E", "SETCONFIG,ux,~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux")},
     .errors = {"VMQ1009E Failed to start two way translator using command [~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux]"}},
    {.situation = "a translator that fails and ignores its input",
     .request = kSet,
     .tools = translating("echo 'no such key' >&2; exit 3"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux"}),
     .answer = setAnswer(),
     .events = {setEvent(1008, "VMQ1008E", "SETCONFIG,ux,3,~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux,no such key\n")},
     .errors = {"VMQ1008E Received bad return code [3] from two-way translator "
                "command [~/zlpqor6/lx8266/bin/vmq_xa -p  -pc ux], STDERR=[no such key\n]"}},
};

const DeploymentCase kRemovals[] = {
    {.situation = "an instance goes",
     .request = kRemoveInstance,
     .tools = translating("echo gone > ~/given"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux"}),
     .answer = removeAnswer(),
     .events = {removeEvent(0, "", "")},
     .leaves = {{"given", "gone\n"}}},
    {.situation = "the translator is given the context",
     .request = asked("REMOVEINSTANCE", {equal("PRODUCT", "ux"), equal("TARGETMSN", "inst1"), equal("CONTEXT", "K=1")}),
     .tools = translating("cat > ~/given"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux"}),
     .answer = {.originnode = kNode, .transid = "t1", .command = "REMOVEINSTANCE", .product = "ux", .context = "K=1",
                .targetmsn = "inst1"},
     .events = {removeEvent(0, "", "")},
     .leaves = {{"given", "K=1"}}},
    {.situation = "no translator",
     .request = kRemoveInstance,
     .commands = afterLookup(),
     .answer = removeAnswer(),
     .events = {removeEvent(1007, "VMQ1007E", "REMOVEINSTANCE,ux")},
     .errors = {"VMQ1007E No two-way translator found for product code [ux]"}},
    {.situation = "a translator that cannot be run",
     .request = kRemoveInstance,
     .tools = {{"bin/qinfo", kInventory}},
     .files = {{kTranslator, "no program"}},
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux"}),
     .answer = removeAnswer(),
     .events = {removeEvent(1009, "VMQ1009E", "REMOVEINSTANCE,ux,~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux")},
     .errors = {"VMQ1009E Failed to start two way translator using "
                "command [~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux]"}},
    {.situation = "a translator that fails: its code in digits",
     .request = kRemoveInstance,
     .tools = translating("exit 65"),
     .commands = afterLookup({"~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux"}),
     .answer = removeAnswer(),
     .events = {removeEvent(1008, "VMQ1008E", "REMOVEINSTANCE,ux,65,~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux")},
     .errors = {"VMQ1008E Received bad return code [65] from two-way translator "
                "command [~/zlpqor6/lx8266/bin/vmq_xa -r inst1 -pc ux]"}},
};

// ---- UNINSTALL -----------------------------------------------------------------------------------------------------

StatusEvent uninstallEvent(int retval, const std::string& id, const std::string& parameter) {
  return {.originnode = kNode, .transid = "t1", .command = "UNINSTALL", .retval = retval, .retmsgid = id,
          .retmsgparm = parameter};
}

const auto kUninstall = asked("UNINSTALL", {equal("PRODUCT", "ux")});

const DeploymentCase kUninstalls[] = {
    {.situation = "a product that the inventory knows, by the installation's own script",
     .request = kUninstall,
     .tools = {{"bin/qinfo", kInventory}, {"bin/uninstall.sh", "echo \"$@\" > ~/given"}},
     .commands = {"~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/bin/uninstall.sh -i ux lx8266"},
     .answer = answerTo("UNINSTALL"),
     .events = {uninstallEvent(0, "", "")},
     .leaves = {{"given", "-i ux lx8266\n"}}},
    {.situation = "another product, by the command that installed it",
     .request = asked("UNINSTALL", {equal("PRODUCT", "zz"), equal("VERSION", "06.20"),
                                    equal("CONTEXT", "|DEPLOYDIR|/un.sh -r |DEPOTDIR|zz_Silent_Install.txt -h |CORVELHOME|")}),
     .tools = {{"bin/qinfo", kInventory}, {"depot/zz/06.20/un.sh", "exit 0"}},
     .commands = {"~/bin/qinfo -d ", "~/depot/zz/06.20/un.sh -r ~/depot/zz_silent_uninstall.txt -h ~"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "UNINSTALL", .product = "zz",
                .context = "|DEPLOYDIR|/un.sh -r |DEPOTDIR|zz_Silent_Install.txt -h |CORVELHOME|", .version = "06.20"},
     .events = {uninstallEvent(0, "", "")}},
    {.situation = "another product whose command names no response file",
     .request = asked("UNINSTALL", {equal("PRODUCT", "ci"), equal("VERSION", "06.20"), equal("CONTEXT", "|DEPLOYDIR|.sh")}),
     .tools = {{"bin/qinfo", kInventory}, {"depot/ci.sh", "exit 0"}},
     .commands = {"~/bin/qinfo -d ", "~/depot/ci.sh"},
     .answer = {.originnode = kNode, .transid = "t1", .command = "UNINSTALL", .product = "ci",
                .context = "|DEPLOYDIR|.sh", .version = "06.20"},
     .events = {uninstallEvent(0, "", "")}},
    {.situation = "no architecture",
     .request = asked("UNINSTALL", {equal("PRODUCT", "ax")}),
     .tools = {{"bin/qinfo", kOnlySkippedLibraries}},
     .commands = {"~/bin/qinfo -d ", "~/bin/qinfo -d "},
     .answer = answerTo("UNINSTALL", "ax"),
     .events = {uninstallEvent(1034, "VMQ1034E", "ax")},
     .errors = {"VMQ1034E No product architecture found for product [ax]"}},
    {.situation = "not started",
     .request = kUninstall,
     .tools = {{"bin/qinfo", kInventory}},
     .commands = {"~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/bin/uninstall.sh -i ux lx8266"},
     .answer = answerTo("UNINSTALL"),
     .events = {uninstallEvent(1033, "VMQ1033E", "~/bin/uninstall.sh -i ux lx8266")},
     .errors = {"VMQ1033E Failed to start uninstall command [~/bin/uninstall.sh -i ux lx8266]"}},
    {.situation = "failed: its code as one character",
     .request = kUninstall,
     .tools = {{"bin/qinfo", kInventory}, {"bin/uninstall.sh", "exit 65"}},
     .commands = {"~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/bin/uninstall.sh -i ux lx8266"},
     .answer = answerTo("UNINSTALL"),
     .events = {uninstallEvent(1032, "VMQ1032E", "~/bin/uninstall.sh -i ux lx8266,A")},
     .errors = {"VMQ1032E Bad return code [65] from uninstall command [~/bin/uninstall.sh -i ux lx8266]"}},
};

// ---- INSTALL -------------------------------------------------------------------------------------------------------

std::vector<RequestDetail::Predicate> installing(const std::string& optional, const std::string& product = "ux") {
  auto request = asked("INSTALL", {equal("PRODUCT", product), equal("VERSION", "06.20"),
                                   equal("CONTEXT", "|DEPOTDIR|install.sh -q")});
  if (!optional.empty()) request.push_back(equal("OPTIONAL", optional));
  return request;
}

AnswerRow installAnswer(const std::string& optional, const std::string& product = "ux") {
  return {.originnode = kNode, .transid = "t1", .command = "INSTALL", .product = product,
          .context = "|DEPOTDIR|install.sh -q", .optional = optional, .version = "06.20"};
}

StatusEvent installEvent(int retval, const std::string& id, const std::string& parameter) {
  return {.originnode = kNode, .transid = "t1", .command = "INSTALL", .retval = retval, .retmsgid = id,
          .retmsgparm = parameter};
}

std::map<std::string, std::string> with(std::map<std::string, std::string> tools, const std::string& name,
                                        const std::string& body) {
  tools[name] = body;
  return tools;
}

const DeploymentCase kInstalls[] = {
    {.situation = "nothing optional: the translator is not even looked for",
     .request = installing(""),
     .tools = {{"depot/install.sh", "echo \"$@\" > ~/given"}},
     .commands = {"~/depot/install.sh -q"},
     .answer = installAnswer(""),
     .events = {installEvent(0, "", "")},
     .leaves = {{"given", "-q\n"}}},
    {.situation = "not started",
     .request = installing(""),
     .commands = {"~/depot/install.sh -q"},
     .answer = installAnswer(""),
     .events = {installEvent(1030, "VMQ1030E", "~/depot/install.sh -q")},
     .errors = {"VMQ1030E Failed to start install command [~/depot/install.sh -q]"}},
    {.situation = "failed: its code in digits",
     .request = installing("INSTANCE"),
     .tools = {{"depot/install.sh", "exit 2"}},
     .commands = {"~/depot/install.sh -q"},
     .answer = installAnswer("INSTANCE"),
     .events = {installEvent(1031, "VMQ1031E", "~/depot/install.sh -q,2")},
     .errors = {"VMQ1031E Bad return code [2] from install command [~/depot/install.sh -q]"}},
    {.situation = "registered with its server when anything optional is said",
     .request = installing("INSTANCE"),
     .tools = with(translating("echo \"$@\" > ~/given"), "depot/install.sh", "exit 0"),
     .commands = {"~/depot/install.sh -q", "~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux"},
     .answer = installAnswer("INSTANCE"),
     .events = {installEvent(0, "", "")},
     .leaves = {{"given", "-setRMS ux\n"}}},
    {.situation = "no translator to register with: a code without a message",
     .request = installing("INSTANCE"),
     .tools = {{"depot/install.sh", "exit 0"}},
     .commands = {"~/depot/install.sh -q", "~/bin/qinfo -d ", "~/bin/qinfo -d "},
     .answer = installAnswer("INSTANCE"),
     .events = {installEvent(1031, "", "")},
     .errors = {"No default two way translator found"}},
    {.situation = "the registration cannot be run",
     .request = installing("INSTANCE"),
     .tools = {{"bin/qinfo", kInventory}, {"depot/install.sh", "exit 0"}},
     .files = {{kTranslator, "no program"}},
     .commands = {"~/depot/install.sh -q", "~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux"},
     .answer = installAnswer("INSTANCE"),
     .events = {installEvent(1009, "VMQ1009E", "INSTALL,ux,~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux")},
     .errors = {"VMQ1009E Failed to start two way translator [~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux]"}},
    {.situation = "the registration fails: its code as one character",
     .request = installing("INSTANCE"),
     .tools = with(translating("exit 65"), "depot/install.sh", "exit 0"),
     .commands = {"~/depot/install.sh -q", "~/bin/qinfo -d ", "~/bin/qinfo -d ", "~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux"},
     .answer = installAnswer("INSTANCE"),
     .events = {installEvent(1008, "VMQ1008E", "INSTALL,ux,A,~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux")},
     .errors = {"VMQ1008E Bad return code [65] from setRMS command [~/zlpqor6/lx8266/bin/vmq_xa -setRMS ux]"}},

    // ---- under the script that outlives the host ------------------------------------------------------------------------
    {.situation = "a restart install that the host survives reports twice",
     .request = installing("REQUIRES_RESTART"),
     .tools = with(translating("echo \"$@\" > ~/given"), "depot/install.sh", "echo out; echo err >&2"),
     .commands = afterLookup({"/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q"}),
     .answer = installAnswer("REQUIRES_RESTART"),
     .events = {installEvent(0, "", ""), installEvent(0, "", "")},
     .leaves = {{"given", "-setRMS ux\n"}, {"depot/rc.txt", "0\n"}, {"depot/stdout.txt", "out\n"}, {"depot/stderr.txt", "err\n"}}},
    {.situation = "a restart install that fails does not register",
     .request = installing("REQUIRES_RESTART"),
     .tools = with(translating("echo \"$@\" > ~/given"), "depot/install.sh", "exit 7"),
     .files = {{"given", "nothing"}},
     .commands = afterLookup({"/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q"}),
     .answer = installAnswer("REQUIRES_RESTART"),
     .events = {installEvent(0, "", ""), installEvent(1031, "VMQ1031E", "/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q,7")},
     .leaves = {{"given", "nothing"}, {"depot/rc.txt", "7\n"}},
     .errors = {"VMQ1031E Bad return code [7] from install command [/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q]"}},
    {.situation = "the translator's code takes the place of the installer's",
     .request = installing("REQUIRES_RESTART"),
     .tools = with(translating("exit 9"), "depot/install.sh", "exit 0"),
     .commands = afterLookup({"/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q"}),
     .answer = installAnswer("REQUIRES_RESTART"),
     .events = {installEvent(0, "", ""), installEvent(1031, "VMQ1031E", "/bin/sh ~/depot/runcmd.sh ~/depot/install.sh -q,9")},
     .leaves = {{"depot/rc.txt", "9\n"}}},
    {.situation = "a restart install without a translator runs nothing; the message is that of another code",
     .request = installing("REQUIRES_RESTART"),
     .tools = {{"depot/install.sh", "echo ran > ~/given"}},
     .files = {{"given", "nothing"}},
     .commands = afterLookup(),
     .answer = installAnswer("REQUIRES_RESTART"),
     .events = {installEvent(1031, "VMQ1030E", "~/depot/install.sh -q")},
     .leaves = {{"given", "nothing"}},
     .absent = {"depot/runcmd.sh"},
     .errors = {"No default two way translator found"}},
    {.situation = "a product code that must not stand in the script",
     .request = installing("REQUIRES_RESTART", "../home"),
     .tools = with(translating("exit 0"), "depot/install.sh", "exit 0"),
     .commands = afterLookup(),
     .answer = installAnswer("REQUIRES_RESTART", "../home"),
     .events = {installEvent(1031, "VMQ1031E", "~/depot/install.sh -q")}},
};

// ---- COMPLETE_INSTALL: answered at once ----------------------------------------------------------------------------

DeploymentCase completed(const char* situation, const std::string& rc_txt, int retval = 0, const std::string& parameter = "") {
  AnswerRow row = answerTo("COMPLETE_INSTALL", "");
  row.retval = retval;
  if (retval != 0) row.retmsgid = "VMQ1031E";
  row.retmsgparm = parameter;
  DeploymentCase c{.situation = situation, .request = asked("COMPLETE_INSTALL", {}), .answer = row};
  if (rc_txt != "missing") c.files = {{"depot/rc.txt", rc_txt}};
  return c;
}

const DeploymentCase kCompletions[] = {
    completed("success", "0\n"),
    completed("success between blanks", "  0\n"),
    completed("text that is no number", "abc"),
    completed("an empty file", ""),
    completed("a number that is too large", "99999999999999999999\n"),
    completed("the installer's code", "3\n", 1031, "~/depot/rc.txt,3"),
    completed("a signal's code", "143\n", 1031, "~/depot/rc.txt,143"),
    completed("no file", "missing", 1031, "~/depot/rc.txt,NOTFOUND"),
};
// clang-format on

class ProductDeployment : public DeploymentRun {};

TEST_P(ProductDeployment, IsAnsweredAndReported) {
  run(GetParam());
}

INSTANTIATE_TEST_SUITE_P(GetConfig, ProductDeployment, testing::ValuesIn(kGetConfig));
INSTANTIATE_TEST_SUITE_P(SetConfig, ProductDeployment, testing::ValuesIn(kSetConfig));
INSTANTIATE_TEST_SUITE_P(RemoveInstance, ProductDeployment, testing::ValuesIn(kRemovals));
INSTANTIATE_TEST_SUITE_P(Uninstall, ProductDeployment, testing::ValuesIn(kUninstalls));
INSTANTIATE_TEST_SUITE_P(Install, ProductDeployment, testing::ValuesIn(kInstalls));
INSTANTIATE_TEST_SUITE_P(CompleteInstall, ProductDeployment, testing::ValuesIn(kCompletions));

// The answer is a row like any other: the configuration that it brings must pass the query's predicates.
TEST_F(ProductDeployment, ConfigurationReadBackIsHeldAgainstTheContextAskedWith) {
  for (const auto& [name, body] : translating("echo INSTANCE=inst1")) home.tool(name, body);
  EXPECT_THAT(ask(asked("GETCONFIG", {equal("PRODUCT", "ux"), equal("CONTEXT", "old")})), IsEmpty());
  EXPECT_THAT(commandLines(trace), SizeIs(3)) << "the translator has run all the same";
  EXPECT_THAT(ask(asked("GETCONFIG", {equal("PRODUCT", "ux"), {"CONTEXT", INTF_NE, "old"}})),
              ElementsAre(getAnswer(0, "", "", "INSTANCE=inst1\n").bytes()));
}

}  // namespace
