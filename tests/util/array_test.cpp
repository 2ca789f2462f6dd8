// The growable array.
#include "util/array.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "range_error.h"
#include "tests/support/failing_allocation.h"
#include "util/string.h"

using VMQ::Array;
using VMQ::String;

namespace {

template <typename T>
std::vector<T> elementsOf(const Array<T>& array) {
  return {array.getData(), array.getData() + array.getSize()};
}

Array<long> arrayOf(const std::vector<long>& elements) {
  Array<long> array;
  array.append(elements.data(), static_cast<unsigned int>(elements.size()));
  return array;
}

/// An element with constructors, which knows how many of its kind live.
struct Counted {
  static inline int alive = 0;
  int value = 0;

  Counted() noexcept { ++alive; }
  explicit Counted(int v) noexcept : value(v) { ++alive; }
  Counted(const Counted& other) noexcept : value(other.value) { ++alive; }
  Counted& operator=(const Counted&) noexcept = default;
  ~Counted() { --alive; }
};

// ---- growth -------------------------------------------------------------------------------------------------------

TEST(ArrayTest, NewArrayIsEmptyWithCapacityEight) {
  const Array<long> array;
  EXPECT_EQ(array.getSize(), 0u);
  EXPECT_EQ(array.getCapacity(), 8u);
  EXPECT_NE(array.getData(), nullptr);
}

TEST(ArrayTest, SizedArrayHasRoomForTenMore) {
  const Array<long> array(5u);
  EXPECT_EQ(array.getSize(), 5u);
  EXPECT_EQ(array.getCapacity(), 15u);
}

template <typename T>
class ArrayOf : public testing::Test {};
using ElementTypes = testing::Types<unsigned short, long, Counted, String>;
TYPED_TEST_SUITE(ArrayOf, ElementTypes);

TYPED_TEST(ArrayOf, AppendingBeyondEightGrowsByExactlyOne) {
  Array<TypeParam> array;
  for (unsigned int size = 1; size <= 8; ++size) {
    array.append(TypeParam());
    EXPECT_EQ(array.getCapacity(), 8u) << size;
  }
  for (unsigned int size = 9; size <= 40; ++size) {
    array.append(TypeParam());
    EXPECT_EQ(array.getSize(), size);
    EXPECT_EQ(array.getCapacity(), size);
  }
}

TYPED_TEST(ArrayOf, AppendingManyGrowsToExactlyTheirNumber) {
  const std::vector<TypeParam> elements(21);
  Array<TypeParam> array;
  array.append(elements.data(), 7);
  EXPECT_EQ(array.getCapacity(), 8u);
  array.append(elements.data(), 21);
  EXPECT_EQ(array.getSize(), 28u);
  EXPECT_EQ(array.getCapacity(), 28u);
}

TYPED_TEST(ArrayOf, CapacityStaysWhenElementsGo) {
  Array<TypeParam> array;
  for (int i = 0; i < 20; ++i) array.append(TypeParam());
  array.remove(0, 20);
  EXPECT_EQ(array.getSize(), 0u);
  EXPECT_EQ(array.getCapacity(), 20u);
  array.append(TypeParam());
  EXPECT_EQ(array.getCapacity(), 20u);
}

TYPED_TEST(ArrayOf, ClearedArrayIsAsNew) {
  Array<TypeParam> array(100u);
  array.clear();
  EXPECT_EQ(array.getSize(), 0u);
  EXPECT_EQ(array.getCapacity(), 8u);
  array.append(TypeParam());
  EXPECT_EQ(array.getSize(), 1u);
}

TYPED_TEST(ArrayOf, CopyHasTheSameCapacity) {
  Array<TypeParam> array(5u);
  const Array<TypeParam> copy(array);
  EXPECT_EQ(copy.getSize(), 5u);
  EXPECT_EQ(copy.getCapacity(), 15u);
  Array<TypeParam> assigned;
  assigned = array;
  EXPECT_EQ(assigned.getSize(), 5u);
  EXPECT_EQ(assigned.getCapacity(), 15u);
}

TEST(ArrayTest, CopyOfAnArrayThatWasAppendedToHasItsCapacity) {
  const Array<long> array = arrayOf(std::vector<long>(30));
  EXPECT_EQ(Array<long>(array).getCapacity(), 30u);
}

TEST(ArrayTest, ReservingGrowsToExactlyWhatIsAskedAndNeverShrinks) {
  Array<long> array;
  array.reserveCapacity(8);
  EXPECT_EQ(array.getCapacity(), 8u);
  array.reserveCapacity(13);
  EXPECT_EQ(array.getCapacity(), 13u);
  array.reserveCapacity(4);
  EXPECT_EQ(array.getCapacity(), 13u);
  EXPECT_EQ(array.getSize(), 0u);
}

TEST(ArrayTest, GrowingAddsElementsAndOnlyTheRoomTheyNeed) {
  Array<long> array = arrayOf({1, 2, 3});
  array.grow(5);
  EXPECT_EQ(array.getSize(), 8u);
  EXPECT_EQ(array.getCapacity(), 8u);
  array.grow(1);
  EXPECT_EQ(array.getSize(), 9u);
  EXPECT_EQ(array.getCapacity(), 9u);
  EXPECT_EQ(array[2], 3);
}

TEST(ArrayTest, PlainElementsMoveRarelyWhenManyAreAppended) {
  Array<long> array;
  unsigned int moves = 0;
  for (long i = 0; i < 100000; ++i) {
    const long* before = array.getData();
    array.append(i);
    if (array.getData() != before) ++moves;
    ASSERT_EQ(array.getCapacity(), std::max(8u, array.getSize()));
  }
  EXPECT_LE(moves, 20u);
  EXPECT_EQ(array[99999], 99999);
}

TEST(ArrayTest, LargePlainArrayKeepsItsElementsAsItGrows) {
  constexpr unsigned int many = 3000000;  // of several MiB, whose blocks are resized in place
  Array<unsigned short> array;
  for (unsigned int i = 0; i < many; ++i) array.append(static_cast<unsigned short>(i));
  const Array<unsigned short> copy(array);
  array.append(array.getData(), many);
  ASSERT_EQ(array.getSize(), 2 * many);
  for (unsigned int i = 0; i < 2 * many; ++i) ASSERT_EQ(array[i], static_cast<unsigned short>(i % many)) << i;
  ASSERT_EQ(copy.getSize(), many);
  EXPECT_EQ(copy[many - 1], static_cast<unsigned short>(many - 1));
}

TEST(ArrayTest, MoreElementsThanCanBeCountedFailLikeAnAllocation) {
  Array<unsigned short> array = {};
  array.append(1);
  EXPECT_THROW(array.grow(UINT_MAX), std::bad_alloc);
  EXPECT_EQ(array.getSize(), 1u);
  EXPECT_EQ(array[0], 1);
  EXPECT_THROW(Array<unsigned short>(UINT_MAX - 5), std::bad_alloc);
}

TEST(ArrayTest, ArrayWhoseGrowthFailsStaysAsItWas) {
  Array<long> array = arrayOf({1, 2, 3});
  const std::vector<long> many(100000);
  const FailingAllocation failing(100000);
  EXPECT_THROW(array.append(many.data(), 100000), std::bad_alloc);
  EXPECT_TRUE(failing.happened());
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1, 2, 3}));
  EXPECT_EQ(array.getCapacity(), 8u);
}

