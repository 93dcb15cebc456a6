#pragma once

#include <cstdint>
#include <memory>
#include <type_traits>

#include "kernel/KArray.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

class Element;

// One named text value of an element.
struct KXMLAttribute {
  KString name;
  KString value;

  bool operator==(const KXMLAttribute& other) const noexcept = default;
};

template <>
struct KIsRelocatable<KXMLAttribute> : std::true_type {};  // two strings, neither points into itself
template <>
struct KIsRelocatable<std::unique_ptr<Element>> : std::true_type {};  // a single owning pointer

// A node of the settings tree: a name, attributes kept sorted by name (each name once), an
// optional character-data text and an ordered list of owned children. Plug-in state, presets
// and configuration files are all held as such trees and carried as XML text.
//
// Children are held by pointer, so a reference to a child stays valid while siblings are added.
// Copying copies the whole subtree; equality compares whole subtrees.
class TORVANE_API Element {
public:
  using Attribute = KXMLAttribute;
  class Iterator;

  // The deepest nesting the text form carries (the root is level 1); the reader and the writer
  // both refuse more, so that a hostile document cannot exhaust the stack.
  static constexpr int32_t kMaxDepth = 256;

  explicit Element(KString name = {}) noexcept : name_(std::move(name)) {}
  Element(const Element& other);
  Element(Element&& other) noexcept = default;
  Element& operator=(const Element& other);
  Element& operator=(Element&& other) noexcept = default;
  ~Element();

  const KString& GetName() const noexcept { return name_; }
  void SetName(KString name) noexcept { name_ = std::move(name); }
  // Character data of the element; empty for the usual element that holds only attributes.
  const KString& GetText() const noexcept { return text_; }
  void SetText(KString text) noexcept { text_ = std::move(text); }

  // Replaces the value of an existing attribute, or inserts a new one at its sorted place.
  void SetAttribute(const KString& name, KString value);
  // Does nothing when the attribute is absent.
  void RemoveAttribute(const KString& name) noexcept;
  bool HasAttribute(const KString& name) const noexcept { return FindAttribute(name) != nullptr; }
  // The value, or null when the element has no such attribute.
  const KString* FindAttribute(const KString& name) const noexcept;
  // The value, or `fallback` when the element has no such attribute.
  KString GetAttribute(const KString& name, const KString& fallback = {}) const;
  // In sorted order.
  const KArray<Attribute>& Attributes() const noexcept { return attributes_; }

  // Appends a child and answers it.
  Element& AddChild(KString name);
  Element& AddChild(Element child);
  // The first child of that name, appended when there is none.
  Element& FindOrAddChild(const KString& name);
  // The first child of that name, or null.
  Element* FindChild(const KString& name) noexcept;
  const Element* FindChild(const KString& name) const noexcept;
  int32_t ChildCount() const noexcept { return children_.Count(); }
  Element& GetChild(int32_t index) noexcept { return *children_[index]; }
  const Element& GetChild(int32_t index) const noexcept { return *children_[index]; }

  // Deep comparison: name, text, attributes and children in order.
  bool operator==(const Element& other) const noexcept;

private:
  friend class KXMLReader;  // hands over a whole parsed attribute list, already sorted and unique

  // Index of the attribute with that name, or where it belongs; `found` tells which.
  int32_t SearchAttribute(const KString& name, bool& found) const noexcept;

  KString name_;
  KString text_;
  KArray<Attribute> attributes_;
  KArray<std::unique_ptr<Element>> children_;
};

// Walks the children of an element, optionally only those of one name:
//   Element::Iterator it;
//   it.Start(section, "Controller");
//   while (Element* controller = it.Next()) ...
// Children appended during the walk are visited too. Next on an iterator that was never
// started throws KException "XML item iterator has not been initialized.".
class TORVANE_API Element::Iterator {
public:
  void Start(Element& parent, KString name = {}) noexcept;
  // The next matching child, or null after the last.
  Element* Next();

private:
  Element* parent_ = nullptr;
  KString name_;
  int32_t index_ = 0;
};
