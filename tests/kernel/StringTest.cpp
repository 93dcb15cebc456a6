#include <gtest/gtest.h>

#include <atomic>
#include <bit>
#include <latch>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "kernel/KString.h"

namespace {
constexpr char kGreeting[] = "Hello, world";

// Letters that change from one position to the next, so that a misplaced copy shows.
std::string Letters(int32_t count, int32_t from = 0) {
  std::string text;
  for (int32_t i = from; i < from + count; ++i) text += static_cast<char>('a' + i % 26);
  return text;
}
template <int N = 60>
KStringT<N> Text(int32_t count) {
  return KStringT<N>::FromUtf8(Letters(count));
}

// Where a string reads its characters from: the literal, its inline buffer or its heap block.
template <int N>
const void* UnitsOf(const KStringT<N>& s) {
  return s.VisitUnits([](const auto* units, int32_t) { return static_cast<const void*>(units); });
}
// A heap block's header words before its characters: the size in bytes, then the reference count.
constexpr int kSize = -2, kReferences = -1;
template <int N>
int32_t Header(const KStringT<N>& s, int word) {
  return static_cast<const int32_t*>(UnitsOf(s))[word];
}
}  // namespace

TEST(KStringT, LiteralsAreReferencedShortTextsInlineLongOnesOnTheHeap) {
  const KString literal = kGreeting, copy = literal;
  EXPECT_EQ(UnitsOf(copy), kGreeting);  // neither construction nor copy took the text
  EXPECT_EQ(Text(59).GetStorage(), KString::kInline);
  EXPECT_EQ(Text(60).GetStorage(), KString::kHeap);
  EXPECT_EQ(Text<16>(15).GetStorage(), KString::kInline);
  EXPECT_EQ(Text<16>(16).GetStorage(), KString::kHeap);
  // CharAt widens a literal's byte without sign extension and reads inline and heap units alike.
  const KString inlineText = KString::FromUtf8("\xC3\xA9\xF0\x9F\x98\x80"), heapText = KString::FromUtf8(Letters(100) + "\xE2\x82\xAC");
  EXPECT_EQ(KString::Static("A\xE9").CharAt(1), u'\u00E9');
  EXPECT_EQ(inlineText.CharAt(0), u'\u00E9');
  EXPECT_EQ(inlineText.CharAt(2), char16_t{0xDE00});  // the second half of U+1F600
  EXPECT_EQ(heapText.CharAt(100), u'\u20AC');
}

// A block holding c characters takes 2c + 10 bytes (header, text, NUL) rounded up to a power of two.
TEST(KStringT, HeapBlocksRoundToPowersOfTwoAndCountReferences) {
  for (int32_t c = 0; c <= 3000; ++c) ASSERT_EQ(KStringHeap::BlockSize(c), static_cast<int32_t>(std::bit_ceil(2u * c + 10))) << c;
  KString grown;  // one character at a time: inline up to 59, then a heap block that doubles
  for (int32_t i = 0; i < 1000; ++i) {
    grown.Append(static_cast<char16_t>('a' + i % 26));
    ASSERT_EQ(grown.GetStorage(), i < 59 ? KString::kInline : KString::kHeap) << i;
  }
  EXPECT_EQ(grown.ToUtf8(), Letters(1000));
  EXPECT_EQ(Header(grown, kSize), 2048);
  const KString copy = grown;
  KString assigned;
  assigned = copy;
  EXPECT_EQ(UnitsOf(assigned), UnitsOf(grown));
  EXPECT_EQ(Header(grown, kReferences), 3);
}

TEST(KStringT, ChangingOneCopyOfASharedTextLeavesTheOthers) {
  const std::string letters = Letters(200);
  KString original = KString::FromUtf8(letters);
  KString appended = original, erased = original, doubled = original, shortened = original;
  appended.Append(u'!');
  erased.Erase(0, 10);
  doubled.Append(doubled);  // reads the block it is leaving
  shortened.Reserve(10);    // a private copy keeps only what the capacity holds
  EXPECT_EQ(original.ToUtf8(), letters);
  EXPECT_EQ(appended.ToUtf8(), letters + "!");
  EXPECT_EQ(erased.ToUtf8(), letters.substr(10));
  EXPECT_EQ(doubled.ToUtf8(), letters + letters);
  EXPECT_EQ(shortened.ToUtf8(), letters.substr(0, 10));
  EXPECT_EQ(Header(original, kReferences), 1);
  const KString kept = original;  // now the original changes while a copy looks on
  original.Erase(100, 100);
  EXPECT_EQ(kept.ToUtf8(), letters);
  EXPECT_EQ(original.ToUtf8(), letters.substr(0, 100));
}