// ---- elements -----------------------------------------------------------------------------------------------------

TEST(ArrayTest, ElementsAreReadAndWrittenByIndex) {
  Array<long> array = arrayOf({10, 20, 30});
  array[1] = 21;
  EXPECT_EQ(elementsOf(array), (std::vector<long>{10, 21, 30}));
  EXPECT_EQ(std::as_const(array)[2], 30);
}

TEST(ArrayTest, InsertingAtTheEndAppends) {
  Array<long> array = arrayOf({1, 2});
  array.insert(2, 3L);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1, 2, 3}));
}

TEST(ArrayTest, InsertedElementsPushTheRestBack) {
  Array<long> array = arrayOf({1, 2, 3, 4, 5, 6, 7});
  const long more[] = {-1, -2, -3};
  array.insert(2, more, 3);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1, 2, -1, -2, -3, 3, 4, 5, 6, 7}));
  array.insert(1, 0L);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1, 0, 2, -1, -2, -3, 3, 4, 5, 6, 7}));
}

TEST(ArrayTest, PrependedElementsComeFirst) {
  Array<long> array = arrayOf({3});
  array.prepend(2L);
  const long more[] = {0, 1};
  array.prepend(more, 2);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{0, 1, 2, 3}));
}

TEST(ArrayTest, RemovedElementsLetTheRestMoveUp) {
  Array<long> array = arrayOf({0, 1, 2, 3, 4, 5});
  array.remove(1, 2);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{0, 3, 4, 5}));
  array.remove(0);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{3, 4, 5}));
}

