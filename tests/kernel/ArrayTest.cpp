#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "kernel/KArray.h"
#include "kernel/KString.h"
#include "kernel/KStringList.h"

namespace {

std::vector<int> Items(const KArray<int>& array) { return {array.begin(), array.end()}; }

// A text of `length` characters that names its number, so that each element is recognisable.
KString Numbered(int number, int length) {
  std::string text = std::to_string(number) + ":";
  text.resize(static_cast<size_t>(length), static_cast<char>('a' + number % 26));
  return KString::FromUtf8(text);
}

}  // namespace

TEST(KArray, GrowsToNewCountBelowTwoThenToPowersOfTwo) {
  KArray<int> array;
  std::vector<int32_t> capacities;
  for (int i = 0; i < 17; ++i) {
    array.Append(i);
    capacities.push_back(array.Capacity());
  }
  EXPECT_EQ(capacities, (std::vector<int32_t>{1, 2, 4, 4, 8, 8, 8, 8, 16, 16, 16, 16, 16, 16, 16, 16, 32}));
  EXPECT_EQ(KArray<int>::GrownCapacity(5, 6), 8);
  EXPECT_EQ(KArray<int>::GrownCapacity(8, 9), 16);

  KArray<int> reserved;
  reserved.Reserve(5);
  for (int i = 0; i < 6; ++i) reserved.Append(i);
  EXPECT_EQ(reserved.Capacity(), 8);  // the rule continues from the reserved count
  EXPECT_EQ(Items(reserved), (std::vector<int>{0, 1, 2, 3, 4, 5}));
}

TEST(KArray, InsertAndRemoveKeepOrder) {
  KArray<int> array;
  for (int i = 1; i <= 4; ++i) array.Append(i * 10);  // full at capacity 4
  array.Insert(0, 5);
  array.Insert(3, 25);
  array.Insert(array.Count(), 45);
  EXPECT_EQ(Items(array), (std::vector<int>{5, 10, 20, 25, 30, 40, 45}));
  array.RemoveAt(0);
  array.RemoveAt(2);
  array.RemoveAt(array.Count() - 1);
  EXPECT_EQ(Items(array), (std::vector<int>{10, 20, 30, 40}));
  array.Insert(1, array[3]);  // the argument lives in the array that grows under it
  EXPECT_EQ(Items(array), (std::vector<int>{10, 40, 20, 30, 40}));
}

TEST(KArray, HoldsStringsAcrossReallocation) {
  const KString shared = Numbered(999, 200);
  KStringList list;
  for (int i = 0; i < 32; ++i) list.Append(i % 3 == 0 ? shared : Numbered(i, i % 2 ? 59 : 80));
  list.Insert(0, list[31]);  // an inline text copied across the growth from 32 to 64
  list.RemoveAt(20);
  ASSERT_EQ(list.Count(), 32);
  EXPECT_EQ(list[0].ToUtf8(), Numbered(31, 59).ToUtf8());
  for (int i = 1; i < 32; ++i) {
    const int number = i < 20 ? i - 1 : i;
    EXPECT_EQ(list[i].ToUtf8(), (number % 3 == 0 ? shared : Numbered(number, number % 2 ? 59 : 80)).ToUtf8()) << i;
  }
  EXPECT_EQ(list[1].GetStorage(), KString::kHeap);
  EXPECT_EQ(list[2].GetStorage(), KString::kInline);

  const KStringList copy = list;
  EXPECT_EQ(copy.IndexOf(Numbered(5, 59)), 6);
  EXPECT_EQ(copy.IndexOf(shared), 1);
  EXPECT_EQ(copy.IndexOf(KString("absent")), -1);
  list.Clear();
  EXPECT_EQ(copy[31].ToUtf8(), Numbered(31, 59).ToUtf8());
}