TEST(KStringT, CopiesBetweenSizesShareHeapBlocksAndMoveInlineTextsWhereTheyFit) {
  KStringT<16> narrow = Text(59);  // inline for N = 60, too long for 16
  EXPECT_EQ(narrow.GetStorage(), KString::kHeap);
  EXPECT_EQ(narrow.ToUtf8(), Letters(59));
  const KString heapText = Text(80), widened = KStringT<16>::FromUtf8("short");
  const KStringT<200> wide = heapText;
  narrow = heapText;  // drops its own block
  EXPECT_EQ(Header(heapText, kReferences), 3);  // one block for all three
  EXPECT_EQ(widened.GetStorage(), KString::kInline);
  EXPECT_EQ(widened.ToUtf8(), "short");
  EXPECT_EQ(UnitsOf(KStringT<16>(KString(kGreeting))), kGreeting);
}

TEST(KStringT, EraseAndSubStringClampAndKeepLiteralTails) {
  KString prefixDropped = kGreeting, middleDropped = kGreeting, clamped = KString::FromUtf8("abcdef"), heapText = Text(100);
  prefixDropped.Erase(0, 7);
  middleDropped.Erase(5, 2);
  clamped.Erase(4, 100);
  clamped.Erase(10, 1);
  heapText.Erase(10, 80);
  EXPECT_EQ(UnitsOf(prefixDropped), kGreeting + 7);  // still the literal, no copy
  EXPECT_EQ(prefixDropped.Length(), 5);
  EXPECT_EQ(middleDropped.ToUtf8() + clamped.ToUtf8(), "Helloworldabcd");
  EXPECT_EQ(heapText.ToUtf8(), Letters(10) + Letters(10, 90));
  const KString tail = KString(kGreeting).SubString(7, 100), longText = Text(200);
  EXPECT_EQ(UnitsOf(tail), kGreeting + 7);
  EXPECT_EQ(tail.Length(), 5);
  EXPECT_EQ(KString(kGreeting).SubString(-3, 5).ToUtf8(), "Hello");
  EXPECT_EQ(longText.SubString(50, 30).GetStorage(), KString::kInline);
  EXPECT_EQ(longText.SubString(50, 30).ToUtf8() + longText.SubString(190, 1000).ToUtf8(), Letters(30, 50) + Letters(10, 190));
}

TEST(KStringT, CompareFirstAndToInteger) {
  const struct {
    KString a, b;
    int32_t n, sign;
  } comparisons[] = {
      {"abcdef", "abcxyz", 3, 0}, {"abc", "abd", 3, -1}, {"ab", "abc", 2, 0}, {"ab", "abc", 3, -1}, {"abc", "ab", 3, 1},
      {"ab", "ab", 10, 0}, {Text(100), Text(99), 99, 0}, {Text(100), Text(99), 100, 1}, {KString::FromUtf8("\xEF\xBC\x81"), "z", 1, 1},
      {KString::Static("caf\xE9"), KString::FromUtf8("caf\xC3\xA9"), 4, 0}, {"z", KString::Static("\xE9"), 1, -1},  // Latin-1
  };
  for (const auto& [a, b, n, sign] : comparisons) {
    const int order = a.CompareFirst(b, n);
    EXPECT_EQ((order > 0) - (order < 0), sign) << a.ToUtf8() << " vs " << b.ToUtf8() << " over " << n;
  }
  // Reading stops at the first character other than a leading "-" and digits; values saturate.
  const std::pair<std::string, int64_t> integers[] = {
      {"-45", -45}, {"12ab3", 12}, {"", 0}, {"-", 0}, {"+5", 0}, {" 5", 0}, {"-77x", -77}, {"9223372036854775807", INT64_MAX},
      {"9223372036854775808", INT64_MAX}, {"-9223372036854775808", INT64_MIN}, {"-99999999999999999999999", INT64_MIN},
      {std::string(70, '0') + "42", 42},  // on the heap
  };
  for (const auto& [text, value] : integers) {
    EXPECT_EQ(KString::FromUtf8(text).ToInteger(), value) << text;
    EXPECT_EQ(KString::Static(text.c_str()).ToInteger(), value) << text;
  }
}

// Eight threads copy, change and drop copies of one heap text at once while this thread drops
// the text. Under AddressSanitizer a block freed twice, or read after its free, stops the run.
TEST(KStringT, CopiesReleasedOnManyThreadsFreeTheBlockOnce) {
  const std::string expected = Letters(300);
  for (int round = 0; round < 80; ++round) {
    const KString survivor = Text(300);
    KString text = round % 2 ? survivor : Text(300);  // without a survivor, some thread frees the block
    std::vector<std::vector<KString>> copies(8, std::vector<KString>(256, text));
    std::latch start(9);
    std::atomic<int> damaged{0};
    std::vector<std::thread> threads;
    for (std::vector<KString>& mine : copies) {
      threads.emplace_back([&] {
        start.arrive_and_wait();
        for (const KString& copy : mine) damaged += (copy + KString("!")).Length() != 301 || copy.ToUtf8() != expected;
        mine.clear();
      });
    }
    start.arrive_and_wait();
    text = KString();
    for (std::thread& thread : threads) thread.join();
    ASSERT_EQ(damaged.load(), 0);
    ASSERT_EQ(Header(survivor, kReferences), 1);
  }
}
