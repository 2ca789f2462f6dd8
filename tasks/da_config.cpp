#include "tasks/da_config.h"

#include <sys/stat.h>

#include "tasks/da_configuration_file.h"
#include "tasks/da_console.h"
#include "tasks/file_helpers.h"
#include "tasks/product_arch.h"
#include "tasks/start_stop.h"
#include "tasks/task_manager.h"
#include "util/corvel_home.h"
#include "util/parent_component.h"
#include "util/str_str_map.h"
#include "util/string_tokenizer.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::StrStrMap;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/da_config"};

constexpr mode_t SCRIPT_MODE = 0770;

/// One request on its way through the steps; each step that fails leaves its message in the request.
class DaConfiguration {
 public:
  DaConfiguration(const Trace& trace, TaskQueueElem& request) : trace_(trace), request_(request) {}

  TASK_RC run();

 private:
  TASK_RC findConfigurationFile();
  TASK_RC readConfigurationFile();
  TASK_RC findDirectories();
  TASK_RC copyModel();
  TASK_RC copyScripts();
  TASK_RC activateModel();

  void parseContext();
  [[nodiscard]] bool hasModel() const { return request_.daconfig.length() != 0; }
  TASK_RC askForType(const DaConsole& console);
  TASK_RC ensureTypeStartsWithAgent();
  TASK_RC replaceModel(const DaConsole& console);
  TASK_RC addToStartup();
  [[nodiscard]] bool copyFromDepot(const String& name, const String& directory) const;

  /// Puts the message id and "value" or "value,context" into the request and returns the code.
  TASK_RC fail(TASK_RC rc, const String& value);
  TASK_RC fail(TASK_RC rc, const String& value, const String& context) { return fail(rc, value + "," + context); }

  const Trace& trace_;
  TaskQueueElem& request_;
  String product_;
  String instance_;
  String port_;
  String configuration_file_;
  String meta_path_;
  String work_path_;
  String rb_path_;
  String startup_list_;
  String arch_;
  String scripts_directory_;
  String type_;
};

String valueBehindEquals(const String& token) {
  const unsigned equals = token.find(static_cast<unsigned short>('='), 0);
  return equals == String::NPOS || equals + 1 == token.length() ? String() : token.substr(equals + 1);
}

TASK_RC DaConfiguration::fail(TASK_RC rc, const String& value) {
  request_.retmsgid = rcToMsgId(rc);
  request_.retmsgparm = value;
  return rc;
}

TASK_RC DaConfiguration::run() {
  if (request_.daconfig.length() == 0 && request_.dascript.length() == 0) {
    TRACE_DETAIL(trace_, "DA SetConfig called but no MDL or Script files specified");
    return TASK_OK;
  }
  product_ = request_.product;
  product_.toLower();
  instance_ = getDaInstanceName(request_.targetmsn);
  parseContext();

  using Step = TASK_RC (DaConfiguration::*)();
  for (const Step step : {&DaConfiguration::findConfigurationFile, &DaConfiguration::readConfigurationFile,
                          &DaConfiguration::findDirectories, &DaConfiguration::copyModel, &DaConfiguration::copyScripts,
                          &DaConfiguration::activateModel}) {
    const TASK_RC rc = (this->*step)();
    if (rc != TASK_OK) return rc;
  }
  return TASK_OK;
}

void DaConfiguration::parseContext() {
  String context = request_.context;
  context.trim().toUpper();
  bool restart = false;
  StringTokenizer tokens(context, ",");
  while (tokens.hasMoreTokens()) {
    const String token = tokens.nextToken();
    if (token.find(String("PORT="), 0) != String::NPOS) port_ = valueBehindEquals(token);
    if (token.find(String("RESTART="), 0) != String::NPOS) restart = valueBehindEquals(token) == "Y";
  }
  TRACE_DETAIL(trace_, "Context [%s] port (optional) [%s] restart (1=true) [%d]", context.c_str().get(),
               port_.c_str().get(), restart ? 1 : 0);
}

TASK_RC DaConfiguration::findConfigurationFile() {
  configuration_file_ = getDaConfigFileName(instance_);
  if (Util::pathExists(configuration_file_)) return TASK_OK;
  instance_.toLower();
  configuration_file_ = getDaConfigFileName(instance_);
  if (Util::pathExists(configuration_file_)) return TASK_OK;
  TRACE_ERROR(trace_, "%s Configuration file [%s] for instance (optional) [%s] does not exist",
              rcToMsgId(TASK_NO_AGENT_CONFIG), configuration_file_.c_str().get(), instance_.c_str().get());
  return fail(TASK_NO_AGENT_CONFIG, configuration_file_, instance_);
}

