// SETCONFIG for the data agent: one case for each way in which it can end.

#include <sys/stat.h>

#include "tests/mgmt/deployment_case.h"

namespace {

// ---- what the machine holds ----------------------------------------------------------------------------------------

constexpr char kPlatforms[] = "echo 'Platform codes:'; echo 'lx8266 Product (um)'";

/// The console: the type it knows, and a body that sees the console command in $command.
std::string console(const std::string& type, const std::string& body = "") {
  return "command=$4\necho \"$command\" >> ~/console\ncase $command in getdptype*) echo '" + type + "' ;; esac\n" +
         body;
}

constexpr char kConfiguration[] =
    "* the agent's configuration\n"
    "KUMP_META_PATH='~/meta'\n"
    " KUM_WORK_PATH='~/work/um' \n"
    "KUMP_RB_PATH='~/rb'\n"
    "KUMA_STARTUP_DP='asfs,post'\n";

constexpr char kStartup[] = "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|asfs,post|rest\nlast\n";

std::map<std::string, std::string> tools(const std::string& console_script, const std::string& control = "exit 0") {
  return {{"bin/qinfo", kPlatforms}, {"bin/um_console", console_script}, {"bin/CorvelAgent", control}};
}

std::map<std::string, std::string> files(std::map<std::string, std::string> more = {}) {
  more.insert({{"config/um_inst1.config", kConfiguration},
               {"config/.ConfigData/kumenv", kStartup},
               {"depot/m.mdl", "model\n"},
               {"depot/s1.sh", "one\n"},
               {"depot/s2.sh", "two\n"},
               {"meta/.keep", ""},
               {"work/scripts/.keep", ""}});
  return more;
}

/// The files with one of them taken away, or with another text.
std::map<std::string, std::string> without(const std::string& name) {
  auto kept = files();
  kept.erase(name);
  return kept;
}

std::map<std::string, std::string> configuredBy(const std::string& configuration) {
  return files({{"config/um_inst1.config", configuration}});
}

std::map<std::string, std::string> configuredByDirectory() {
  auto changed = without("config/um_inst1.config");
  changed["config/um_inst1.config/file"] = "";
  return changed;
}

std::string withoutKey(const std::string& key) {
  std::string text = kConfiguration;
  return text.replace(text.find(key), 1, "*");
}

// ---- what is asked and answered ------------------------------------------------------------------------------------

struct Asked {
  std::string model = "m.mdl";
  std::string scripts = "";
  std::string target = "inst1:node7:DA";
  std::string context = "";
  std::string product = "um";
};

std::vector<RequestDetail::Predicate> setting(const Asked& a) {
  std::vector<RequestDetail::Predicate> request = asked("SETCONFIG", {equal("PRODUCT", a.product)});
  for (const auto& [column, value] : {std::pair("DACONFIG", a.model), std::pair("DASCRIPT", a.scripts),
                                      std::pair("TARGETMSN", a.target), std::pair("CONTEXT", a.context)}) {
    if (!value.empty()) request.push_back(equal(column, value));
  }
  return request;
}

AnswerRow accepted(const Asked& a) {
  return {.originnode = kNode,
          .transid = "t1",
          .command = "SETCONFIG",
          .product = a.product,
          .context = a.context,
          .daconfig = a.model,
          .dascript = a.scripts,
          .targetmsn = a.target};
}

StatusEvent ended(const Asked& a, int retval = 0, const std::string& id = "", const std::string& parameter = "") {
  return {.originnode = kNode,
          .transid = "t1",
          .command = "SETCONFIG",
          .retval = retval,
          .retmsgid = id,
          .retmsgparm = parameter,
          .targetmsn = a.target};
}

std::string consoleCommand(const std::string& command) {
  return "~/bin/um_console -h ~ -c \"" + command + " ~/meta/m.mdl\"";
}

const std::string kAskPlatforms = "~/bin/qinfo -p um";
const std::string kStop = "~/bin/CorvelAgent  -h ~ -c -o inst1 stop um";
const std::string kStart = "~/bin/CorvelAgent  -h ~ -o inst1 start um";

struct Fails {
  const char* situation;
  int retval;
  std::string parameter;
  std::vector<std::string> commands = {};
  std::map<std::string, std::string> tools = ::tools(console("asfs"));
  std::map<std::string, std::string> files = ::files();
  Asked asked = {};
  std::vector<std::string> errors = {};  ///< traced behind the message id
};

// clang-format off
const Fails kEmptyStartup =
    {.situation = "an empty list of start-up providers", .retval = 1028,
     .parameter = "~/config/.ConfigData/kumenv,asfs,post,SNMP",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), kStop}, .tools = tools(console("snmp")),
     .files = files({{"config/.ConfigData/kumenv", ""}})};

