#pragma once

#include <cstdint>

#include "kernel/KString.h"

namespace KVST2 {

// Room for a parameter's name, unit and value text. The format's own limit of 8 characters
// cuts most names short; hosts of VST 2.4 give at least this much.
inline constexpr int32_t kParameterTextRoom = 32;

// `text` as UTF-8 into a host's buffer of `room` bytes, cut to fit between characters, always
// terminated.
void KCopyText(const KString& text, char* out, int32_t room);

}  // namespace KVST2
