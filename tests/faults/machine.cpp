#include "tests/faults/machine.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <filesystem>

#include "tests/support/temporary_directory.h"

namespace fs = std::filesystem;

namespace {

constexpr char kInventory[] = R"(case $1 in
-d) echo '"ProdCode","Description","Platform","Version","Release"
"ux","Unix agent","lx8266","062000000","100"
"ax","Shared libraries","lx8266","062000000","100"' ;;
-p) echo 'Platform codes:'; echo 'lx8266 Product (um)' ;;
esac)";

constexpr char kTranslator[] = R"(case $1 in
-i) echo inst1 ;;
-g) printf 'A=1\nINSTANCE=inst1\nB=2\n' ;;
-p) cat > ~/given ;;
*) echo "$@" > ~/given ;;
esac)";

constexpr char kDataAgent[] =
    "KUMP_META_PATH='~/meta'\n"
    "KUM_WORK_PATH='~/work/um'\n"
    "KUMP_RB_PATH='~/rb'\n"
    "KUMA_STARTUP_DP='asfs,post'\n";

std::vector<RequestDetail::Predicate> asked(const std::string& command,
                                            std::vector<RequestDetail::Predicate> parameters) {
  parameters.insert(parameters.begin(), {equal("COMMAND", command), equal("TRANSID", "t1")});
  return parameters;
}

using Names = std::set<std::string>;

Names operator+(Names names, const Names& others) {
  names.insert(others.begin(), others.end());
  return names;
}

// clang-format off
const Names kAnswer = {"InsertRow", "Dispatch"};
const Names kChild = kAnswer + Names{"pipe2", "mmap", "clone", "eventfd", "pthread_create", "pthread_mutex_init",
                                     "pthread_cond_init", "dup3", "close_range", "execve", "waitid", "waitpid", "read",
                                     "write", "fcntl", "access", "close", "strdup", "BSS1_GetEnv", "BSS1_GetLock",
                                     "BSS1_ReleaseLock"};
// Of several children one is not at its end yet when it is looked at.
const Names kChildren = kChild + Names{"poll", "BSS1_TimedWait"};
const Names kRunAsFile = {"uname", "fopen", "stat", "fseek", "ftell", "fread", "fclose",
                          "XML1_ParserCreate", "XML1_GetBuffer", "XML1_ParseBuffer"};
// clang-format on

const std::map<std::string, std::string> kRunAsFileTells = {
    {"fread", "Error reading file (defaults will be used): ~/config/"}};

const auto kInstance = equal("TARGETMSN", "inst1:node7:UX");
const auto kUnix = equal("PRODUCT", "ux");

}  // namespace

