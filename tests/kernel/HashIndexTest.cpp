#include <gtest/gtest.h>

#include <algorithm>
#include <numeric>
#include <random>
#include <string>
#include <vector>

#include "kernel/KHashIndex.h"

static KString Key(int i) { return KString::FromUtf8("Plugin" + std::to_string(i)); }
static int ValueOf(const KStringHashIndex<int>& index, const KString& key) {  // -1000 when absent
  const int* value = index.Find(key);
  return value ? *value : -1000;
}

// Over UTF-16 units: an 8-bit text hashes as its widened bytes in every storage, never sign-extended.
TEST(KJenkinsHash, KnownValuesOverEveryStorage) {
  const char* fox = "The quick brown fox jumps over the lazy dog";
  EXPECT_EQ(KJenkinsHash(KString()), 0u);
  EXPECT_EQ(KJenkinsHash(KString("a")), 0xCA2E9442u);
  EXPECT_EQ(KJenkinsHash(KString::FromUtf8("\u20AC")), 0x9A5BABA9u);  // a unit above 8 bits
  for (const KString& text : {KString::Static(fox), KString::Widen(fox), KString::FromUtf8(fox), KString(KStringT<8>::FromUtf8(fox))})
    EXPECT_EQ(KJenkinsHash(text), 0x519E91F5u) << text.GetStorage();  // literal, inline and heap
  EXPECT_EQ(KJenkinsHash(KString::Static("\xE9")), 0x7D4B7A55u);
  EXPECT_EQ(KJenkinsHash(KString::FromUtf8("\u00E9")), 0x7D4B7A55u);
}

TEST(KStringHashIndex, DuplicateIsRefusedWithoutGrowing) {
  KStringHashIndex<int> index(4);
  EXPECT_TRUE(index.Insert(KString(), -1));  // the empty key is a key like any other
  for (int i = 1; i < 8; ++i) ASSERT_TRUE(index.Insert(Key(i), i));
  ASSERT_EQ(index.BucketCount(), 4);  // two keys per bucket: full, but not yet grown
  EXPECT_FALSE(index.Insert(KString::Widen("Plugin3"), 99));  // the same key in another storage: must not grow
  EXPECT_FALSE(index.Insert(KString(), 99));
  EXPECT_EQ(index.Count(), 8);
  EXPECT_EQ(index.BucketCount(), 4);
  EXPECT_EQ(ValueOf(index, Key(3)), 3);
  EXPECT_EQ(ValueOf(index, KString()), -1);
  EXPECT_TRUE(index.Insert(Key(8), 8));
  EXPECT_EQ(index.BucketCount(), 8);
}

// Scrambled keys share buckets searched by bisection: every growth must keep each bucket sorted.
TEST(KStringHashIndex, FindsEveryKeyAfterGrowth) {
  constexpr int kKeys = 10000;
  std::vector<int> order(kKeys);
  std::iota(order.begin(), order.end(), 0);
  std::shuffle(order.begin(), order.end(), std::mt19937(7));
  KStringHashIndex<int> index;
  for (const int i : order) ASSERT_TRUE(index.Insert(Key(i), i));
  EXPECT_EQ(index.BucketCount(), 8192);  // the smallest power of two keeping two keys a bucket
  for (int i = 0; i < kKeys; ++i) ASSERT_EQ(ValueOf(index, Key(i)), i);
  for (const KString& absent : {Key(kKeys), KString("Plugin"), KString("Plugin01")}) EXPECT_EQ(ValueOf(index, absent), -1000);
}
