#include "kernel/KFileStore.h"

#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/platform/KPlatform.h"

std::string KFileStore::ReadText(const std::string& path) {
  std::optional<std::string> text = KPlatform::ReadFile(path);
  if (!text) throw KException(KFormatText("The file '{0}' does not exist.", KString::FromUtf8(path)));
  return std::move(*text);
}

std::optional<std::string> KFileStore::ReadTextIfExists(const std::string& path) { return KPlatform::ReadFile(path); }

void KFileStore::WriteTextAtomically(const std::string& path, std::string_view text) { KPlatform::WriteFileAtomically(path, text); }