const std::vector<CommandCase>& commandCases() {
  // clang-format off
  static const auto& kCases = *new std::vector<CommandCase>{
      {.name = "START", .request = asked("START", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -o inst1 start ux\n"}},
       .calls = kChildren + kRunAsFile, .allocations = 300, .tells = kRunAsFileTells},
      {.name = "STOP", .request = asked("STOP", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -c -o inst1 stop ux\n"}},
       .calls = kChildren + kRunAsFile, .allocations = 300, .tells = kRunAsFileTells},
      {.name = "RESTART", .request = asked("RESTART", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -c -o inst1 stop ux\n-h ~ -o inst1 start ux\n"}},
       .odd_ids = {"VMQ1024E", "VMQ1025E"},
       .calls = kChildren + kRunAsFile, .allocations = 400, .tells = kRunAsFileTells},
      {.name = "INSTALL",
       .request = asked("INSTALL", {kUnix, equal("VERSION", "06.20"), equal("CONTEXT", "|DEPOTDIR|install.sh -q"),
                                    equal("OPTIONAL", "INSTANCE")}),
       .failures = {1008, 1009, 1030, 1031},
       .leaves = {{"installed", "-q\n"}, {"given", "-setRMS ux\n"}}, .odd_ids = {""},
       .calls = kChildren, .allocations = 250},
      {.name = "INSTALL_WITH_RESTART",
       .request = asked("INSTALL", {kUnix, equal("VERSION", "06.20"), equal("CONTEXT", "|DEPOTDIR|install.sh -q"),
                                    equal("OPTIONAL", "REQUIRES_RESTART")}),
       .failures = {1030, 1031}, .reports_twice = true,
       .leaves = {{"installed", "-q\n"}, {"given", "-setRMS ux\n"}, {"depot/rc.txt", "0\n"}}, .odd_ids = {"VMQ1030E"},
       .calls = kChild + Names{"fopen", "fwrite", "fclose"}, .allocations = 300},
      {.name = "UNINSTALL", .request = asked("UNINSTALL", {kUnix}), .failures = {1032, 1033, 1034},
       .leaves = {{"uninstalled", "-i ux lx8266\n"}},
       .calls = kChild, .allocations = 180},
      {.name = "GETCONFIG", .request = asked("GETCONFIG", {kUnix, kInstance}), .failures = {1007, 1008, 1009},
       .queued = false, .context = "INSTANCE=inst1\nB=2\n",
       .calls = kChild, .allocations = 200},
      {.name = "SETCONFIG", .request = asked("SETCONFIG", {kUnix, equal("CONTEXT", "INSTANCE=inst1\nA=1\n")}),
       .failures = {1007, 1008, 1009},
       .leaves = {{"given", "INSTANCE=inst1\nA=1\n"}},
       .calls = kChild, .allocations = 200},
      {.name = "REMOVEINSTANCE", .request = asked("REMOVEINSTANCE", {kUnix, equal("TARGETMSN", "inst1")}),
       .failures = {1007, 1008, 1009},
       .leaves = {{"given", "-r inst1 -pc ux\n"}},
       .calls = kChild, .allocations = 200},
      {.name = "COMPLETE_INSTALL", .request = asked("COMPLETE_INSTALL", {}), .failures = {}, .queued = false,
       .code = 1031, .parameter = "~/depot/rc.txt,3",
       .parameters = {"~/depot/rc.txt,3", "~/depot/rc.txt,NOTFOUND", "COMPLETE_INSTALL,"},
       .calls = kAnswer + Names{"stat", "fopen", "fseek", "ftell", "fread", "fclose"}, .allocations = 20,
       .tells = {{"fread", "Unable to read rc.txt for install's return code"}}},
      {.name = "SETCONFIG_OF_THE_DATA_AGENT",
       .request = asked("SETCONFIG", {equal("PRODUCT", "um"), equal("DACONFIG", "m.mdl"), equal("DASCRIPT", "s1.sh"),
                                      equal("TARGETMSN", "inst1:node7:DA")}),
       .failures = {1009, 1011, 1012, 1013, 1014, 1015, 1016, 1017, 1018, 1019, 1020, 1021, 1022, 1023, 1026, 1027, 1028},
       .leaves = {{"meta/m.mdl", "model\n"}, {"work/scripts/s1.sh", "one\n"},
                  {"config/.ConfigData/kumenv", "inst1|DATAPROVIDER|asfs,post,SNMP|\n"},
                  {"runs", "-h ~ -c -o inst1 stop um\n-h ~ -o inst1 start um\n"},
                  {"console", "getdptype ~/meta/m.mdl\nDELETE ~/meta/m.mdl\nIMPORT ~/meta/m.mdl\n"}},
       .calls = kChildren + kRunAsFile + Names{"chmod", "unlink", "fwrite"}, .allocations = 600},
      {.name = "STOP_BY_A_HOST_THAT_TRACES", .request = asked("STOP", {kUnix, kInstance}), .failures = {},
       .leaves = {{"runs", "-h ~ -c -o inst1 stop ux\n"}},
       .calls = {"FSI1_NewList", "FSI1_FetchList", "FSI1_DeleteList", "unlink"},
       .tells = {{"FSI1_NewList", "FSI1_NewList error 5\n"}, {"FSI1_FetchList", "FSI1_FetchList error 5\n"},
                 {"FSI1_DeleteList", "FSI1_DeleteList error 5\n"},
                 {"unlink", "Error deleting [~/logs/vmqproc_ras1_10.log]: Operation not permitted"}},
       .harmless = {"FSI1_NewList", "FSI1_FetchList", "FSI1_DeleteList", "unlink"}},
  };
  // clang-format on
  return kCases;
}

const std::set<std::string>& callsOfTheTransfer() {
  static const auto& kCalls =
      *new std::set<std::string>{"access", "mkdir",  "unlink", "fopen", "writev", "fclose", "chmod",
                                 "open",   "fdopen", "stat",   "fread", "fwrite", "link",   "rpc__malloc"};
  return kCalls;
}

void prepareMachine(const InstallationHome& home) {
  home.clear();
  home.tool("bin/qinfo", kInventory);
  home.tool("bin/CorvelAgent", atHome(home,
                                      "case $* in *zz) ;; *) echo \"$@\" >> ~/runs ;; esac\n"
                                      "[ -z \"$KBB_RAS1_LOG\" ] || echo trace >> $KBB_RAS1_LOG"));
  home.tool("bin/uninstall.sh", atHome(home, "echo \"$@\" > ~/uninstalled"));
  home.tool("bin/um_console", atHome(home, "echo \"$4\" >> ~/console\ncase $4 in getdptype*) echo snmp ;; esac"));
  home.tool("zlpqor6/lx8266/bin/vmq_xa", atHome(home, kTranslator));
  home.tool("depot/install.sh", atHome(home, "echo \"$@\" > ~/installed"));
  // Longer than the C library reads when it asks for the length: the reading itself can then fail.
  home.runAsFile(InstallationHome::runAs("lz", "other", "nobody") + "<!--" + std::string(20000, '.') + "-->");
  home.file("depot/rc.txt", "3\n");
  home.file("depot/m.mdl", "model\n");
  home.file("depot/s1.sh", "one\n");
  home.file("config/um_inst1.config", atHome(home, kDataAgent));
  home.file("config/.ConfigData/kumenv", "inst1|DATAPROVIDER|asfs,post|\n");
  home.file("meta/.keep", "");
  home.file("work/scripts/.keep", "");
  home.file("tmp/.keep", "");
}

void prepareLogs(const InstallationHome& home) {
  for (int second = 10; second < 20; ++second) {
    const std::string log = "logs/vmqproc_ras1_" + std::to_string(second) + ".log";
    home.file(log, "");
    const timespec then{second, 0};
    const timespec times[] = {then, then};
    (void)utimensat(AT_FDCWD, (home.path() + "/" + log).c_str(), times, 0);
  }
}

bool childHasTraced(const InstallationHome& home) {
  for (const auto& log : fs::directory_iterator(home.path() + "/logs")) {
    if (readWholeFile(log.path()) == "trace\n") return true;
  }
  return false;
}

std::string atHome(const InstallationHome& home, std::string text) {
  for (size_t at = 0; (at = text.find('~', at)) != std::string::npos; at += home.path().size())
    text.replace(at, 1, home.path());
  return text;
}

std::vector<RequestDetail::Predicate> commandThatOnlyEnds(const std::string& transaction_id) {
  return {equal("COMMAND", "START"), equal("TRANSID", transaction_id), equal("PRODUCT", "zz")};
}
