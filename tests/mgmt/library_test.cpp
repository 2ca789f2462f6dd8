// The component as the file that a host loads.

#include <dlfcn.h>
#include <gtest/gtest.h>

// Its executor thread outlives every request to unload.
TEST(Library, StaysLoadedWhenTheHostLetsGoOfIt) {
  ASSERT_EQ(dlopen(VMQ_COMPONENT, RTLD_NOW | RTLD_NOLOAD), nullptr) << "it is loaded already";
  void* const library = dlopen(VMQ_COMPONENT, RTLD_NOW | RTLD_LOCAL);
  ASSERT_NE(library, nullptr) << dlerror();
  ASSERT_NE(dlsym(library, "Initialize_Mgmt_Functions"), nullptr);
  ASSERT_EQ(dlclose(library), 0);
  EXPECT_NE(dlopen(VMQ_COMPONENT, RTLD_NOW | RTLD_NOLOAD), nullptr);
}