const Fails kFailures[] = {
    {.situation = "no configuration file for the instance as it is, nor in lower case", .retval = 1020,
     .parameter = "~/config/um_inst9.config,inst9", .asked = {.target = "Inst9:node7:DA"},
     .errors = {"Configuration file [~/config/um_inst9.config] for instance (optional) [inst9] does not exist"}},
    {.situation = "no configuration file without an instance", .retval = 1020,
     .parameter = "~/config/um.config,", .asked = {.target = "node7:DA"},
     .errors = {"Configuration file [~/config/um.config] for instance (optional) [] does not exist"}},
    {.situation = "no model directory", .retval = 1011, .parameter = "KUMP_META_PATH,~/config/um_inst1.config",
     .files = configuredBy(withoutKey("KUMP_META_PATH")),
     .errors = {"No value found for [KUMP_META_PATH] in config file [~/config/um_inst1.config]"}},
    {.situation = "no work directory", .retval = 1012, .parameter = "KUM_WORK_PATH,~/config/um_inst1.config",
     .files = configuredBy(withoutKey("KUM_WORK_PATH")),
     .errors = {"No value found for [KUM_WORK_PATH] in config file [~/config/um_inst1.config]"}},
    {.situation = "no resource directory", .retval = 1013, .parameter = "KUMP_RB_PATH,~/config/um_inst1.config",
     .files = configuredBy(withoutKey("KUMP_RB_PATH")),
     .errors = {"No value found for [KUMP_RB_PATH] in config file [~/config/um_inst1.config]"}},
    {.situation = "an empty configuration file", .retval = 1011, .parameter = "KUMP_META_PATH,~/config/um_inst1.config",
     .files = configuredBy(""),
     .errors = {"No value found for [KUMP_META_PATH] in config file [~/config/um_inst1.config]"}},
    {.situation = "a work directory without a separator", .retval = 1021, .parameter = "work,~/config/um_inst1.config",
     .files = configuredBy("KUMP_META_PATH=~/meta\nKUM_WORK_PATH=work\nKUMP_RB_PATH=~/rb\n"),
     .errors = {"Work directory [work] from tag [%] "
                "in config file [~/config/um_inst1.config] cannot be parsed, no dir separator"}},
    {.situation = "a product that is not installed", .retval = 1019, .parameter = "um", .commands = {kAskPlatforms},
     .tools = {{"bin/qinfo", "echo 'Platform codes:'; echo 'lx8266 Product (ux)'"}},
     .errors = {"Supplied product code [um] is not installed"}},
    {.situation = "no model in the depot", .retval = 1014, .parameter = "m.mdl,~/meta", .commands = {kAskPlatforms},
     .files = without("depot/m.mdl"),
     .errors = {"Failed to copy MDL file m.mdl to MDL directory ~/meta"}},
    {.situation = "a model outside the depot", .retval = 1014, .parameter = "../depot/m.mdl,~/meta",
     .commands = {kAskPlatforms}, .asked = {.model = "../depot/m.mdl"},
     .errors = {"Failed to copy MDL file ../depot/m.mdl to MDL directory ~/meta"}},
    {.situation = "the second script is not in the depot", .retval = 1015, .parameter = "s2.sh,~/work/scripts",
     .commands = {kAskPlatforms}, .files = without("depot/s2.sh"), .asked = {.scripts = "s1.sh,s2.sh"},
     .errors = {"Failed to copy Script file s2.sh to scripts directory ~/work/scripts"}},
    {.situation = "a script outside the depot", .retval = 1015, .parameter = "x/../../s1.sh,~/work/scripts",
     .commands = {kAskPlatforms}, .files = files({{"depot/x/.keep", ""}, {"s1.sh", "outside"}}),
     .asked = {.scripts = "x/../../s1.sh"},
     .errors = {"Failed to copy Script file x/../../s1.sh to scripts directory ~/work/scripts"}},
    {.situation = "no console to ask for the type", .retval = 1022, .parameter = consoleCommand("getdptype"),
     .commands = {kAskPlatforms, consoleCommand("getdptype")}, .tools = {{"bin/qinfo", kPlatforms}},
     .errors = {"Failed to start GETDPTYPE command [" + consoleCommand("getdptype") + "]"}},
    {.situation = "a type of blanks only", .retval = 1023, .parameter = "m.mdl",
     .commands = {kAskPlatforms, consoleCommand("getdptype")}, .tools = tools(console("  ")),
     .errors = {"Could not get DPTYPE from metafile [m.mdl]"}},
    {.situation = "an agent that does not stop", .retval = 1027, .parameter = "inst1",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), kStop},
     .tools = tools(console("snmp"), "exit 1"),
     .errors = {"Failed to stop agent with instance (optional) [inst1]"}},
    {.situation = "no list of start-up providers", .retval = 1028,
     .parameter = "~/config/.ConfigData/kumenv,asfs,post,SNMP",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), kStop},
     .tools = tools(console("snmp")), .files = without("config/.ConfigData/kumenv"),
     .errors = {"Failed to update the da config file [~/config/.ConfigData/kumenv] "
                "to have new startup parms of [asfs,post,SNMP]"}},
    {.situation = "an agent that does not start", .retval = 1026, .parameter = "inst1",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), kStop, kStart},
     .tools = tools(console("snmp"), "case \"$*\" in *start*) exit 1 ;; esac"),
     .errors = {"Failed to start agent with instance (optional) [inst1]"}},
    {.situation = "a console that is gone when the old model is to go", .retval = 1017,
     .parameter = consoleCommand("DELETE"),
     .commands = {kAskPlatforms, consoleCommand("getdptype"), consoleCommand("DELETE")},
     .tools = tools(console("asfs", "rm \"$0\"")),
     .errors = {"Failed to start DELETE command [" + consoleCommand("DELETE") + "]"}},
    {.situation = "a console that is gone when the new model is to come", .retval = 1018,
     .parameter = consoleCommand("IMPORT"),
     .commands = {kAskPlatforms, consoleCommand("getdptype"), consoleCommand("DELETE"), consoleCommand("IMPORT")},
     .tools = tools(console("asfs", "case $command in DELETE*) rm \"$0\" ;; esac")),
     .errors = {"Failed to start IMPORT command [" + consoleCommand("IMPORT") + "]"}},
    {.situation = "a model that the agent refuses", .retval = 1016, .parameter = "m.mdl",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), consoleCommand("DELETE"), consoleCommand("IMPORT")},
     .tools = tools(console("asfs", "case $command in IMPORT*) exit 1 ;; esac")),
     .errors = {"Import of MDL file [m.mdl] failed"}},
    {.situation = "a directory where the configuration file should be", .retval = 1011,
     .parameter = "KUMP_META_PATH,~/config/um_inst1.config",
     .files = configuredByDirectory()},
    {.situation = "a key without a value", .retval = 1012, .parameter = "KUM_WORK_PATH,~/config/um_inst1.config",
     .files = configuredBy("KUMP_META_PATH=~/meta\nKUM_WORK_PATH=\nKUMP_RB_PATH=~/rb\n")},
    {.situation = "a key in lower case", .retval = 1013, .parameter = "KUMP_RB_PATH,~/config/um_inst1.config",
     .files = configuredBy("KUMP_META_PATH=~/meta\nKUM_WORK_PATH=~/work/um\nkump_rb_path=~/rb\n")},
    {.situation = "an inventory tool that fails", .retval = 1019, .parameter = "um", .commands = {kAskPlatforms},
     .tools = {{"bin/qinfo", std::string(kPlatforms) + "; exit 1"}},
     .errors = {"Supplied product code [um] is not installed"}},
    {.situation = "the depot's parent as the model", .retval = 1014, .parameter = "..,~/meta",
     .commands = {kAskPlatforms}, .asked = {.model = ".."}},
    {.situation = "a model whose name climbs in the middle", .retval = 1014, .parameter = "a/../../x,~/meta",
     .commands = {kAskPlatforms}, .files = files({{"depot/a/.keep", ""}, {"x", "outside"}}),
     .asked = {.model = "a/../../x"}},
    {.situation = "a directory as the model", .retval = 1014, .parameter = "um,~/meta", .commands = {kAskPlatforms},
     .files = files({{"depot/um/file", ""}}), .asked = {.model = "um"}},
    {.situation = "no directory for models", .retval = 1014, .parameter = "m.mdl,~/meta", .commands = {kAskPlatforms},
     .files = without("meta/.keep")},
    {.situation = "no directory for scripts", .retval = 1015, .parameter = "s1.sh,~/work/scripts",
     .commands = {kAskPlatforms}, .files = without("work/scripts/.keep"), .asked = {.scripts = "s1.sh"}},
    {.situation = "the depot itself as the script", .retval = 1015, .parameter = "..,~/work/scripts",
     .commands = {kAskPlatforms}, .asked = {.scripts = "s1.sh,.."}},
    {.situation = "a console that prints its type as an error", .retval = 1023, .parameter = "m.mdl",
     .commands = {kAskPlatforms, consoleCommand("getdptype")}, .tools = tools(console("", "echo asfs >&2; exit 1"))},
    {.situation = "a control script that cannot be run", .retval = 1027, .parameter = "inst1",
     .commands = {kAskPlatforms, consoleCommand("getdptype"), kStop},
     .tools = {{"bin/qinfo", kPlatforms}, {"bin/um_console", console("snmp")}}},
    kEmptyStartup,
};

