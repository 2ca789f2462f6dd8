#include "tests/tasks/installation_home.h"

#include <sys/utsname.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "bss1.h"
#include "util/corvel_home.h"
#include "util/util.h"

namespace fs = std::filesystem;

namespace {

std::vector<std::string> linesOf(const fs::path& file) {
  std::vector<std::string> lines;
  std::ifstream stream(file);
  for (std::string line; std::getline(stream, line);) lines.push_back(line);
  return lines;
}

std::string hostNameWithoutDomain() {
  utsname names{};
  uname(&names);
  const std::string node = names.nodename;
  return node.substr(0, node.find('.'));
}

}  // namespace

InstallationHome::InstallationHome() : path_(directory_.path().string()) {
  BSS1_PutEnv(("CORVELHOME=" + path_).c_str());
  BSS1_PutEnv(("QORDEPLOY_AGENTDEPOT=" + path_ + "/depot").c_str());
  VMQ_CORVELHOME = path_.c_str();
  VMQ::Util::TEST_forgetDirectories();
}

InstallationHome::~InstallationHome() {
  unsetenv("CORVELHOME");
  unsetenv("QORDEPLOY_AGENTDEPOT");
  VMQ_CORVELHOME = nullptr;
  VMQ::Util::TEST_forgetDirectories();
}

void InstallationHome::controlScript(const std::string& body) const {
  directory_.writeScript("bin/CorvelAgent",
                         "echo \"$*\" >> '" + path_ + "/runs'\nenv > '" + path_ + "/environment'\n" + body + "\n");
}

void InstallationHome::removeControlScript() const {
  fs::remove(path_ + "/bin/CorvelAgent");
}

std::vector<std::string> InstallationHome::runs() const {
  return linesOf(path_ + "/runs");
}

std::map<std::string, std::string> InstallationHome::environment() const {
  std::map<std::string, std::string> variables;
  for (const std::string& line : linesOf(path_ + "/environment")) {
    const size_t end = line.find('=');
    if (end != std::string::npos) variables[line.substr(0, end)] = line.substr(end + 1);
  }
  return variables;
}

void InstallationHome::runAsFile(const std::string& text) const {
  const std::string name = "config/" + hostNameWithoutDomain() + "_vmqrunas.cfg";
  fs::remove(directory_ / name);
  if (!text.empty()) directory_.writeFile(name, text);
}

std::string InstallationHome::runAs(const std::string& product, const std::string& instance, const std::string& user) {
  return "<runas>\n\t<agent>\n\t\t<productCode>" + product + "</productCode>\n\t\t<instance>\n\t\t\t<name>" + instance +
         "</name>\n\t\t\t<user>" + user + "</user>\n\t\t</instance>\n\t</agent>\n</runas>\n";
}

void InstallationHome::tool(const std::string& name, const std::string& body) const {
  directory_.writeScript(name, body + "\n");
}

void InstallationHome::file(const std::string& name, const std::string& text) const {
  directory_.writeFile(name, text);
}

void InstallationHome::clear() const {
  for (const fs::directory_entry& entry : fs::directory_iterator(path_)) fs::remove_all(entry);
  fs::create_directory(depot());
}

std::vector<std::string> commandLines(const TEST_TraceCapture& trace) {
  const std::string before = "Command to run is \"";
  std::vector<std::string> commands;
  for (const std::string& text : trace.texts(RAS1_DETAIL)) {
    if (text.compare(0, before.size(), before) == 0)
      commands.push_back(text.substr(before.size(), text.size() - before.size() - 1));
  }
  return commands;
}
