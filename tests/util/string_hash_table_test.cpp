// What both string-keyed maps have in common: hashing, and the order of the keys.
#include "util/string_hash_table.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <list>
#include <random>
#include <string>
#include <unordered_map>
#include <vector>

#include "util/str_ptr_map.h"
#include "util/str_str_map.h"

using VMQ::Array;
using VMQ::String;
using VMQ::StrPtrMap;
using VMQ::StrStrMap;

namespace {

using Keys = std::vector<std::string>;

Keys keysOf(const Array<String>& keys) {
  Keys result;
  for (unsigned int i = 0; i < keys.getSize(); ++i) result.push_back(keys[i].toNarrow());
  return result;
}

String textOf(const std::string& text) {
  return {text.c_str()};
}

unsigned int hashOf(const std::string& key) {
  uint64_t h = 0;
  for (const char c : key) h = (h * 33 + static_cast<unsigned char>(c)) & 0xFFFFFFFF;
  return static_cast<unsigned int>(h % 2147483647);
}

/// The rules of the order, written out with lists.
class OrderModel {
 public:
  void put(const std::string& key) {
    for (const std::string& present : bucketOf(key)) {
      if (present == key) return;
    }
    if (count_ >= threshold_) rehash();
    bucketOf(key).push_front(key);
    ++count_;
  }
  void remove(const std::string& key) {
    const size_t before = bucketOf(key).size();
    bucketOf(key).remove(key);
    count_ -= static_cast<unsigned int>(before - bucketOf(key).size());
  }
  void removeAll() {
    for (auto& bucket : buckets_) bucket.clear();
    count_ = 0;
  }
  [[nodiscard]] OrderModel copy() const {
    OrderModel result;
    result.buckets_.resize(buckets_.size());
    result.threshold_ = threshold_;
    result.count_ = count_;
    for (size_t i = 0; i < buckets_.size(); ++i) {
      for (const std::string& key : buckets_[i]) result.buckets_[i].push_front(key);
    }
    return result;
  }
  [[nodiscard]] Keys keys() const {
    Keys result;
    for (const auto& bucket : buckets_) result.insert(result.end(), bucket.begin(), bucket.end());
    return result;
  }
  [[nodiscard]] size_t buckets() const { return buckets_.size(); }
  [[nodiscard]] unsigned int threshold() const { return threshold_; }

 private:
  std::list<std::string>& bucketOf(const std::string& key) { return buckets_[hashOf(key) % buckets_.size()]; }
  void rehash() {
    std::vector<std::list<std::string>> old(buckets_.size() * 2 + 1);
    old.swap(buckets_);
    threshold_ = static_cast<unsigned int>(static_cast<float>(buckets_.size()) * 0.75F);
    for (auto bucket = old.rbegin(); bucket != old.rend(); ++bucket) {
      for (const std::string& key : *bucket) bucketOf(key).push_front(key);
    }
  }

  std::vector<std::list<std::string>> buckets_ = std::vector<std::list<std::string>>(11);
  unsigned int threshold_ = 8;
  unsigned int count_ = 0;
};

// ---- hashing --------------------------------------------------------------------------------------------------------

TEST(StringHashTest, HashIsTheSumOfTheUnitsToTheBase33) {
  EXPECT_EQ(StrStrMap::hashCode(String("")), 0u);
  EXPECT_EQ(StrStrMap::hashCode(String("a")), 97u);
  EXPECT_EQ(StrStrMap::hashCode(String("ab")), 3299u);
  EXPECT_EQ(StrStrMap::hashCode(String("abc")), 3299u * 33 + 99);
  EXPECT_EQ(StrStrMap::hashCode(String("abcd")), (3299u * 33 + 99) * 33 + 100);
}

TEST(StringHashTest, HashWrapsAt32BitsAndIsTakenModuloTheLargestPrimeBelow2To31) {
  std::string key;
  for (int length = 0; length < 50; ++length) {
    EXPECT_EQ(StrStrMap::hashCode(textOf(key)), hashOf(key)) << key;
    EXPECT_LT(StrStrMap::hashCode(textOf(key)), 2147483647u);
    key += static_cast<char>('z' - length % 26);
  }
}

TEST(StringHashTest, HashCountsWholeUnits) {
  String key;
  key.append(static_cast<unsigned short>(0xFFFF)).append(static_cast<unsigned short>(0x20AC));
  EXPECT_EQ(StrStrMap::hashCode(key), 0xFFFFu * 33 + 0x20AC);
}

TEST(StringHashTest, HashStopsAtTheFirstZero) {
  for (unsigned int length = 0; length < 9; ++length) {
    const std::string start(length, 'k');
    String key = textOf(start);
    key.append(static_cast<unsigned short>(0)).append(String("ignored"));
    EXPECT_EQ(StrStrMap::hashCode(key), hashOf(start)) << length;
  }
}

TEST(StringHashTest, BothMapsHashAlike) {
  EXPECT_EQ(StrPtrMap::hashCode(String("CORVELHOME")), StrStrMap::hashCode(String("CORVELHOME")));
}

TEST(StringHashTest, TableIsCreatedWithEmptyBuckets) {
  StrStrMap::Entry** table = nullptr;
  ASSERT_TRUE(StrStrMap::createTable(&table, 11));
  for (int i = 0; i < 11; ++i) EXPECT_EQ(table[i], nullptr);
  delete[] table;
}

// ---- order ----------------------------------------------------------------------------------------------------------

TEST(StringKeyOrderTest, KeysComeBucketByBucketAndTheLastOneFirst) {
  // Single letters hash to themselves: "a" is 97, so bucket 9 of 11; "l" (108) shares it; "b" is in bucket 10, "c" in
  // 0.
  StrStrMap map;
  for (const char* key : {"a", "b", "c", "l"}) map.put(String(key), String("v"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"c", "l", "a", "b"}));
}

