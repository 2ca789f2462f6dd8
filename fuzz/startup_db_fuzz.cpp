// A run-as file. What was loaded and saved is loaded again as it was, and saved to the same bytes.

#include <string>

#include "fuzz/support.h"
#include "tests/support/temporary_directory.h"
#include "util/startup_db.h"

using namespace VMQ;

namespace {

void requireSame(const AgentEntry& one, const AgentEntry& other) {
  fuzz::require(one.getProductCode() == other.getProductCode(), "product codes stay");
  fuzz::require(one.getNumInstances() == other.getNumInstances(), "no instance is lost");
  for (unsigned index = 0; index < one.getNumInstances(); ++index) {
    const InstanceEntry& instance = *one.getInstance(index);
    fuzz::require(instance.getInstanceName() == other.getInstance(index)->getInstanceName(), "names of instances stay");
    fuzz::require(instance.getUser() == other.getInstance(index)->getUser(), "users stay");
  }
}

void requireSame(const StartupDB& one, const StartupDB& other) {
  fuzz::require(one.getNumAgents() == other.getNumAgents(), "no agent is lost");
  for (unsigned index = 0; index < one.getNumAgents(); ++index) {
    requireSame(*one.getAgent(index), *other.getAgent(index));
    fuzz::require(one.getAgent(one.getAgent(index)->getProductCode()) != nullptr, "an agent is found by its code");
  }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const TemporaryDirectory folder;
  const std::string contents(reinterpret_cast<const char*>(data), size);
  const std::string file = folder.writeFile("runas.cfg", contents);
  const StartupDB loaded(file.c_str());
  requireSame(loaded, StartupDB(loaded));
  if (!loaded.save()) {
    fuzz::require(readWholeFile(file) == contents, "a file that is not saved is untouched");
    return 0;
  }
  const StartupDB again(file.c_str());
  requireSame(loaded, again);
  const std::string saved = readWholeFile(file);
  fuzz::require(again.save(), "what was saved can be saved");
  fuzz::require(readWholeFile(file) == saved, "to the same bytes");
  return 0;
}
