#include "tests/soak/daemon_footprint.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

namespace fs = std::filesystem;

Footprint Footprint::of(pid_t process) {
  Footprint footprint;
  const std::string folder = "/proc/" + std::to_string(process);
  std::ifstream status(folder + "/status");
  for (std::string word; status >> word;) {
    if (word == "VmRSS:") status >> footprint.resident_kib;
    if (word == "Threads:") status >> footprint.threads;
  }
  footprint.descriptors =
      static_cast<unsigned>(std::distance(fs::directory_iterator(folder + "/fd"), fs::directory_iterator()));
  for (const auto& task : fs::directory_iterator(folder + "/task")) {
    std::ifstream children(task.path() / "children");
    footprint.children += static_cast<unsigned>(
        std::distance(std::istream_iterator<std::string>(children), std::istream_iterator<std::string>()));
  }
  return footprint;
}
