#pragma once

#include <cstdint>
#include <vector>

#include "kernel/KString.h"
#include "ui/KMarkupAttributes.h"

// A named sequence of recorded tags that a single tag of that name stands for, so that the look
// of the semantic tags (control, value, reference, ...) is data:
//   <tagset name=warn><cred><b></tagset> ... <warn>careful</warn>
struct KMarkupTagSet {
  struct Tag {
    KString name;
    KMarkupAttributes attributes;
    bool closing;
  };
  KString name;
  std::vector<Tag> tags;
  bool playing = false;  // a set is not played again from inside itself
};
