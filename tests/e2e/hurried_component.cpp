// The component as it is, in a host whose BSS1_Sleep returns at once. Its child processes take the time that they take.

#include <dlfcn.h>

#include <cstdio>

#include "test_seam.h"

extern "C" [[gnu::visibility("default")]] unsigned Initialize_Mgmt_Functions() {
  [[maybe_unused]] static const auto* const kept = new TEST_RecordedSleeps;  // for the life of the process
  void* const component = dlopen(VMQ_COMPONENT, RTLD_NOW | RTLD_LOCAL);
  if (component == nullptr) {
    (void)std::fprintf(stderr, "%s\n", dlerror());
    return 1;
  }
  return reinterpret_cast<unsigned (*)()>(dlsym(component, "Initialize_Mgmt_Functions"))();
}
