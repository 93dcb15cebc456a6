#include <gtest/gtest.h>

#include "kernel/KString.h"

TEST(KString, SmokeInlineAndHeap) {
  KString a = "hello";
  EXPECT_EQ(a.GetStorage(), KString::kLiteral);
  KString b = KString::FromUtf8(std::string(60, 'x'));
  EXPECT_EQ(b.GetStorage(), KString::kHeap);
}