TEST(ArrayTest, TheLastElementCanBeRemoved) {
  Array<long> array = arrayOf({1, 2});
  array.remove(array.getSize() - 1);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1}));
}

TEST(ArrayTest, RemovingNothingDoesNothing) {
  Array<long> array;
  array.remove(0, 0);
  EXPECT_EQ(array.getSize(), 0u);
  Array<long> three = arrayOf({1, 2, 3});
  three.remove(3, 0);
  EXPECT_EQ(three.getSize(), 3u);
}

TEST(ArrayTest, AppendingOrInsertingNothingDoesNothing) {
  Array<long> array = arrayOf({1});
  array.append(nullptr, 0);
  array.insert(1, nullptr, 0);
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1}));
}

TEST(ArrayTest, CopiesAreDeep) {
  Array<String> array;
  array.append(String("one"));
  Array<String> copy(array);
  copy[0].append(String("!"));
  EXPECT_EQ(array[0], "one");
  EXPECT_EQ(copy[0], "one!");
}

TEST(ArrayTest, AssigningAnArrayToItselfDoesNothing) {
  Array<String> array;
  array.append(String("one"));
  const Array<String>& same = array;
  array = same;
  ASSERT_EQ(array.getSize(), 1u);
  EXPECT_EQ(array[0], "one");
}

TEST(ArrayTest, MovedFromArrayIsAsNew) {
  Array<String> array(20u);
  Array<String> taken(std::move(array));
  EXPECT_EQ(taken.getSize(), 20u);
  EXPECT_EQ(array.getSize(), 0u);  // NOLINT(bugprone-use-after-move): what it is now is what is tested
  EXPECT_EQ(array.getCapacity(), 8u);
  array.append(String("again"));
  taken = std::move(array);
  ASSERT_EQ(taken.getSize(), 1u);
  EXPECT_EQ(taken[0], "again");
  EXPECT_EQ(array.getSize(), 0u);  // NOLINT(bugprone-use-after-move)
}

TEST(ArrayTest, ElementsWithConstructorsAreAllConstructedAndAllDestroyed) {
  {
    Array<Counted> array;
    for (int i = 0; i < 30; ++i) array.append(Counted(i));
    EXPECT_EQ(Counted::alive, 30);
    array.insert(10, Counted(100));
    array.remove(3, 5);
    EXPECT_EQ(array[5].value, 100);
    Array<Counted> copy(array);
    EXPECT_EQ(Counted::alive, 62);
    copy = Array<Counted>(5u);
    EXPECT_EQ(Counted::alive, 46);
    array.clear();
    EXPECT_EQ(Counted::alive, 15);
  }
  EXPECT_EQ(Counted::alive, 0);
}

// ---- pieces of the array itself -------------------------------------------------------------------------------------

TYPED_TEST(ArrayOf, OwnElementCanBeAppendedWhileTheArrayGrows) {
  Array<TypeParam> array(8u);
  for (unsigned int i = 0; i < 8; ++i) array[i] = TypeParam();
  for (int i = 0; i < 40; ++i) array.append(array[0]);
  EXPECT_EQ(array.getSize(), 48u);
}

