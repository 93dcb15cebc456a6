#pragma once

#include <cstdint>
#include <span>
#include <utility>

#include "core/Element.h"
#include "kernel/KArray.h"
#include "kernel/KString.h"

// One element of the state document seen by a section routine, in the direction its flag word
// gives (KAudioPlugin::kStore set: store, clear: load). Every value of every routine goes
// through one pattern, so that a document holds only what differs from the defaults and any
// document, older or newer, loads:
// - storing a value equal to its default writes nothing, and under KAudioPlugin::kRemoveDefaults
//   removes the attribute that an earlier store left in the element;
// - loading a missing attribute, or a text that is no value of its kind (a choice naming no
//   entry, a number that does not parse), restores the default.
class KStateSection {
public:
  using Pair = std::pair<int32_t, int32_t>;

  KStateSection(Element& element, uint32_t flags) noexcept : element_(element), flags_(flags) {}

  bool Storing() const noexcept;
  Element& GetElement() noexcept { return element_; }
  uint32_t Flags() const noexcept { return flags_; }

  // "1" / "0".
  void Flag(const KString& name, bool& value, bool fallback);
  void Integer(const KString& name, int32_t& value, int32_t fallback);
  void Unsigned(const KString& name, uint32_t& value, uint32_t fallback);
  // Through the formatter: at most six decimals, for settings a user types.
  void Number(const KString& name, double& value, double fallback);
  // The shortest text that reads back to the same double, so that values pass through a
  // document without rounding.
  void ExactNumber(const KString& name, double& value, double fallback);
  void Text(const KString& name, KString& value, const KString& fallback);
  // By display text: `value` indexes `texts`.
  void Choice(const KString& name, int32_t& value, int32_t fallback, std::span<const char* const> texts);
  // Whole numbers as "{0},{1}".
  void IntegerPair(const KString& name, Pair& value, const Pair& fallback);
  // Whole numbers as "{0};{1};..."; the default is the empty list.
  void IntegerList(const KString& name, KArray<int32_t>& value);

  // A child section of this one: the existing child; else, storing, a new child that is kept
  // only when the routine put something into it; else, loading, an empty element, so that all
  // its values take their defaults.
  template <class Routine>
  void Child(const KString& name, Routine&& routine) {
    if (Element* child = element_.FindChild(name)) {
      routine(*child, flags_);
      return;
    }
    Element fresh(name);
    routine(fresh, flags_);
    if (Storing() && !IsEmpty(fresh)) element_.AddChild(std::move(fresh));
  }

  // Outside a section routine: the attribute as a finite number, else `fallback` (absent, or
  // not a number as a whole).
  static double ReadNumber(const Element& element, const KString& name, double fallback);

  static bool IsEmpty(const Element& element) noexcept {
    return element.Attributes().IsEmpty() && element.ChildCount() == 0 && element.GetText().IsEmpty();
  }

private:
  // The pattern itself: `write` renders a value, `read` converts a text and answers false when
  // it names no value.
  template <class T, class Write, class Read>
  void Value(const KString& name, T& value, const T& fallback, Write&& write, Read&& read);

  Element& element_;
  uint32_t flags_;
};
