#include "hosts/vst3/KVST3Util.h"

namespace KVST3 {

void KCopyText(const KString& text, TChar* out, int32_t capacity) noexcept {
  if (capacity <= 0) return;
  const int32_t length = text.Length() < capacity - 1 ? text.Length() : capacity - 1;
  if (length == text.Length()) {
    text.CopyUtf16(out);
  } else {
    for (int32_t i = 0; i < length; ++i) out[i] = text.CharAt(i);
  }
  out[length] = 0;
}

KString KTextOf(const TChar* text, int32_t capacity) {
  int32_t length = 0;
  while (text && length < capacity && text[length] != 0) ++length;
  return KString::FromUtf16(text, length);
}

std::string KReadAll(IBStream& stream) {
  std::string bytes;
  char buffer[4096];
  for (;;) {
    int32_t got = 0;
    if (stream.Read(buffer, static_cast<int32_t>(sizeof(buffer)), &got) != kResultOk || got <= 0) break;
    bytes.append(buffer, static_cast<size_t>(got));
  }
  return bytes;
}

bool KWriteAll(IBStream& stream, std::string_view bytes) {
  int32_t written = 0;
  const auto size = static_cast<int32_t>(bytes.size());
  return stream.Write(const_cast<char*>(bytes.data()), size, &written) == kResultOk && written == size;
}

}  // namespace KVST3
