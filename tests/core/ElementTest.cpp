#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "core/Element.h"
#include "kernel/KException.h"

namespace {

std::vector<std::string> AttributeNames(const Element& element) {
  std::vector<std::string> names;
  for (const auto& attribute : element.Attributes()) names.push_back(attribute.name.ToUtf8());
  return names;
}

KString Text(const std::string& utf8) { return KString::FromUtf8(utf8); }

}  // namespace

TEST(Element, AttributesStaySortedAndUniqueWhateverTheOrderOfSetting) {
  std::vector<std::string> names;
  for (int i = 0; i < 64; ++i) names.push_back("A" + std::to_string(i * 37 % 101));
  names.push_back("a");  // lower case sorts after every upper-case name
  names.push_back("Z\xC3\xA9");
  std::shuffle(names.begin(), names.end(), std::mt19937(7));

  Element element(Text("Root"));
  for (const auto& name : names) element.SetAttribute(Text(name), Text("first " + name));
  for (const auto& name : names) element.SetAttribute(Text(name), Text("second " + name));

  std::vector<std::string> sorted = names;
  std::sort(sorted.begin(), sorted.end());  // byte order of UTF-8 is code-unit order here
  EXPECT_EQ(AttributeNames(element), sorted);
  for (const auto& name : names) {
    ASSERT_TRUE(element.HasAttribute(Text(name))) << name;
    EXPECT_EQ(element.GetAttribute(Text(name)).ToUtf8(), "second " + name);
  }

  // Removal at both ends and in the middle; removing again or removing a missing name is a no-op.
  for (const auto& name : {sorted.back(), sorted.front(), sorted[sorted.size() / 2]}) {
    element.RemoveAttribute(Text(name));
    element.RemoveAttribute(Text(name));
    EXPECT_EQ(element.FindAttribute(Text(name)), nullptr);
    sorted.erase(std::find(sorted.begin(), sorted.end(), name));
  }
  element.RemoveAttribute("Missing");
  EXPECT_EQ(AttributeNames(element), sorted);
}

TEST(Element, GetAttributeAnswersTheFallbackOnlyWhenAbsent) {
  Element element(Text("E"));
  element.SetAttribute("Empty", KString());
  EXPECT_EQ(element.GetAttribute("Empty", "default").ToUtf8(), "");
  EXPECT_EQ(element.GetAttribute("Emptyx", "default").ToUtf8(), "default");  // longer and shorter names differ
  EXPECT_EQ(element.GetAttribute("Empt", "default").ToUtf8(), "default");
}

TEST(Element, FindOrAddChildReturnsTheFirstMatchAndKeepsReferencesValid) {
  Element root(Text("Root"));
  Element& first = root.FindOrAddChild("Section");
  first.SetAttribute("Index", "1");
  root.AddChild(KString("Section")).SetAttribute("Index", "2");
  for (int i = 0; i < 100; ++i) root.AddChild(Text("Other" + std::to_string(i)));  // regrows the array

  EXPECT_EQ(&root.FindOrAddChild("Section"), &first);
  EXPECT_EQ(first.GetAttribute("Index").ToUtf8(), "1");
  EXPECT_EQ(root.ChildCount(), 102);
  Element& added = root.FindOrAddChild("Late");
  EXPECT_EQ(&root.GetChild(102), &added);
  EXPECT_EQ(root.FindChild("Missing"), nullptr);
  const Element& constant = root;
  EXPECT_EQ(constant.FindChild("Other99"), &root.GetChild(101));
}

TEST(Element, IteratorWalksChildrenOptionallyByNameAndRefusesUseBeforeStart) {
  Element::Iterator iterator;
  try {
    iterator.Next();
    FAIL() << "an iterator that was never started must throw";
  } catch (const KException& e) {
    EXPECT_EQ(e.Message().ToUtf8(), "XML item iterator has not been initialized.");
  }

  Element root(Text("Root"));
  for (const char* name : {"Controller", "Other", "Controller", "Controllers"}) root.AddChild(Text(name));
  std::vector<const Element*> visited;
  iterator.Start(root, "Controller");
  while (Element* child = iterator.Next()) {
    visited.push_back(child);
    if (visited.size() == 1) root.AddChild(KString("Controller"));  // appended during the walk: visited too
  }
  EXPECT_EQ(visited, (std::vector<const Element*>{&root.GetChild(0), &root.GetChild(2), &root.GetChild(4)}));
  EXPECT_EQ(iterator.Next(), nullptr);  // stays at the end

  int all = 0;
  iterator.Start(root);  // restarting walks again, every child this time
  while (iterator.Next()) ++all;
  EXPECT_EQ(all, 5);

  Element empty(Text("Empty"));
  iterator.Start(empty);
  EXPECT_EQ(iterator.Next(), nullptr);
}

TEST(Element, EqualityIsDeepAndCopiesAreIndependent) {
  Element original(Text("Root"));
  original.SetAttribute("A", "1");
  original.SetText("text");
  Element& section = original.AddChild(KString("Section"));
  section.SetAttribute("B", "2");
  section.AddChild(KString("Leaf")).SetAttribute("C", "3");

  Element copy = original;
  EXPECT_TRUE(copy == original);
  copy.GetChild(0).GetChild(0).SetAttribute("C", "4");  // a difference two levels down
  EXPECT_FALSE(copy == original);
  EXPECT_EQ(original.GetChild(0).GetChild(0).GetAttribute("C").ToUtf8(), "3");

  copy = original;  // assignment replaces the whole subtree
  EXPECT_TRUE(copy == original);
  const auto differs = [&](auto change) {
    Element changed = original;
    change(changed);
    return !(changed == original) && !(original == changed);
  };
  EXPECT_TRUE(differs([](Element& e) { e.SetName("Other"); }));
  EXPECT_TRUE(differs([](Element& e) { e.SetText(KString()); }));
  EXPECT_TRUE(differs([](Element& e) { e.SetAttribute("A", "2"); }));
  EXPECT_TRUE(differs([](Element& e) { e.SetAttribute("Z", "1"); }));
  EXPECT_TRUE(differs([](Element& e) { e.AddChild(KString("Section")); }));
  EXPECT_TRUE(differs([](Element& e) { e.GetChild(0).SetText("x"); }));

  // Same children in another order are a different tree.
  Element ab(Text("R")), ba(Text("R"));
  for (const char* name : {"A", "B"}) ab.AddChild(Text(name));
  for (const char* name : {"B", "A"}) ba.AddChild(Text(name));
  EXPECT_FALSE(ab == ba);
}
