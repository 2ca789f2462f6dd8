// Text to text.
#include "util/str_str_map.h"

#include <gtest/gtest.h>

#include <string>
#include <type_traits>

using VMQ::String;
using VMQ::StrStrMap;

namespace {

std::string valueOf(const StrStrMap& map, const char* key) {
  String value("absent");
  return map.get(String(key), value) ? value.toNarrow() : "absent";
}

TEST(StrStrMapTest, PutValueIsFound) {
  StrStrMap map;
  map.put(String("key"), String("value"));
  map.put(String(""), String("of the empty key"));
  EXPECT_EQ(map.getSize(), 2u);
  EXPECT_EQ(valueOf(map, "key"), "value");
  EXPECT_EQ(valueOf(map, ""), "of the empty key");
}

TEST(StrStrMapTest, PuttingAKeyTwiceKeepsTheSecondValue) {
  StrStrMap map;
  map.put(String("key"), String("first"));
  map.put(String("key"), String("second"));
  EXPECT_EQ(map.getSize(), 1u);
  EXPECT_EQ(valueOf(map, "key"), "second");
}

TEST(StrStrMapTest, AbsentKeyLeavesTheValueUntouched) {
  StrStrMap map;
  String value("before");
  EXPECT_FALSE(map.get(String("key"), value));  // there is no table yet
  EXPECT_EQ(value, "before");
  map.put(String("other"), String("value"));
  EXPECT_FALSE(map.get(String("key"), value));
  EXPECT_EQ(value, "before");
}

TEST(StrStrMapTest, NewMapHasNothing) {
  StrStrMap map;
  EXPECT_EQ(map.getSize(), 0u);
  EXPECT_EQ(map.getKeys().getSize(), 0u);
  map.remove(String("key"));
  map.removeAll();
  EXPECT_EQ(map.getSize(), 0u);
}

TEST(StrStrMapTest, RemovedKeyIsGoneAndTheOthersStay) {
  StrStrMap map;
  for (const char* key : {"a", "l", "w"}) map.put(String(key), String(key));  // all in one bucket
  map.remove(String("l"));
  map.remove(String("absent"));
  EXPECT_EQ(map.getSize(), 2u);
  EXPECT_EQ(valueOf(map, "a"), "a");
  EXPECT_EQ(valueOf(map, "l"), "absent");
  EXPECT_EQ(valueOf(map, "w"), "w");
}

TEST(StrStrMapTest, EmptiedMapCanBeUsedAgain) {
  StrStrMap map;
  for (int i = 0; i < 100; ++i) map.put(String(std::to_string(i).c_str()), String("v"));
  map.removeAll();
  EXPECT_EQ(map.getSize(), 0u);
  EXPECT_EQ(valueOf(map, "7"), "absent");
  map.put(String("7"), String("again"));
  EXPECT_EQ(valueOf(map, "7"), "again");
}

TEST(StrStrMapTest, CopyIsDeep) {
  StrStrMap map;
  map.put(String("key"), String("value"));
  StrStrMap copy(map);
  copy.put(String("key"), String("changed"));
  copy.put(String("more"), String("value"));
  EXPECT_EQ(map.getSize(), 1u);
  EXPECT_EQ(valueOf(map, "key"), "value");
  EXPECT_EQ(valueOf(copy, "key"), "changed");
}

TEST(StrStrMapTest, CopyOfAnEmptyMapIsEmpty) {
  const StrStrMap map;
  StrStrMap copy(map);
  EXPECT_EQ(copy.getSize(), 0u);
  copy.put(String("key"), String("value"));
  EXPECT_EQ(valueOf(copy, "key"), "value");
}

TEST(StrStrMapTest, StoredTextsCanBePutAgain) {
  StrStrMap map;
  map.put(String("key"), String("value"));
  VMQ::Array<String> keys = map.getKeys();
  for (int i = 0; i < 20; ++i) map.put(keys[0] + String(std::to_string(i).c_str()), keys[0]);
  EXPECT_EQ(map.getSize(), 21u);
  EXPECT_EQ(valueOf(map, "key19"), "key");
}

TEST(StrStrMapTest, IsNotAssigned) {
  EXPECT_FALSE(std::is_copy_assignable_v<StrStrMap>);
  EXPECT_TRUE(std::has_virtual_destructor_v<StrStrMap>);
}

}  // namespace
