#include "tests/support/process_memory.h"

#include <gtest/gtest.h>

#include <fstream>

namespace {

std::ifstream fileOf(pid_t process, const char* name) {
  return std::ifstream("/proc/" + std::to_string(process) + "/" + name);
}

}  // namespace

long memoryOf(pid_t process, const std::string& name) {
  std::ifstream status = fileOf(process, "status");
  for (std::string word; status >> word;) {
    long kibibytes;
    if (word == name + ":" && status >> kibibytes) return kibibytes;
  }
  ADD_FAILURE() << "no " << name << " of process " << process;
  return 0;
}

long pageFaultsOf(pid_t process) {
  constexpr int faultsField = 10;  // the name of the program, before it, is one word
  std::ifstream stat = fileOf(process, "stat");
  std::string word;
  for (int field = 1; field < faultsField; ++field) stat >> word;
  long faults;
  if (stat >> faults) return faults;
  ADD_FAILURE() << "no process " << process;
  return 0;
}