TASK_RC DaConfiguration::readConfigurationFile() {
  StrStrMap values;
  populateHashMapFromFile(configuration_file_, '*', values);
  const struct {
    const char* key;
    String& value;
    TASK_RC missing;
  } REQUIRED[] = {{"KUMP_META_PATH", meta_path_, TASK_NO_META_PATH},
                  {"KUM_WORK_PATH", work_path_, TASK_NO_WORK_PATH},
                  {"KUMP_RB_PATH", rb_path_, TASK_NO_RB_PATH}};
  for (const auto& required : REQUIRED) {
    if (!values.get(required.key, required.value)) {
      TRACE_ERROR(trace_, "%s No value found for [%s] in config file [%s]", rcToMsgId(required.missing), required.key,
                  configuration_file_.c_str().get());
      return fail(required.missing, required.key, configuration_file_);
    }
    removeChar(required.value, '\'');
  }
  if (!values.get("KUMA_STARTUP_DP", startup_list_)) TRACE_DETAIL(trace_, "No value found for %s", "KUMA_STARTUP_DP");
  removeChar(startup_list_, '\'');
  return TASK_OK;
}

TASK_RC DaConfiguration::findDirectories() {
  const unsigned separator = work_path_.rfind(static_cast<unsigned short>('/'));
  if (work_path_.find(String("/"), 0) == String::NPOS) {
    TRACE_ERROR(trace_, "%s Work directory [%s] from tag [%%] in config file [%s] cannot be parsed, no dir separator",
                rcToMsgId(TASK_WORK_PATH_NOT_PARSED), work_path_.c_str().get(), configuration_file_.c_str().get());
    return fail(TASK_WORK_PATH_NOT_PARSED, work_path_, configuration_file_);
  }
  // A separator at position 0 alone is not reported by rfind: the parent is then the root.
  const String parent = separator == String::NPOS ? String() : work_path_.substr(0, separator);
  scripts_directory_ = parent + "/" + "scripts";

  arch_ = getProductArch(product_);
  const String base = getProductArchDir(arch_, product_);
  if (base.length() == 0) {
    TRACE_ERROR(trace_, "%s Supplied product code [%s] is not installed", rcToMsgId(TASK_PRODUCT_NOT_INSTALLED),
                product_.c_str().get());
    return fail(TASK_PRODUCT_NOT_INSTALLED, product_);
  }
  const String bin = base + "/" + "bin" + "/";
  TRACE_DETAIL(trace_, "DA Base Dir is [%s]", base.c_str().get());
  TRACE_DETAIL(trace_, "DA Bin Dir is [%s]", bin.c_str().get());
  TRACE_DETAIL(trace_, "DA Work Dir is [%s]", work_path_.c_str().get());
  TRACE_DETAIL(trace_, "DA Scripts Dir is [%s]", scripts_directory_.c_str().get());
  TRACE_DETAIL(trace_, "DA RB Dir is [%s]", rb_path_.c_str().get());
  return TASK_OK;
}

bool DaConfiguration::copyFromDepot(const String& name, const String& directory) const {
  return !hasParentComponent(name) && Util::copyFile(depotDir + name, directory) == 0;
}

TASK_RC DaConfiguration::copyModel() {
  if (!hasModel()) return TASK_OK;
  if (copyFromDepot(request_.daconfig, meta_path_)) return TASK_OK;
  TRACE_ERROR(trace_, "%s Failed to copy MDL file %s to MDL directory %s", rcToMsgId(TASK_MODEL_NOT_COPIED),
              request_.daconfig.c_str().get(), meta_path_.c_str().get());
  return fail(TASK_MODEL_NOT_COPIED, request_.daconfig, meta_path_);
}

TASK_RC DaConfiguration::copyScripts() {
  StringTokenizer scripts(request_.dascript, ",");
  while (scripts.hasMoreTokens()) {
    const String script = scripts.nextToken();
    if (!copyFromDepot(script, scripts_directory_)) {
      TRACE_ERROR(trace_, "%s Failed to copy Script file %s to scripts directory %s", rcToMsgId(TASK_SCRIPT_NOT_COPIED),
                  script.c_str().get(), scripts_directory_.c_str().get());
      return fail(TASK_SCRIPT_NOT_COPIED, script, scripts_directory_);
    }
    const String copied = scripts_directory_ + "/" + ::getFilenameFromPath(script);
    TRACE_DETAIL(trace_, "Settings permissions on script file [%s] to [%d]", copied.c_str().get(),
                 static_cast<int>(SCRIPT_MODE));
    if (chmod(copied.toNarrow().c_str(), SCRIPT_MODE) != 0)
      TRACE_ERROR(trace_, "Failed to set permissions on file [%s] to [%d]", copied.c_str().get(),
                  static_cast<int>(SCRIPT_MODE));
  }
  return TASK_OK;
}

TASK_RC DaConfiguration::activateModel() {
  if (!hasModel()) return TASK_OK;
  const DaConsole console(
      {.meta_path = meta_path_, .rb_path = rb_path_, .port = port_, .managed_system_name = request_.targetmsn},
      request_.daconfig);
  TASK_RC rc = askForType(console);
  if (rc == TASK_OK) rc = ensureTypeStartsWithAgent();
  if (rc == TASK_OK) rc = replaceModel(console);
  return rc;
}