DeploymentCase fails(const Fails& f) {
  const std::string id = "VMQ" + std::to_string(f.retval) + "E";
  DeploymentCase failing = {.situation = f.situation, .request = setting(f.asked), .tools = f.tools, .files = f.files,
                            .commands = f.commands, .answer = accepted(f.asked),
                            .events = {ended(f.asked, f.retval, id, f.parameter)}};
  for (const std::string& error : f.errors) failing.errors.push_back(id + " " + error);
  return failing;
}

std::vector<DeploymentCase> failures() {
  std::vector<DeploymentCase> cases;
  for (const Fails& each : kFailures) cases.push_back(fails(each));
  return cases;
}

DeploymentCase succeeds(const char* situation, const Asked& a, std::vector<std::string> commands,
                        const std::string& console_script, std::map<std::string, std::string> leaves) {
  return {.situation = situation, .request = setting(a), .tools = tools(console_script), .files = files(),
          .commands = std::move(commands), .answer = accepted(a), .events = {ended(a)}, .leaves = std::move(leaves)};
}

const std::vector<std::string> kReplaced = {kAskPlatforms, consoleCommand("getdptype"), consoleCommand("DELETE"),
                                            consoleCommand("IMPORT")};
const std::vector<std::string> kReplacedAfterRestart = {kAskPlatforms, consoleCommand("getdptype"), kStop, kStart,
                                                        consoleCommand("DELETE"), consoleCommand("IMPORT")};

