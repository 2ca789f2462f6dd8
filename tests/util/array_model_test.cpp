// Random operations on an array and on its std:: twin.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "util/array.h"
#include "util/string.h"

using VMQ::Array;
using VMQ::String;

namespace {

template <typename T>
T element(unsigned int value);
template <>
long element(unsigned int value) {
  return static_cast<long>(value);
}
template <>
unsigned short element(unsigned int value) {
  return static_cast<unsigned short>(value);
}
template <>
String element(unsigned int value) {
  return {std::to_string(value).c_str()};
}

template <typename T>
class ArrayModel : public testing::Test {
 public:
  void run(unsigned int seed, int steps) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    std::mt19937 random(seed);
    const auto below = [&](size_t n) { return static_cast<unsigned int>(random() % std::max<size_t>(n, 1)); };
    Array<T> array;
    std::vector<T> twin;
    unsigned int capacity = 8;
    for (int step = 0; step < steps; ++step) {
      SCOPED_TRACE("step " + std::to_string(step));
      const unsigned int at = below(twin.size() + 1);
      const unsigned int first = below(twin.size());
      const unsigned int count = below(twin.size() - first + 1);
      const std::vector<T> own(twin.begin() + first, twin.begin() + first + count);
      std::vector<T> more;
      for (unsigned int i = below(6); i > 0; --i) more.push_back(element<T>(random()));
      switch (below(10)) {
        case 0:
        case 1:
          array.append(element<T>(static_cast<unsigned int>(step)));
          twin.push_back(element<T>(static_cast<unsigned int>(step)));
          break;
        case 2:
          array.append(more.data(), static_cast<unsigned int>(more.size()));
          twin.insert(twin.end(), more.begin(), more.end());
          break;
        case 3:
          array.insert(at, more.data(), static_cast<unsigned int>(more.size()));
          twin.insert(twin.begin() + at, more.begin(), more.end());
          break;
        case 4:
          if (twin.size() < 200) {
            array.append(array.getData() + first, count);
            twin.insert(twin.end(), own.begin(), own.end());
          }
          break;
        case 5:
          if (twin.size() < 200) {
            array.insert(at, array.getData() + first, count);
            twin.insert(twin.begin() + at, own.begin(), own.end());
          }
          break;
        case 6:
          array.remove(first, count);
          twin.erase(twin.begin() + first, twin.begin() + first + count);
          break;
        case 7: {
          Array<T> copy;
          copy = array;
          array = below(2) ? Array<T>(copy) : std::move(copy);
          break;
        }
        case 8:
          array.reserveCapacity(at + 5);
          capacity = std::max(capacity, at + 5);
          break;
        default:
          if (below(20) == 0) {
            array.clear();
            twin.clear();
            capacity = 8;
          }
      }
      capacity = std::max(capacity, static_cast<unsigned int>(twin.size()));
      ASSERT_EQ(array.getSize(), twin.size());
      ASSERT_EQ(array.getCapacity(), capacity);
      ASSERT_TRUE(std::equal(twin.begin(), twin.end(), array.getData()));
    }
  }
};

using ElementTypes = testing::Types<unsigned short, long, String>;
TYPED_TEST_SUITE(ArrayModel, ElementTypes);

TYPED_TEST(ArrayModel, AgreesWithAVectorAndGrowsExactly) {
  for (unsigned int seed = 1; seed <= 10; ++seed) this->run(seed, 1000);
  this->run(std::random_device()(), 2000);
}

}  // namespace
