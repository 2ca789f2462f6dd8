#include "util/startup_db.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "util/dom_parser.h"
#include "util/replace_file.h"
#include "util/startup_elements.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/startup_db"};

AgentEntry* agentOf(long slot) {
  return reinterpret_cast<AgentEntry*>(slot);  // NOLINT(performance-no-int-to-ptr): a slot is a long
}
long slotOf(AgentEntry* agent) {
  return reinterpret_cast<long>(agent);
}

// ---- saving ------------------------------------------------------------------------------------------------------

// Appends "<tag>value</tag>" as a line. Values are not escaped; one with markup in it clears `readable`, and so does
// one with a carriage return, which readers take for a line feed.
void appendValue(std::string& text, const char* tabs, const std::string& tag, const String& value, bool& readable) {
  const std::string narrow = value.toNarrow();
  if (narrow.find_first_of("<&\r") != std::string::npos) readable = false;
  text += tabs + ("<" + tag + ">") + narrow + "</" + tag + ">\n";
}

void appendInstance(std::string& text, const InstanceEntry& instance, bool& readable) {
  text += "\t\t<instance>\n";
  appendValue(text, "\t\t\t", "name", instance.getInstanceName(), readable);
  appendValue(text, "\t\t\t", "user", instance.getUser(), readable);
  text += "\t\t</instance>\n";
}

void appendAgent(std::string& text, const AgentEntry& agent, bool& readable) {
  text += "\t<agent>\n";
  appendValue(text, "\t\t", "productCode", agent.getProductCode(), readable);
  for (unsigned i = 0; i < agent.getNumInstances(); ++i) {
    if (const InstanceEntry* const instance = agent.getInstance(i)) appendInstance(text, *instance, readable);
  }
  text += "\t</agent>\n";
}

std::string asXml(const StartupDB& database, bool& readable) {
  const Trace trace(traceUnit);
  std::string text = "<runas>\n";
  for (unsigned i = 0; i < database.getNumAgents(); ++i) {
    if (const AgentEntry* const agent = database.getAgent(i)) appendAgent(text, *agent, readable);
  }
  return text + "</runas>\n";
}

}  // namespace

StartupDB::StartupDB(const String& fileName, Empty) : file_name_(fileName) {}

// These two by way of the first, so that the destructor frees the agents when a later one fails.
StartupDB::StartupDB(const String& fileName) : StartupDB(fileName, Empty()) {
  const Trace trace(traceUnit);
  initialize();
}

StartupDB::StartupDB(const StartupDB& other) : StartupDB(other.file_name_, Empty()) {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < other.getNumAgents(); ++i) {
    const AgentEntry* const agent = other.getAgent(i);
    addAgent(agent == nullptr ? nullptr : new AgentEntry(*agent));
  }
}

StartupDB::~StartupDB() {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < agents_.getSize(); ++i) delete agentOf(agents_[i]);
}

void StartupDB::addAgent(AgentEntry* agent) {
  std::unique_ptr<AgentEntry> owner(agent);
  agents_.append(slotOf(agent));
  (void)owner.release();  // the slot's from now on
}

void StartupDB::removeAgent(unsigned index) {
  const Trace trace(traceUnit);
  if (index >= agents_.getSize()) return;
  delete agentOf(agents_[index]);
  agents_.remove(index);
}

AgentEntry* StartupDB::getAgent(unsigned index) const {
  return index < agents_.getSize() ? agentOf(agents_[index]) : nullptr;
}

AgentEntry* StartupDB::getAgent(const String& productCode) const {
  const Trace trace(traceUnit);
  for (unsigned i = 0; i < agents_.getSize(); ++i) {
    AgentEntry* const agent = agentOf(agents_[i]);
    if (agent != nullptr && agent->getProductCode() == productCode) return agent;
  }
  return nullptr;
}

unsigned StartupDB::getNumAgents() const {
  return agents_.getSize();
}

void StartupDB::initialize() {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Parsing file: %s", file_name_.c_str().get());
  char* contents = nullptr;
  const int error = Util::readFile(file_name_.toNarrow().c_str(), &contents);
  if (contents == nullptr) {
    TRACE_ERROR(trace, "Error reading file (defaults will be used): %s. Error: %s", file_name_.c_str().get(),
                std::strerror(error));
    return;
  }
  std::unique_ptr<char, decltype(&std::free)> buffer(contents, std::free);
  DOMParser parser(buffer.get());
  buffer.reset();
  if (!parser.parse()) {
    const char* const message = parser.getErrorMessage();
    TRACE_ERROR(trace, "Error parsing xml defaults will be used: %s", message == nullptr ? "" : message);
    return;
  }
  buildModel(parser.getDocument());
}

void StartupDB::buildModel(DOMElement* root) {
  const Trace trace(traceUnit);
  if (root == nullptr) return;
  for (DOMNode* const node : *root->getChildren()) {
    DOMElement* const element = asElement(node, "agent");
    AgentEntry* const agent = element == nullptr ? nullptr : buildAgentEntry(element);
    if (agent != nullptr) addAgent(agent);
  }
}

bool StartupDB::save() const {
  const Trace trace(traceUnit);
  bool readable = true;
  const std::string text = asXml(*this, readable);
  // One value that breaks the file would lose every entry: the reader takes all of it or nothing.
  if (!readable || !DOMParser(text.c_str()).parse()) {
    TRACE_ERROR(trace, "File %s is not saved: a name or user in it could not be read back", file_name_.c_str().get());
    return false;
  }
  int error = 0;
  if (!replaceFile(file_name_.toNarrow(), text, error)) {
    TRACE_ERROR(trace, "Error opening file, %s, in write mode: %%", file_name_.c_str().get());
    return false;
  }
  if (error != 0) {
    TRACE_ERROR(trace, "Error writing file %s, it stays as it was: %s", file_name_.c_str().get(), std::strerror(error));
  }
  return true;
}

}  // namespace VMQ
