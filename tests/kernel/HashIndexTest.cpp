#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "kernel/KHashIndex.h"

namespace {
KString Key(int i) { return KString::FromUtf8("Plugin" + std::to_string(i)); }

// Keys whose hashes agree in their low `bits` bits: they share one bucket until the index has
// more than 2^bits buckets.
std::vector<KString> CollidingKeys(int count, int bits) {
  std::vector<KString> keys;
  for (int i = 0; static_cast<int>(keys.size()) < count; ++i) {
    KString key = Key(i);
    if ((KJenkinsHash(key) & ((1u << bits) - 1)) == 0) keys.push_back(key);
  }
  return keys;
}
}  // namespace

TEST(KJenkinsHash, KnownValues) {
  EXPECT_EQ(KJenkinsHash(KString()), 0u);
  EXPECT_EQ(KJenkinsHash(KString("a")), 0xCA2E9442u);
  EXPECT_EQ(KJenkinsHash(KString("The quick brown fox jumps over the lazy dog")), 0x519E91F5u);
  EXPECT_EQ(KJenkinsHash(KString::FromUtf8("\u20AC")), 0x9A5BABA9u);  // a unit above 8 bits
}

// An 8-bit key is hashed as its widened units, so a key finds itself whatever its storage.
TEST(KJenkinsHash, SameOverEveryStorage) {
  const char* fox = "The quick brown fox jumps over the lazy dog";
  EXPECT_EQ(KJenkinsHash(KString::Static(fox)), 0x519E91F5u);
  EXPECT_EQ(KJenkinsHash(KString::Widen(fox)), 0x519E91F5u);
  EXPECT_EQ(KString::FromUtf8(fox).GetStorage(), KString::kInline);
  EXPECT_EQ(KJenkinsHash(KString::FromUtf8(fox)), 0x519E91F5u);
  const auto heap = KStringT<8>::FromUtf8(fox);
  EXPECT_EQ(heap.GetStorage(), KString::kHeap);
  EXPECT_EQ(KJenkinsHash(heap), 0x519E91F5u);

  // A byte above 0x7F widens to the same unit as its Latin-1 character, never sign-extended.
  EXPECT_EQ(KJenkinsHash(KString::Static("\xE9")), 0x7D4B7A55u);
  EXPECT_EQ(KJenkinsHash(KString::FromUtf8("\u00E9")), 0x7D4B7A55u);

  const std::string longText(90, 'q');
  EXPECT_EQ(KJenkinsHash(KString::Static(longText.c_str())), KJenkinsHash(KString::FromUtf8(longText)));
}

// Colliding keys inserted in scrambled order are found by bisection only when each bucket is
// kept sorted, through every growth of the index.
TEST(KStringHashIndex, CollidingKeysStaySortedInTheirBucket) {
  std::vector<KString> keys = CollidingKeys(301, 10);
  const KString absent = keys.back();
  keys.pop_back();
  std::shuffle(keys.begin(), keys.end(), std::mt19937(7));

  KStringHashIndex<int> index;
  for (size_t i = 0; i < keys.size(); ++i) ASSERT_TRUE(index.Insert(keys[i], static_cast<int>(i)));
  EXPECT_EQ(index.BucketCount(), 256);
  for (size_t i = 0; i < keys.size(); ++i) {
    const int* value = index.Find(keys[i]);
    ASSERT_NE(value, nullptr) << keys[i].ToUtf8();
    EXPECT_EQ(*value, static_cast<int>(i));
  }
  EXPECT_EQ(index.Find(absent), nullptr);
}

TEST(KStringHashIndex, DuplicateIsRefusedAndChangesNothing) {
  KStringHashIndex<int> index(4);
  EXPECT_TRUE(index.Insert(KString(), -1));  // the empty key is a key like any other
  for (int i = 1; i < 8; ++i) ASSERT_TRUE(index.Insert(Key(i), i));
  ASSERT_EQ(index.BucketCount(), 4);  // two keys per bucket: full, but not yet grown

  // The same text in another storage is the same key; refusing it must not grow the index.
  EXPECT_FALSE(index.Insert(KString::Widen("Plugin3"), 99));
  EXPECT_FALSE(index.Insert(KString(), 99));
  EXPECT_EQ(index.Count(), 8);
  EXPECT_EQ(index.BucketCount(), 4);
  EXPECT_EQ(*index.Find(Key(3)), 3);
  EXPECT_EQ(*index.Find(KString()), -1);

  EXPECT_TRUE(index.Insert(Key(8), 8));
  EXPECT_EQ(index.BucketCount(), 8);
}

TEST(KStringHashIndex, ManyKeysAllFoundAfterGrowth) {
  constexpr int kKeys = 10000;
  KStringHashIndex<int> index;
  for (int i = 0; i < kKeys; ++i) ASSERT_TRUE(index.Insert(Key(i), i));
  EXPECT_EQ(index.Count(), kKeys);
  EXPECT_EQ(index.BucketCount(), 8192);  // the smallest power of two keeping two keys a bucket
  for (int i = 0; i < kKeys; ++i) {
    const int* value = index.Find(Key(i));
    ASSERT_NE(value, nullptr) << i;
    EXPECT_EQ(*value, i);
  }
  EXPECT_EQ(index.Find(Key(kKeys)), nullptr);
  EXPECT_EQ(index.Find(KString("Plugin")), nullptr);   // a prefix of every key
  EXPECT_EQ(index.Find(KString("Plugin01")), nullptr);  // close to a key but not one
}
