#pragma once

#include <cstdint>

#include "kernel/KArray.h"
#include "kernel/KString.h"

// Jenkins' one-at-a-time hash over UTF-16 code units (8-bit literals widened first).
template <int N>
uint32_t KJenkinsHash(const KStringT<N>& key) noexcept {
  return key.VisitUnits([](const auto* units, int32_t length) {
    uint32_t h = 0;
    for (int32_t i = 0; i < length; ++i) {
      h += static_cast<uint16_t>(static_cast<std::make_unsigned_t<std::remove_cv_t<std::remove_pointer_t<decltype(units)>>>>(units[i]));
      h += h << 10;
      h ^= h >> 6;
    }
    h += h << 3;
    h ^= h >> 11;
    h += h << 15;
    return h;
  });
}

template <class V>
struct KHashEntry {
  KString key;
  V value;
};
template <class V>
struct KIsRelocatable<KHashEntry<V>> : KIsRelocatable<V> {};

// String-keyed index: a power-of-two number of buckets chosen by the hash, each bucket kept
// sorted by key and searched by bisection. Doubles its buckets when they average over two.
template <class V>
class KStringHashIndex {
public:
  explicit KStringHashIndex(int32_t bucketCount = 64) {
    for (int32_t i = 0; i < bucketCount; ++i) buckets_.Append();
  }

  int32_t Count() const noexcept { return count_; }
  int32_t BucketCount() const noexcept { return buckets_.Count(); }

  // Inserts at the key's sorted place; answers false, changing nothing, when the key exists.
  bool Insert(const KString& key, const V& value) {
    const uint32_t hash = KJenkinsHash(key);
    bool found = false;
    int32_t at = Search(BucketAt(hash), key, found);
    if (found) return false;
    // Grow only for a key that is really added, so a refused duplicate leaves the index as it was.
    if (count_ + 1 > 2 * buckets_.Count()) {
      Rehash(2 * buckets_.Count());
      at = Search(BucketAt(hash), key, found);
    }
    BucketAt(hash).Insert(at, KHashEntry<V>{key, value});
    ++count_;
    return true;
  }

  // The value stored under `key`, or null.
  const V* Find(const KString& key) const noexcept {
    const KArray<KHashEntry<V>>& bucket = const_cast<KStringHashIndex*>(this)->BucketAt(KJenkinsHash(key));
    bool found = false;
    const int32_t at = Search(bucket, key, found);
    return found ? &bucket[at].value : nullptr;
  }

private:
  KArray<KHashEntry<V>>& BucketAt(uint32_t hash) noexcept {
    return buckets_[static_cast<int32_t>(hash & static_cast<uint32_t>(buckets_.Count() - 1))];
  }

  // Bisection: the index of `key`, or the place where it would be inserted.
  static int32_t Search(const KArray<KHashEntry<V>>& bucket, const KString& key, bool& found) noexcept {
    int32_t low = 0, high = bucket.Count();
    while (low < high) {
      const int32_t mid = (low + high) / 2;
      const int order = bucket[mid].key.Compare(key);
      if (order == 0) {
        found = true;
        return mid;
      }
      if (order < 0) low = mid + 1;
      else high = mid;
    }
    return low;
  }

  void Rehash(int32_t bucketCount) {
    KArray<KArray<KHashEntry<V>>> old;
    old.Swap(buckets_);
    for (int32_t i = 0; i < bucketCount; ++i) buckets_.Append();
    count_ = 0;
    for (auto& bucket : old)
      for (auto& entry : bucket) Insert(entry.key, entry.value);
  }

  KArray<KArray<KHashEntry<V>>> buckets_;
  int32_t count_ = 0;
};