TEST(StringKeyOrderTest, NinthKeyMakesTheTableGrow) {
  // 97 ("a") to 104 in 11 buckets: 9, 10, 0, 1, 2, 3, 4, 5. In 23 buckets: 5 to 12; "i" (105) is in 13, "x" (120) in 5.
  StrStrMap map;
  for (const char* key : {"a", "b", "c", "d", "e", "f", "g", "h"}) map.put(String(key), String("v"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"c", "d", "e", "f", "g", "h", "a", "b"}));
  map.put(String("h"), String("again"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"c", "d", "e", "f", "g", "h", "a", "b"}));
  map.put(String("i"), String("v"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"a", "b", "c", "d", "e", "f", "g", "h", "i"}));
  map.put(String("x"), String("v"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"x", "a", "b", "c", "d", "e", "f", "g", "h", "i"}));
}

TEST(StringKeyOrderTest, ModelGrowsAt8And17And35And71) {
  OrderModel model;
  std::vector<std::pair<size_t, unsigned int>> sizes{{model.buckets(), model.threshold()}};
  for (int i = 0; i < 72; ++i) {
    model.put(std::to_string(i));
    if (sizes.back().first != model.buckets()) sizes.emplace_back(model.buckets(), model.threshold());
  }
  EXPECT_EQ(sizes, (std::vector<std::pair<size_t, unsigned int>>{{11, 8}, {23, 17}, {47, 35}, {95, 71}, {191, 143}}));
}

TEST(StringKeyOrderTest, OrderFollowsTheRulesAtEverySize) {
  StrStrMap map;
  StrPtrMap pointers;
  OrderModel model;
  for (int i = 0; i < 500; ++i) {
    const std::string key = "KEY_" + std::to_string(i * 7919 % 1000);
    map.put(textOf(key), String("v"));
    pointers.put(textOf(key), nullptr);
    model.put(key);
    ASSERT_EQ(keysOf(map.getKeys()), model.keys()) << i;
  }
  EXPECT_EQ(keysOf(pointers.getKeys()), model.keys());
}

TEST(StringKeyOrderTest, CopyReversesEachBucket) {
  StrStrMap map;
  for (const char* key : {"a", "b", "c", "l"}) map.put(String(key), String("v"));
  const StrStrMap copy(map);
  EXPECT_EQ(keysOf(copy.getKeys()), (Keys{"c", "a", "l", "b"}));
  EXPECT_EQ(keysOf(StrStrMap(copy).getKeys()), keysOf(map.getKeys()));
}

TEST(StringKeyOrderTest, EmptiedTableKeepsItsSize) {
  StrStrMap map;
  for (int i = 0; i < 9; ++i) map.put(textOf("key" + std::to_string(i)), String("v"));
  map.removeAll();
  EXPECT_EQ(map.getKeys().getSize(), 0u);
  // In 23 buckets "b" (98) is in bucket 6 and "c" (99) in 7; in 11 they would be in 10 and 0.
  map.put(String("b"), String("v"));
  map.put(String("c"), String("v"));
  EXPECT_EQ(keysOf(map.getKeys()), (Keys{"b", "c"}));
}

// ---- random comparison ---------------------------------------------------------------------------------------------

void compareWithTwins(unsigned int seed, int steps) {
  SCOPED_TRACE("seed " + std::to_string(seed));
  std::mt19937 random(seed);
  StrStrMap map;
  std::unordered_map<std::string, std::string> twin;
  OrderModel order;
  for (int step = 0; step < steps; ++step) {
    SCOPED_TRACE("step " + std::to_string(step));
    const std::string key = "key " + std::to_string(random() % 300);
    switch (random() % 8) {
      case 0:
      case 1:
        map.remove(textOf(key));
        twin.erase(key);
        order.remove(key);
        break;
      case 2:
        if (random() % 100 == 0) {
          map.removeAll();
          twin.clear();
          order.removeAll();
        }
        break;
      case 3:
        if (random() % 20 == 0) {
          const StrStrMap copy(map);
          ASSERT_EQ(keysOf(copy.getKeys()), order.copy().keys());
        }
        break;
      default: {
        const std::string value = std::to_string(random());
        map.put(textOf(key), textOf(value));
        twin[key] = value;
        order.put(key);
      }
    }
    ASSERT_EQ(map.getSize(), twin.size());
    String value("untouched");
    const auto expected = twin.find(key);
    ASSERT_EQ(map.get(textOf(key), value), expected != twin.end());
    ASSERT_EQ(value.toNarrow(), expected != twin.end() ? expected->second : "untouched");
    if (step % 50 == 0) {
      ASSERT_EQ(keysOf(map.getKeys()), order.keys());
    }
  }
}

TEST(StringKeyedMapModelTest, AgreesWithAnUnorderedMapAndTheRulesOfTheOrder) {
  for (unsigned int seed = 1; seed <= 5; ++seed) compareWithTwins(seed, 3000);
  compareWithTwins(std::random_device()(), 5000);
}

}  // namespace
