#include <gtest/gtest.h>

#include <vector>

#include "kernel/KArray.h"

static std::vector<int> Items(const KArray<int>& array) { return {array.begin(), array.end()}; }

// The new count below two elements, then the next power of two above the old count (a reserved one too).
TEST(KArray, GrowsToNewCountBelowTwoThenToPowersOfTwo) {
  KArray<int> array;
  std::vector<int32_t> capacities;
  for (int i = 0; i < 17; ++i) {
    array.Append(i);
    capacities.push_back(array.Capacity());
  }
  EXPECT_EQ(capacities, (std::vector<int32_t>{1, 2, 4, 4, 8, 8, 8, 8, 16, 16, 16, 16, 16, 16, 16, 16, 32}));
  KArray<int> reserved;
  reserved.Reserve(5);
  for (int i = 0; i < 6; ++i) reserved.Append(i);
  EXPECT_EQ(reserved.Capacity(), 8);
  EXPECT_EQ(Items(reserved), (std::vector<int>{0, 1, 2, 3, 4, 5}));
}

// The value inserted lives in the array that grows under it: it must be copied before the old block goes.
TEST(KArray, InsertAndRemoveKeepOrderEvenWhenTheArgumentLivesInTheArray) {
  KArray<int> array;
  for (int i = 1; i <= 4; ++i) array.Append(i * 10);  // full at capacity 4
  array.Insert(1, array[3]);
  array.Insert(array.Count(), 45);
  array.RemoveAt(0);
  EXPECT_EQ(Items(array), (std::vector<int>{40, 20, 30, 40, 45}));
}
