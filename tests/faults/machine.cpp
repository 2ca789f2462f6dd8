#include "tests/faults/machine.h"

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

const auto kInstance = equal("TARGETMSN", "inst1:node7:UX");
const auto kUnix = equal("PRODUCT", "ux");

}  // namespace

const std::vector<CommandCase>& commandCases() {
  // clang-format off
  static const auto& kCases = *new std::vector<CommandCase>{
      {.name = "START", .request = asked("START", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -o inst1 start ux\n"}}},
      {.name = "STOP", .request = asked("STOP", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -c -o inst1 stop ux\n"}}},
      {.name = "RESTART", .request = asked("RESTART", {kUnix, kInstance}), .failures = {1024, 1025}, .goes_on = true,
       .leaves = {{"runs", "-h ~ -c -o inst1 stop ux\n-h ~ -o inst1 start ux\n"}},
       .odd_ids = {"VMQ1024E", "VMQ1025E"}},  // a start does not clear what the stop before it has said
      {.name = "INSTALL",
       .request = asked("INSTALL", {kUnix, equal("VERSION", "06.20"), equal("CONTEXT", "|DEPOTDIR|install.sh -q"),
                                    equal("OPTIONAL", "INSTANCE")}),
       .failures = {1008, 1009, 1030, 1031},
       .leaves = {{"installed", "-q\n"}, {"given", "-setRMS ux\n"}}, .odd_ids = {""}},
      {.name = "INSTALL_WITH_RESTART",
       .request = asked("INSTALL", {kUnix, equal("VERSION", "06.20"), equal("CONTEXT", "|DEPOTDIR|install.sh -q"),
                                    equal("OPTIONAL", "REQUIRES_RESTART")}),
       .failures = {1030, 1031}, .reports_twice = true,
       .leaves = {{"installed", "-q\n"}, {"given", "-setRMS ux\n"}, {"depot/rc.txt", "0\n"}}, .odd_ids = {"VMQ1030E"}},
      {.name = "UNINSTALL", .request = asked("UNINSTALL", {kUnix}), .failures = {1032, 1033, 1034},
       .leaves = {{"uninstalled", "-i ux lx8266\n"}}},
      {.name = "GETCONFIG", .request = asked("GETCONFIG", {kUnix, kInstance}), .failures = {1007, 1008, 1009},
       .queued = false, .context = "INSTANCE=inst1\nB=2\n"},
      {.name = "SETCONFIG", .request = asked("SETCONFIG", {kUnix, equal("CONTEXT", "INSTANCE=inst1\nA=1\n")}),
       .failures = {1007, 1008, 1009},
       .leaves = {{"given", "INSTANCE=inst1\nA=1\n"}}},
      {.name = "REMOVEINSTANCE", .request = asked("REMOVEINSTANCE", {kUnix, equal("TARGETMSN", "inst1")}),
       .failures = {1007, 1008, 1009},
       .leaves = {{"given", "-r inst1 -pc ux\n"}}},
      {.name = "COMPLETE_INSTALL", .request = asked("COMPLETE_INSTALL", {}), .failures = {1031}, .queued = false},
      {.name = "SETCONFIG_OF_THE_DATA_AGENT",
       .request = asked("SETCONFIG", {equal("PRODUCT", "um"), equal("DACONFIG", "m.mdl"), equal("DASCRIPT", "s1.sh"),
                                      equal("TARGETMSN", "inst1:node7:DA")}),
       .failures = {1009, 1011, 1012, 1013, 1014, 1015, 1016, 1017, 1018, 1019, 1020, 1021, 1022, 1023, 1026, 1027, 1028},
       .leaves = {{"meta/m.mdl", "model\n"}, {"work/scripts/s1.sh", "one\n"},
                  {"config/.ConfigData/kumenv", "inst1|DATAPROVIDER|asfs,post,SNMP|\n"},
                  {"runs", "-h ~ -c -o inst1 stop um\n-h ~ -o inst1 start um\n"},
                  {"console", "getdptype ~/meta/m.mdl\nDELETE ~/meta/m.mdl\nIMPORT ~/meta/m.mdl\n"}}},
  };
  // clang-format on
  return kCases;
}

void prepareMachine(const InstallationHome& home) {
  home.clear();
  home.tool("bin/qinfo", kInventory);
  home.tool("bin/CorvelAgent", atHome(home, "case $* in *zz) ;; *) echo \"$@\" >> ~/runs ;; esac"));
  home.tool("bin/uninstall.sh", atHome(home, "echo \"$@\" > ~/uninstalled"));
  home.tool("bin/um_console", atHome(home, "echo \"$4\" >> ~/console\ncase $4 in getdptype*) echo snmp ;; esac"));
  home.tool("zlpqor6/lx8266/bin/vmq_xa", atHome(home, kTranslator));
  home.tool("depot/install.sh", atHome(home, "echo \"$@\" > ~/installed"));
  // Longer than the C library reads when it asks for the length: the reading itself can then fail.
  home.runAsFile(InstallationHome::runAs("lz", "other", "nobody") + "<!--" + std::string(20000, '.') + "-->");
  home.file("depot/rc.txt", "0\n");
  home.file("depot/m.mdl", "model\n");
  home.file("depot/s1.sh", "one\n");
  home.file("config/um_inst1.config", atHome(home, kDataAgent));
  home.file("config/.ConfigData/kumenv", "inst1|DATAPROVIDER|asfs,post|\n");
  home.file("meta/.keep", "");
  home.file("work/scripts/.keep", "");
  home.file("tmp/.keep", "");
}

std::string atHome(const InstallationHome& home, std::string text) {
  for (size_t at = 0; (at = text.find('~', at)) != std::string::npos; at += home.path().size())
    text.replace(at, 1, home.path());
  return text;
}

std::vector<RequestDetail::Predicate> commandThatOnlyEnds(const std::string& transaction_id) {
  return {equal("COMMAND", "START"), equal("TRANSID", transaction_id), equal("PRODUCT", "zz")};
}