const DeploymentCase kNothingToDo =
    succeeds("neither model nor scripts: nothing is done", {.model = ""}, {}, console("asfs"), {});
const DeploymentCase kServedType =
    succeeds("a type that another provider serves", {}, kReplaced, console("sock"),
             {{"config/.ConfigData/kumenv", kStartup}});
const DeploymentCase kNewType =
    succeeds("a type that is new to the agent", {}, kReplacedAfterRestart, console("snmp"),
             {{"meta/m.mdl", "model\n"},
              {"config/.ConfigData/kumenv",
               "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|asfs,post,SNMP|\nlast\n"}});
const DeploymentCase kScriptsAlone =
    succeeds("scripts alone are only copied", {.model = "", .scripts = "s1.sh,s2.sh"}, {kAskPlatforms}, console("asfs"),
             {{"work/scripts/s1.sh", "one\n"}, {"work/scripts/s2.sh", "two\n"}});
const DeploymentCase kSurroundings =
    succeeds("the console's surroundings", {.context = " port=1920,restart=y "}, kReplaced,
             console("asfs", "env | grep -e ^KUM | sort > ~/surroundings"),
             {{"surroundings", "KUMP_DPCONSOLE_NOCONFIRM=Y\nKUMP_DPCONSOLE_PORT=1920\nKUMP_RB_PATH=~/rb\n"
                               "KUM_DP_HOSTNAME=node7\nKUM_PRODSPEC_PATH=~/meta/\n"}});

