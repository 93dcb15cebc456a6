#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "core/Element.h"
#include "tests/core/TraceCapture.h"

TEST(Element, AttributesStaySortedAndUniqueWhateverTheOrderOfSetting) {
  std::vector<std::string> names = {"a", "Z\xC3\xA9"};  // lower case sorts after every upper-case name
  for (int i = 0; i < 64; ++i) names.push_back("A" + std::to_string(i * 37 % 101));
  std::shuffle(names.begin(), names.end(), std::mt19937(7));
  Element element("Root");
  for (const std::string round : {"first ", "second "})
    for (const auto& name : names) element.SetAttribute(KString::FromUtf8(name), KString::FromUtf8(round + name));
  for (int twice = 0; twice < 2; ++twice) element.RemoveAttribute(KString::FromUtf8(names[5]));
  names.erase(names.begin() + 5);
  std::sort(names.begin(), names.end());  // byte order of UTF-8 is code-unit order here
  ASSERT_EQ(element.Attributes().Count(), static_cast<int32_t>(names.size()));
  for (size_t i = 0; i < names.size(); ++i) {
    EXPECT_EQ(element.Attributes()[static_cast<int32_t>(i)].name.ToUtf8(), names[i]);
    EXPECT_EQ(element.GetAttribute(KString::FromUtf8(names[i])).ToUtf8(), "second " + names[i]);
  }
}

TEST(Element, AnIteratorRefusesUseBeforeStartAndThenWalksTheMatchingChildren) {
  Element::Iterator iterator;
  EXPECT_EQ(KFailureOf([&] { iterator.Next(); }), "XML item iterator has not been initialized.");
  Element root("Root");
  root.AddChild("Controllers");
  Element& controller = root.AddChild("Controller");
  iterator.Start(root, "Controller");
  EXPECT_EQ(iterator.Next(), &controller);
  EXPECT_EQ(iterator.Next(), nullptr);
}