TEST(ArrayTest, OwnElementsAreAppendedAsIfCopiedFirst) {
  Array<String> array;
  for (const char* text : {"a", "b", "c", "d", "e", "f", "g", "h"}) array.append(String(text));
  array.append(array[3]);
  array.append(array.getData() + 1, 3);
  ASSERT_EQ(array.getSize(), 12u);
  EXPECT_EQ(array[8], "d");
  EXPECT_EQ(array[9], "b");
  EXPECT_EQ(array[11], "d");
  EXPECT_EQ(array[3], "d");
}

TEST(ArrayTest, OwnElementsAreInsertedAsIfCopiedFirst) {
  Array<long> array = arrayOf({0, 1, 2, 3, 4, 5});
  array.insert(1, array.getData(), 6);  // within the block, and across the place of insertion
  EXPECT_EQ(elementsOf(array), (std::vector<long>{0, 0, 1, 2, 3, 4, 5, 1, 2, 3, 4, 5}));
  array.insert(0, array[11]);
  EXPECT_EQ(array[0], 5);
  array.prepend(array.getData() + 11, 2);
  EXPECT_EQ(array[0], 4);
  EXPECT_EQ(array[1], 5);
}

// ---- out of range ---------------------------------------------------------------------------------------------------

struct OutOfRange {
  const char* name;
  void (*act)(Array<long>&);
};

class ArrayAccessOutOfRange : public testing::TestWithParam<OutOfRange> {};

TEST_P(ArrayAccessOutOfRange, IsPrintedThrownAndChangesNothing) {
  Array<long> array = arrayOf({1, 2, 3});
  testing::internal::CaptureStdout();
  const std::string error = rangeErrorOf([&] { GetParam().act(array); });
  const std::string printed = testing::internal::GetCapturedStdout();

  int line = 0;
  ASSERT_EQ(std::sscanf(error.c_str(), "line: %d, file: vmqarryi", &line), 1) << error;
  EXPECT_EQ(error, "line: " + std::to_string(line) + ", file: vmqarryi");
  EXPECT_EQ(printed, "IndexOutOfBoundsException vmqarryi:" + std::to_string(line) + "\n");
  EXPECT_EQ(elementsOf(array), (std::vector<long>{1, 2, 3}));
  EXPECT_EQ(array.getCapacity(), 8u);
}

constexpr long FOUR[] = {4, 4, 4, 4};

INSTANTIATE_TEST_SUITE_P(
    All, ArrayAccessOutOfRange,
    testing::Values(OutOfRange{"Index", [](Array<long>& a) { a[3] = 0; }},
                    OutOfRange{"IndexOfConst", [](Array<long>& a) { (void)std::as_const(a)[3]; }},
                    OutOfRange{"LargestIndex", [](Array<long>& a) { a[UINT_MAX] = 0; }},
                    OutOfRange{"Insert", [](Array<long>& a) { a.insert(4, 0L); }},
                    OutOfRange{"InsertMany", [](Array<long>& a) { a.insert(4, FOUR, 4); }},
                    OutOfRange{"InsertNothing", [](Array<long>& a) { a.insert(4, FOUR, 0); }},
                    OutOfRange{"Remove", [](Array<long>& a) { a.remove(3); }},
                    OutOfRange{"RemoveTooMany", [](Array<long>& a) { a.remove(1, 3); }},
                    OutOfRange{"RemoveNothing", [](Array<long>& a) { a.remove(4, 0); }},
                    OutOfRange{"RemoveSoManyThatTheSumWraps", [](Array<long>& a) { a.remove(1, 0xFFFFFFFF); }},
                    OutOfRange{"RemoveFromTheLargestIndex", [](Array<long>& a) { a.remove(UINT_MAX, 1); }}),
    [](const testing::TestParamInfo<OutOfRange>& test) { return test.param.name; });

TEST(ArrayTest, EmptyArrayHasNoElement) {
  Array<long> array;
  testing::internal::CaptureStdout();
  EXPECT_THROW(array[0], VMQ::IndexOutOfBoundsException);
  EXPECT_THROW(array.remove(0), VMQ::IndexOutOfBoundsException);
  (void)testing::internal::GetCapturedStdout();
}

}  // namespace