const DeploymentCase kSuccesses[] = {
    kNothingToDo,
    succeeds("a model of a type that the agent starts with", {}, kReplaced, console(" asfs \n"),
             {{"meta/m.mdl", "model\n"}, {"config/.ConfigData/kumenv", kStartup},
              {"console", "getdptype ~/meta/m.mdl\nDELETE ~/meta/m.mdl\nIMPORT ~/meta/m.mdl\n"}}),
    kServedType,
    kNewType,
    succeeds("an agent that did not know the old model", {}, kReplaced,
             console("asfs", "case $command in DELETE*) exit 1 ;; esac"), {{"meta/m.mdl", "model\n"}}),
    kScriptsAlone,
    succeeds("an instance in another case than its configuration file: its name there is the one used from then on",
             {.target = "INST1:node7:DA"}, kReplacedAfterRestart, console("snmp"),
             {{"config/.ConfigData/kumenv",
               "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|asfs,post,SNMP|\nlast\n"}}),
    succeeds("a product code in capitals", {.product = "UM"}, kReplaced, console("asfs"), {{"meta/m.mdl", "model\n"}}),
    succeeds("a list of nothing but commas is no list", {.model = "", .scripts = ",,"}, {kAskPlatforms},
             console("asfs"), {}),
    succeeds("empty names between scripts do not count", {.model = "", .scripts = ",s1.sh,,s2.sh,"}, {kAskPlatforms},
             console("asfs"), {{"work/scripts/s1.sh", "one\n"}, {"work/scripts/s2.sh", "two\n"}}),
    succeeds("a type that is part of another in the list", {}, kReplaced, console("os"),
             {{"config/.ConfigData/kumenv", kStartup}}),
    succeeds("a context with a port that is not told", {.context = "RESTART=,PORT="}, kReplaced,
             console("asfs", "env | grep PORT > ~/surroundings"), {{"surroundings", "KUMP_DPCONSOLE_PORT=\n"}}),
    kSurroundings,
};

DeploymentCase configured(DeploymentCase deployment, const std::string& configuration) {
  deployment.files["config/um_inst1.config"] = configuration;
  return deployment;
}

DeploymentCase withFile(DeploymentCase deployment, const std::string& name, const std::string& text) {
  deployment.files[name] = text;
  return deployment;
}

const DeploymentCase kNoProviderYet =
    configured(succeeds("an agent that starts with no provider yet", {}, kReplacedAfterRestart, console("snmp"),
                        {{"config/.ConfigData/kumenv", "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|,SNMP|\nlast\n"}}),
               "KUMP_META_PATH=~/meta\nKUM_WORK_PATH=~/work/um\nKUMP_RB_PATH=~/rb\n");

