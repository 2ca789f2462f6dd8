// The list of open requests, against its standard twin.

#include "linked_list.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <vector>

namespace {

using testing::ElementsAre;

/// Lists hold requests that they never look into; these are only addresses.
bxira* request(unsigned number) {
  return reinterpret_cast<bxira*>(uintptr_t{number} * 8 + 8);
}

std::vector<bxira*> walk(const LinkedList& list) {
  std::vector<bxira*> found;
  LinkedListIter iterator(list);
  while (bxira* const each = iterator.next()) found.push_back(each);
  EXPECT_EQ(iterator.next(), nullptr);
  EXPECT_EQ(found.size(), list.length());
  return found;
}

TEST(RequestList, IsEmptyAtFirst) {
  EXPECT_THAT(walk(LinkedList()), ElementsAre());
}

TEST(RequestList, IsWalkedFromTheFirstToTheLast) {
  LinkedList list;
  for (unsigned i = 0; i < 3; ++i) list.append(request(i));
  EXPECT_THAT(walk(list), ElementsAre(request(0), request(1), request(2)));
}

TEST(RequestList, LosesOnlyWhatIsRemoved) {
  for (unsigned removed = 0; removed < 3; ++removed) {
    LinkedList list;
    std::vector<bxira*> expected;
    for (unsigned i = 0; i < 3; ++i) {
      list.append(request(i));
      if (i != removed) expected.push_back(request(i));
    }
    list.remove(request(removed));
    EXPECT_EQ(walk(list), expected);
    list.append(request(7));
    expected.push_back(request(7));
    EXPECT_EQ(walk(list), expected);
  }
}

TEST(RequestList, IgnoresTheRemovalOfWhatIsNotOnIt) {
  LinkedList list;
  list.remove(request(0));
  list.append(request(0));
  list.remove(request(1));
  EXPECT_THAT(walk(list), ElementsAre(request(0)));
  list.remove(request(0));
  list.remove(request(0));
  EXPECT_THAT(walk(list), ElementsAre());
}

TEST(RequestList, DoesWhatAVectorDoes) {
  LinkedList list;
  std::vector<bxira*> twin;
  std::mt19937 random(20240610);
  for (int step = 0; step < 3000; ++step) {
    bxira* const each = request(static_cast<unsigned>(random() % 20));
    const auto found = std::find(twin.begin(), twin.end(), each);
    if (found == twin.end() && random() % 2 == 0) {
      list.append(each);
      twin.push_back(each);
    } else {
      list.remove(each);
      if (found != twin.end()) twin.erase(found);
    }
    ASSERT_EQ(walk(list), twin) << "step " << step;
  }
}

}  // namespace
