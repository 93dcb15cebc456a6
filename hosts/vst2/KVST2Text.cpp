#include "hosts/vst2/KVST2Text.h"

#include <algorithm>
#include <cstring>
#include <string>

namespace KVST2 {

void KCopyText(const KString& text, char* out, int32_t room) {
  if (!out || room < 1) return;
  const std::string utf8 = text.ToUtf8();
  size_t length = std::min(utf8.size(), static_cast<size_t>(room - 1));
  // Never end inside a character: step back over continuation bytes.
  if (length < utf8.size())
    while (length > 0 && (static_cast<unsigned char>(utf8[length]) & 0xC0) == 0x80) --length;
  std::memcpy(out, utf8.data(), length);
  out[length] = 0;
}

}  // namespace KVST2