const DeploymentCase kOddMachines[] = {
    configured(succeeds("a configuration file with lines of another system", {}, kReplaced, console("asfs"),
                        {{"meta/m.mdl", "model\n"}}),
               "\r\nKUMP_META_PATH='~/meta'\r\n\r\nKUM_WORK_PATH=~/work/um\r\n"
               "KUMP_RB_PATH=~/rb\r\nKUMA_STARTUP_DP=asfs\r\n"),
    configured(succeeds("a configuration file with a key twice: the later one counts", {}, kReplaced, console("asfs"),
                        {{"meta/m.mdl", "model\n"}}),
               "KUMP_META_PATH=/nowhere\n" + std::string(kConfiguration)),
    kNoProviderYet,
    configured(succeeds("a type that a provider would serve, were it one of the agent's", {}, kReplacedAfterRestart,
                        console("sock"), {{"config/.ConfigData/kumenv",
                                           "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|post,SOCK|\nlast\n"}}),
               "KUMP_META_PATH=~/meta\nKUM_WORK_PATH=~/work/um\nKUMP_RB_PATH=~/rb\nKUMA_STARTUP_DP='post'\n"),
    configured(succeeds("a type that the one provider serves, where the agent starts without that", {},
                        kReplacedAfterRestart, console("file"),
                        {{"config/.ConfigData/kumenv",
                          "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|post,FILE|\nlast\n"}}),
               "KUMP_META_PATH=~/meta\nKUM_WORK_PATH=~/work/um\nKUMP_RB_PATH=~/rb\nKUMA_STARTUP_DP=post\n"),
    withFile(succeeds("a list of start-up providers whose last line has no end", {}, kReplacedAfterRestart,
                      console("snmp"),
                      {{"config/.ConfigData/kumenv", "ux|DATAPROVIDER|none|\ninst1|DATAPROVIDER|asfs,post,SNMP|\n"}}),
             "config/.ConfigData/kumenv", "ux|DATAPROVIDER|none|\ninst1|DATAPROVIDER|asfs,post|"),
    withFile(withFile(succeeds("an agent without an instance is listed by its architecture", {.target = "node7:DA"},
                               {kAskPlatforms, consoleCommand("getdptype"), "~/bin/CorvelAgent  -h ~ -c stop um",
                                "~/bin/CorvelAgent  -h ~ start um", consoleCommand("DELETE"), consoleCommand("IMPORT")},
                               console("snmp"),
                               {{"config/.ConfigData/kumenv", "lx8266|DATAPROVIDER|asfs,post,SNMP|\n"}}),
                      "config/um.config", kConfiguration),
             "config/.ConfigData/kumenv", "lx8266|DATAPROVIDER|asfs,post|\n"),
    withFile(succeeds("a list of start-up providers without the agent stays as it is", {}, kReplacedAfterRestart,
                      console("snmp"), {{"config/.ConfigData/kumenv", "ux|DATAPROVIDER|none|\n"}}),
             "config/.ConfigData/kumenv", "ux|DATAPROVIDER|none|\n"),
};
// clang-format on

class DataAgentDeployment : public DeploymentRun {};

TEST_P(DataAgentDeployment, IsAnsweredAndReported) {
  run(GetParam());
}

INSTANTIATE_TEST_SUITE_P(Failing, DataAgentDeployment, testing::ValuesIn(failures()));
INSTANTIATE_TEST_SUITE_P(Succeeding, DataAgentDeployment, testing::ValuesIn(kSuccesses));
INSTANTIATE_TEST_SUITE_P(OnOddMachines, DataAgentDeployment, testing::ValuesIn(kOddMachines));

