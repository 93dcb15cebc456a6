#include "core/Element.h"

#include "kernel/KException.h"

Element::Element(const Element& other) : name_(other.name_), text_(other.text_), attributes_(other.attributes_) {
  children_.Reserve(other.children_.Count());
  for (const auto& child : other.children_) children_.Append(std::make_unique<Element>(*child));
}

Element& Element::operator=(const Element& other) {
  if (this != &other) {
    Element copy(other);
    *this = std::move(copy);
  }
  return *this;
}

// Out of line, where Element is complete, so that the children's deleter can see it.
Element::~Element() = default;

int32_t Element::SearchAttribute(const KString& name, bool& found) const noexcept {
  int32_t low = 0, high = attributes_.Count();
  while (low < high) {
    const int32_t middle = low + (high - low) / 2;
    const int order = attributes_[middle].name.Compare(name);
    if (order == 0) {
      found = true;
      return middle;
    }
    if (order < 0) low = middle + 1;
    else high = middle;
  }
  found = false;
  return low;
}

void Element::SetAttribute(const KString& name, KString value) {
  bool found;
  const int32_t at = SearchAttribute(name, found);
  if (found) attributes_[at].value = std::move(value);
  else attributes_.Insert(at, Attribute{name, std::move(value)});
}

void Element::RemoveAttribute(const KString& name) noexcept {
  bool found;
  const int32_t at = SearchAttribute(name, found);
  if (found) attributes_.RemoveAt(at);
}

const KString* Element::FindAttribute(const KString& name) const noexcept {
  bool found;
  const int32_t at = SearchAttribute(name, found);
  return found ? &attributes_[at].value : nullptr;
}

KString Element::GetAttribute(const KString& name, const KString& fallback) const {
  const KString* value = FindAttribute(name);
  return value ? *value : fallback;
}

Element& Element::AddChild(KString name) { return AddChild(Element(std::move(name))); }

Element& Element::AddChild(Element child) {
  return *children_.Append(std::make_unique<Element>(std::move(child)));
}

Element& Element::FindOrAddChild(const KString& name) {
  Element* child = FindChild(name);
  return child ? *child : AddChild(name);
}

Element* Element::FindChild(const KString& name) noexcept {
  for (auto& child : children_)
    if (child->name_ == name) return child.get();
  return nullptr;
}

const Element* Element::FindChild(const KString& name) const noexcept {
  return const_cast<Element*>(this)->FindChild(name);
}

bool Element::operator==(const Element& other) const noexcept {
  if (!(name_ == other.name_) || !(text_ == other.text_)) return false;
  if (attributes_.Count() != other.attributes_.Count() || children_.Count() != other.children_.Count()) return false;
  for (int32_t i = 0; i < attributes_.Count(); ++i)
    if (!(attributes_[i] == other.attributes_[i])) return false;
  for (int32_t i = 0; i < children_.Count(); ++i)
    if (!(*children_[i] == *other.children_[i])) return false;
  return true;
}

void Element::Iterator::Start(Element& parent, KString name) noexcept {
  parent_ = &parent;
  name_ = std::move(name);
  index_ = 0;
}

Element* Element::Iterator::Next() {
  if (!parent_) throw KException("XML item iterator has not been initialized.");
  while (index_ < parent_->children_.Count()) {
    Element* child = parent_->children_[index_++].get();
    if (name_.IsEmpty() || child->name_ == name_) return child;
  }
  return nullptr;
}
