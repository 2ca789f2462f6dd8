// Text to a pointer, owned or borrowed.
#include "util/str_ptr_map.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <type_traits>
#include <vector>

#include "util/str_str_map.h"

using VMQ::String;
using VMQ::StrPtrMap;

namespace {

std::vector<void*>& freed() {
  static std::vector<void*>& pointers = *new std::vector<void*>;
  return pointers;
}

void recordFree(void* value) {
  freed().push_back(value);
}

/// Values that nobody frees, so that what is handed to the free function can be compared.
class StrPtrMapTest : public testing::Test {
 protected:
  StrPtrMapTest() { freed().clear(); }

  static void own(StrPtrMap& map) {
    map.setAutoDeleteValues(true);
    map.setFreeValueFunc(reinterpret_cast<void*>(recordFree));
  }

  int one_ = 1;
  int two_ = 2;
  int three_ = 3;
};

using Freed = std::vector<void*>;

TEST_F(StrPtrMapTest, PutPointerIsFoundAndStaysTheCallers) {
  StrPtrMap map;
  map.put(String("one"), &one_);
  map.put(String("null"), nullptr);
  void* value = &three_;
  ASSERT_TRUE(map.get(String("one"), &value));
  EXPECT_EQ(value, &one_);
  ASSERT_TRUE(map.get(String("null"), &value));
  EXPECT_EQ(value, nullptr);
  EXPECT_EQ(map.getSize(), 2u);
}

TEST_F(StrPtrMapTest, AbsentKeyLeavesTheValueUntouched) {
  StrPtrMap map;
  void* value = &one_;
  EXPECT_FALSE(map.get(String("key"), &value));
  map.put(String("other"), &two_);
  EXPECT_FALSE(map.get(String("key"), &value));
  EXPECT_EQ(value, &one_);
}

TEST_F(StrPtrMapTest, WithoutAutoDeleteValuesAreNeverTouched) {
  {
    StrPtrMap map;
    map.setFreeValueFunc(reinterpret_cast<void*>(recordFree));
    map.put(String("a"), &one_);
    map.put(String("a"), &two_);
    map.remove(String("a"));
    map.put(String("b"), &one_);
    map.removeAll();
    map.put(String("c"), &three_);
  }
  EXPECT_EQ(freed(), Freed());
}

TEST_F(StrPtrMapTest, ReplacedValueIsReleased) {
  StrPtrMap map;
  own(map);
  map.put(String("a"), &one_);
  map.put(String("a"), &two_);
  EXPECT_EQ(freed(), (Freed{&one_}));
  EXPECT_EQ(map.getSize(), 1u);
}

TEST_F(StrPtrMapTest, PointerPutAgainIsNotReleased) {
  StrPtrMap map;
  own(map);
  map.put(String("a"), &one_);
  map.put(String("a"), &one_);
  EXPECT_EQ(freed(), Freed());
  void* value = nullptr;
  EXPECT_TRUE(map.get(String("a"), &value));
  EXPECT_EQ(value, &one_);
}

TEST_F(StrPtrMapTest, RemovedValueIsReleased) {
  StrPtrMap map;
  own(map);
  map.put(String("a"), &one_);
  map.put(String("b"), &two_);
  map.remove(String("a"));
  map.remove(String("absent"));
  EXPECT_EQ(freed(), (Freed{&one_}));
}

TEST_F(StrPtrMapTest, NullIsNeverReleased) {
  StrPtrMap map;
  own(map);
  map.put(String("a"), nullptr);
  map.put(String("a"), &one_);
  map.put(String("a"), nullptr);
  map.remove(String("a"));
  EXPECT_EQ(freed(), (Freed{&one_}));
}

TEST_F(StrPtrMapTest, ValuesThatAreDroppedTogetherAreReleasedInTheOrderOfTheTable) {
  StrPtrMap map;
  own(map);
  // "a" (97) and "l" (108) share bucket 9, "c" (99) is in bucket 0.
  map.put(String("a"), &one_);
  map.put(String("l"), &two_);
  map.put(String("c"), &three_);
  map.removeAll();
  EXPECT_EQ(freed(), (Freed{&three_, &two_, &one_}));
  EXPECT_EQ(map.getSize(), 0u);
  map.removeAll();
  EXPECT_EQ(freed().size(), 3u);
}

TEST_F(StrPtrMapTest, ValuesAreReleasedWithTheMap) {
  {
    StrPtrMap map;
    own(map);
    map.put(String("a"), &one_);
  }
  EXPECT_EQ(freed(), (Freed{&one_}));
}

TEST_F(StrPtrMapTest, WithoutAFreeFunctionValuesAreDeleted) {
  // Under the address sanitizer a value that is not deleted, or deleted twice, is an error.
  StrPtrMap map;
  map.setAutoDeleteValues(true);
  for (int i = 0; i < 20; ++i) map.put(String(std::to_string(i % 10).c_str()), ::operator new(16));
  map.remove(String("3"));
  EXPECT_EQ(map.getSize(), 9u);
}

TEST_F(StrPtrMapTest, FreeFunctionCanBeTakenBack) {
  StrPtrMap map;
  own(map);
  map.setFreeValueFunc(nullptr);
  map.put(String("a"), ::operator new(16));
  map.removeAll();
  EXPECT_EQ(freed(), Freed());
}

TEST_F(StrPtrMapTest, IsNotCopied) {
  EXPECT_FALSE(std::is_copy_constructible_v<StrPtrMap>);
  EXPECT_FALSE(std::is_copy_assignable_v<StrPtrMap>);
  EXPECT_TRUE(std::has_virtual_destructor_v<StrPtrMap>);
}

}  // namespace
