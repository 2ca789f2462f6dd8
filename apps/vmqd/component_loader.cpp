// Loads the component and calls its entry point.

#include "apps/vmqd/component_loader.h"

#include <dlfcn.h>
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <stdexcept>

#include "apps/vmqd/log.h"

namespace vmqd {
namespace {

constexpr const char* entryPoint = "Initialize_Mgmt_Functions";

void checkLibrary(const std::string& library) {
  struct stat status;
  if (stat(library.c_str(), &status) != 0) throw std::runtime_error(withReason("the component " + library, errno));
  if ((status.st_mode & S_IWOTH) != 0) throw std::runtime_error("every user may write to the component " + library);
}

}  // namespace

std::string defaultLibrary() {
  const auto folder = std::filesystem::read_symlink("/proc/self/exe").parent_path();
  return (folder / VMQ_LIBRARY_FROM_PROGRAM).lexically_normal().string();
}

void loadComponent(const std::string& library) {
  checkLibrary(library);
  void* const handle = dlopen(library.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) throw std::runtime_error(std::string("the component does not load: ") + dlerror());
  const auto initialize = reinterpret_cast<unsigned (*)()>(dlsym(handle, entryPoint));
  // cppcheck-suppress resourceLeak ; once loaded it stays, also below
  if (initialize == nullptr) throw std::runtime_error("the component " + library + " has no " + entryPoint);
  if (const unsigned status = initialize()) {
    // cppcheck-suppress resourceLeak
    throw std::runtime_error("the component " + library + " did not start, status " + std::to_string(status));
  }
  // cppcheck-suppress resourceLeak
}

}  // namespace vmqd