TEST_F(DataAgentDeployment, CopiedScriptsMayBeRunByOwnerAndGroup) {
  run(kScriptsAlone);
  for (const char* name : {"/work/scripts/s1.sh", "/work/scripts/s2.sh"}) {
    struct stat status = {};
    ASSERT_EQ(stat((home.path() + name).c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0770u);
  }
}

TEST_F(DataAgentDeployment, ListOfStartupProvidersKeepsItsMode) {
  home.file("config/.ConfigData/kumenv", "");
  const std::string list = home.path() + "/config/.ConfigData/kumenv";
  ASSERT_EQ(chmod(list.c_str(), 0640), 0);
  run(kNewType);
  struct stat status = {};
  ASSERT_EQ(stat(list.c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0640u);
}

TEST_F(DataAgentDeployment, TracesEachStepOfANewType) {
  run(kNewType);
  for (const char* line :
       {"Context [] port (optional) [] restart (1=true) [0]",
        "DA Configuration file is \"~/config/um_inst1.config\", instance (optional) is \"inst1\"",
        "DA Base Dir is [~/zlpqor6/lx8266/um]", "DA Bin Dir is [~/zlpqor6/lx8266/um/bin/]",
        "DA Work Dir is [~/work/um]", "DA Scripts Dir is [~/work/scripts]", "DA RB Dir is [~/rb]",
        "Environment variable 1 - KUM_PRODSPEC_PATH=~/meta/", "Environment variable 2 - KUMP_RB_PATH=~/rb",
        "Environment variable 3 - KUMP_DPCONSOLE_PORT=", "Environment variable 4 - KUM_DP_HOSTNAME=node7",
        "Environment variable 5 - KUMP_DPCONSOLE_NOCONFIRM=Y", "DPTYPE for metafile [m.mdl] is [SNMP]",
        "Adding [SNMP] to startup parms of [asfs,post]",
        "Writing startup parms [asfs,post,SNMP] to config file [~/config/.ConfigData/kumenv] instance [inst1]",
        "Import of MDL file [m.mdl] successfull", "Return code is 0"}) {
    EXPECT_TRUE(trace.has(RAS1_DETAIL, atHome(line))) << line;
  }
}

TEST_F(DataAgentDeployment, TracesTheOptionsOfTheContext) {
  run(kSurroundings);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Context [PORT=1920,RESTART=Y] port (optional) [1920] restart (1=true) [1]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Environment variable 3 - KUMP_DPCONSOLE_PORT=1920"));
  for (const char* context : {"RESTART=YES", "RESTART=", "RESTART=N"}) {
    trace.clear();
    run(succeeds(context, {.context = context}, kReplaced, console("asfs"), {}));
    EXPECT_TRUE(
        trace.has(RAS1_DETAIL, "Context [" + std::string(context) + "] port (optional) [] restart (1=true) [0]"));
  }
}

TEST_F(DataAgentDeployment, TracesWhyNothingIsDone) {
  run(kNothingToDo);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "DA SetConfig called but no MDL or Script files specified"));
}

TEST_F(DataAgentDeployment, TracesWhyAServedTypeNeedsNoRestart) {
  run(kServedType);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "DPtype [SOCK] is part of dptype [ASFS]"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "DPtype [ASFS] already in startup parms list [asfs,post]"));
}

TEST_F(DataAgentDeployment, EachTypeThatTheOneProviderServesNeedsNoRestart) {
  for (const char* type : {"apis", "sock", "file", "scrp"}) {
    run(succeeds(type, {}, kReplaced, console(type), {{"config/.ConfigData/kumenv", kStartup}}));
    trace.clear();
  }
}

TEST_F(DataAgentDeployment, TracesTheModeOfACopiedScript) {
  run(kScriptsAlone);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, atHome("Settings permissions on script file [~/work/scripts/s1.sh] to [504]")));
}

TEST_F(DataAgentDeployment, TracesThatTheAgentStartsWithNoProvider) {
  run(kNoProviderYet);
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "No value found for KUMA_STARTUP_DP"));
}

TEST_F(DataAgentDeployment, WorkDirectoryUnderTheRootHasItsScriptsThereToo) {
  run(configured(succeeds("a work directory under the root", {}, kReplaced, console("asfs"), {}),
                 "KUMP_META_PATH=~/meta\nKUM_WORK_PATH=/um\nKUMP_RB_PATH=~/rb\nKUMA_STARTUP_DP=asfs\n"));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "DA Scripts Dir is [/scripts]"));
}

TEST_F(DataAgentDeployment, TracesThatTheListOfStartupProvidersIsEmpty) {
  run(fails(kEmptyStartup));
  EXPECT_TRUE(trace.has(RAS1_ERROR, atHome("Contents of config file [~/config/.ConfigData/kumenv] was empty")));
}

}  // namespace