TASK_RC DaConfiguration::askForType(const DaConsole& console) {
  if (console.run("getdptype", type_) == DaConsoleEnd::kNotStarted) {
    const String command = console.commandLine("getdptype");
    TRACE_ERROR(trace_, "%s Failed to start GETDPTYPE command [%s]", rcToMsgId(TASK_GETDPTYPE_NOT_STARTED),
                command.c_str().get());
    return fail(TASK_GETDPTYPE_NOT_STARTED, command);
  }
  type_.trim().toUpper();
  if (type_.length() == 0) {
    TRACE_ERROR(trace_, "%s Could not get DPTYPE from metafile [%s]", rcToMsgId(TASK_NO_DPTYPE),
                request_.daconfig.c_str().get());
    return fail(TASK_NO_DPTYPE, request_.daconfig);
  }
  TRACE_DETAIL(trace_, "DPTYPE for metafile [%s] is [%s]", request_.daconfig.c_str().get(), type_.c_str().get());
  return TASK_OK;
}

TASK_RC DaConfiguration::ensureTypeStartsWithAgent() {
  String started = startup_list_;
  started.toUpper();
  // One provider serves these four.
  const bool servedByAsfs = type_ == "APIS" || type_ == "SOCK" || type_ == "FILE" || type_ == "SCRP";
  if (servedByAsfs && started.find(String("ASFS"), 0) != String::NPOS) {
    TRACE_DETAIL(trace_, "DPtype [%s] is part of dptype [ASFS]", type_.c_str().get());
    type_ = "ASFS";
  }
  if (started.find(type_, 0) == String::NPOS) return addToStartup();
  TRACE_DETAIL(trace_, "DPtype [%s] already in startup parms list [%s]", type_.c_str().get(),
               startup_list_.c_str().get());
  return TASK_OK;
}

TASK_RC DaConfiguration::addToStartup() {
  TRACE_DETAIL(trace_, "Adding [%s] to startup parms of [%s]", type_.c_str().get(), startup_list_.c_str().get());
  const String newList = startup_list_ + "," + type_;
  if (stopAgent(product_, instance_, nullptr) != TASK_OK) {
    TRACE_ERROR(trace_, "%s Failed to stop agent with instance (optional) [%s]", rcToMsgId(TASK_AGENT_NOT_STOPPED),
                instance_.c_str().get());
    return fail(TASK_AGENT_NOT_STOPPED, instance_);
  }
  const String file = String(VMQ_CORVELHOME) + "/config/.ConfigData/kumenv";
  if (!changeDaStartupParms(newList, file, instance_.length() != 0 ? instance_ : arch_)) {
    TRACE_ERROR(trace_, "%s Failed to update the da config file [%s] to have new startup parms of [%s]",
                rcToMsgId(TASK_STARTUP_PARMS_NOT_UPDATED), file.c_str().get(), newList.c_str().get());
    return fail(TASK_STARTUP_PARMS_NOT_UPDATED, file, newList);
  }
  if (startAgent(product_, instance_, nullptr) != TASK_OK) {
    TRACE_ERROR(trace_, "%s Failed to start agent with instance (optional) [%s]", rcToMsgId(TASK_AGENT_NOT_STARTED),
                instance_.c_str().get());
    return fail(TASK_AGENT_NOT_STARTED, instance_);
  }
  return TASK_OK;
}

TASK_RC DaConfiguration::replaceModel(const DaConsole& console) {
  String ignored;
  if (console.run("DELETE", ignored) == DaConsoleEnd::kNotStarted) {  // an agent that did not know the model is fine
    const String command = console.commandLine("DELETE");
    TRACE_ERROR(trace_, "%s Failed to start DELETE command [%s]", rcToMsgId(TASK_DELETE_NOT_STARTED),
                command.c_str().get());
    return fail(TASK_DELETE_NOT_STARTED, command);
  }
  switch (console.run("IMPORT", ignored)) {
    case DaConsoleEnd::kNotStarted: {
      const String command = console.commandLine("IMPORT");
      TRACE_ERROR(trace_, "%s Failed to start IMPORT command [%s]", rcToMsgId(TASK_IMPORT_NOT_STARTED),
                  command.c_str().get());
      return fail(TASK_IMPORT_NOT_STARTED, command);
    }
    case DaConsoleEnd::kBadReturnCode:
      TRACE_ERROR(trace_, "%s Import of MDL file [%s] failed", rcToMsgId(TASK_IMPORT_FAILED),
                  request_.daconfig.c_str().get());
      return fail(TASK_IMPORT_FAILED, request_.daconfig);
    case DaConsoleEnd::kFine:
      break;
  }
  TRACE_DETAIL(trace_, "Import of MDL file [%s] successfull", request_.daconfig.c_str().get());
  return TASK_OK;
}

}  // namespace

TASK_RC setDaconfig(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const TASK_RC rc = DaConfiguration(trace, request).run();
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}
