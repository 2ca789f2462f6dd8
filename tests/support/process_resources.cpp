#include "tests/support/process_resources.h"

#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

namespace fs = std::filesystem;

namespace {

unsigned entriesOf(const char* directory) {
  return static_cast<unsigned>(std::distance(fs::directory_iterator(directory), fs::directory_iterator()));
}

unsigned childrenOfAllThreads() {
  unsigned children = 0;
  for (const auto& task : fs::directory_iterator("/proc/self/task")) {
    std::ifstream stream(task.path() / "children");
    children += static_cast<unsigned>(
        std::distance(std::istream_iterator<std::string>(stream), std::istream_iterator<std::string>()));
  }
  return children;
}

}  // namespace

ProcessResources ProcessResources::now() {
  return {entriesOf("/proc/self/fd"), entriesOf("/proc/self/task"), childrenOfAllThreads()};
}

std::ostream& operator<<(std::ostream& out, const ProcessResources& resources) {
  return out << resources.descriptors << " descriptors, " << resources.threads << " threads, " << resources.children
             << " children";
}
