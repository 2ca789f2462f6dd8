// The message catalogue.

#include "apps/vmqctl/messages.h"

namespace vmqctl {

// clang-format off
const std::array<Message, 35> messages = {{
    {"VMQ1001E", "The request names no command; it has to give one in its column COMMAND.", ""},
    {"VMQ1002E", "The request carries no transaction id; it has to give one in its column TRANSID.", ""},
    {"VMQ1003E", "The request names no product; it has to give the product code in its column PRODUCT.", ""},
    {"VMQ1004E", "The request lacks what its command works on; it has to give the installer's command line, or the new "
                 "configuration, in its column CONTEXT.", ""},
    {"VMQ1005E", "The request does not say which instance it means; it has to name it in its column TARGETMSN.", ""},
    {"VMQ1006E", "The command is not supported; check its name, that it is made for this product, and with "
                 "\"vmqctl status\" that the daemon has a depot, without which it supports no command.", "command"},
    {"VMQ1007E", "The two-way translator, with which products are configured, was not found; check that bin/qinfo lists "
                 "the products ux and ax, and that vmq_xa stands in the bin folder of their architecture.",
                 "command, product"},
    {"VMQ1008E", "The two-way translator ran and ended with an error; its exit code, its command line and, when a "
                 "configuration was written, what it printed as errors stand in the parameters.",
                 "command, product, exit code, command line, error output of the translator"},
    {"VMQ1009E", "The two-way translator could not be started, or the task broke off before it got so far; check that "
                 "vmq_xa exists and may be executed, and look at the daemon's trace log.",
                 "command, product, command line"},
    {"VMQ1010E", "There is no agent depot directory; name one in the daemon's configuration (depot) and restart the "
                 "daemon.", ""},
    {"VMQ1011E", "The data agent's configuration file does not say where model files belong; add KUMP_META_PATH to it.",
                 "key, configuration file"},
    {"VMQ1012E", "The data agent's configuration file names no work directory; add KUM_WORK_PATH to it.",
                 "key, configuration file"},
    {"VMQ1013E", "The data agent's configuration file does not name the directory that its console needs as KUMP_RB_PATH; add "
                 "KUMP_RB_PATH to it.",
                 "key, configuration file"},
    {"VMQ1014E", "The model file could not be copied from the depot; check that it was pushed, that its name has no "
                 "\"..\" in it, and that the model directory exists and has room.", "model file, model directory"},
    {"VMQ1015E", "A script file could not be copied from the depot; check that it was pushed, that its name has no "
                 "\"..\" in it, and that the scripts directory exists and has room.", "script file, scripts directory"},
    {"VMQ1016E", "The data agent did not import the model file; check the model, and that the agent is running.",
                 "model file"},
    {"VMQ1017E", "The data agent's console could not be started to delete the old model; check that bin/um_console "
                 "exists and may be executed.", "command line"},
    {"VMQ1018E", "The data agent's console could not be started to import the model file; check that bin/um_console "
                 "exists and may be executed.", "command line"},
    {"VMQ1019E", "The product is not installed for any architecture; compare the product code with what bin/qinfo lists.",
                 "product"},
    {"VMQ1020E", "The data agent has no configuration file for this instance; check the managed system name and the "
                 "files config/um*.config.", "configuration file, instance"},
    {"VMQ1021E", "The scripts directory cannot be told from the data agent's work directory, which has no \"/\" in its "
                 "name; correct KUM_WORK_PATH in the agent's configuration file.", "work directory, configuration file"},
    {"VMQ1022E", "The data agent's console could not be started to ask for the type of the model; check that "
                 "bin/um_console exists and may be executed.", "command line"},
    {"VMQ1023E", "The data agent's console named no data-provider type for the model file; check the model.",
                 "model file"},
    {"VMQ1024E", "The agent control script ran and ended with an error; run the command line in the parameters by hand "
                 "to see what it prints, and look at the agent's own log.", "command line"},
    {"VMQ1025E", "The agent control script could not be started; check that bin/CorvelAgent exists and may be executed.",
                 "command line"},
    {"VMQ1026E", "The data agent was stopped to change its list of data providers and could not be started again; look "
                 "at its log and start it by hand.", "instance"},
    {"VMQ1027E", "The data agent could not be stopped, which a change of its list of data providers needs; look at its "
                 "log.", "instance"},
    {"VMQ1028E", "The data agent's new list of data providers could not be written, and the agent stays stopped; check "
                 "config/.ConfigData/kumenv and the file kumenv.copy beside it, then start the agent by hand.",
                 "file, new list"},
    {"VMQ1029E", "The request names no version to install; it has to give one in its column VERSION.", ""},
    {"VMQ1030E", "The installer could not be started, or it would restart the agent and the two-way translator that such "
                 "an install needs was not found; check the command line in the parameters and vmq_xa.", "command line"},
    {"VMQ1031E", "The installer ended with an error, or left no exit code behind; look at stdout.txt, stderr.txt and "
                 "rc.txt in the depot and at the installer's own log.",
                 "command line or path of rc.txt, exit code or NOTFOUND"},
    {"VMQ1032E", "The uninstaller ran and ended with an error; look at its own log, and run the command line in the "
                 "parameters by hand to see what it prints.",
                 "command line, exit code as one character"},
    {"VMQ1033E", "The uninstaller could not be started; check that the program in the parameters exists and may be "
                 "executed.", "command line"},
    {"VMQ1034E", "The product is in the inventory, but for no architecture that could be uninstalled; compare the "
                 "product code with what bin/qinfo lists.", "product"},
    {"VMQ1035I", "The command ended with a notice and no error; what it is about stands in the parameters.", ""},
}};
// clang-format on

const Message* findMessage(std::string_view id) {
  for (const Message& message : messages) {
    if (message.id == id) return &message;
  }
  return nullptr;
}

std::string_view messageIdOf(long returnValue) {
  constexpr long first = 1001;
  const long index = returnValue - first;
  return index >= 0 && index < static_cast<long>(messages.size()) ? messages[static_cast<std::size_t>(index)].id : "";
}

}  // namespace vmqctl
