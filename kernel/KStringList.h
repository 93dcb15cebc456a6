#pragma once

#include "kernel/KArray.h"
#include "kernel/KString.h"

// An ordered list of names, grown by the framework's array rule.
class KStringList : public KArray<KString> {
public:
  // Index of the first entry equal to `text`, or -1.
  int32_t IndexOf(const KString& text) const noexcept {
    for (int32_t i = 0; i < Count(); ++i)
      if ((*this)[i] == text) return i;
    return -1;
  }
};
