#pragma once

#include <string>
#include <string_view>

#include "hosts/vst3/KVST3Base.h"
#include "kernel/KString.h"

// Helpers of the VST 3 adapter: texts in and out of the interface's fixed UTF-16 fields, and
// whole-stream reads and writes. The guard around every host-called method is the hosts' own
// (hosts/common/KHostGuard.h).
namespace KVST3 {

// `text` into a field of `capacity` units, cut to fit, always terminated.
void KCopyText(const KString& text, TChar* out, int32_t capacity) noexcept;
// A terminated UTF-16 text of at most `capacity` units.
KString KTextOf(const TChar* text, int32_t capacity);

// Every byte from the stream's present position to its end.
std::string KReadAll(IBStream& stream);
// The whole text in one write; false when the stream took less.
bool KWriteAll(IBStream& stream, std::string_view bytes);

// Takes a reference to `object` for as long as this holds it.
template <class Interface>
class KShared {
public:
  KShared() noexcept = default;
  KShared(const KShared&) = delete;
  KShared& operator=(const KShared&) = delete;
  ~KShared() { Reset(); }

  void Reset(Interface* object = nullptr) noexcept {
    if (object) object->AddRef();
    if (object_) object_->Release();
    object_ = object;
  }
  // `source`'s own Interface (a new reference), or nothing when it has none.
  template <class Source>
  void Query(Source* source) noexcept {
    Reset();
    void* found = nullptr;
    if (source && source->QueryInterface(Interface::kIID.bytes, &found) == kResultOk) object_ = static_cast<Interface*>(found);
  }
  Interface* Get() const noexcept { return object_; }
  Interface* operator->() const noexcept { return object_; }
  explicit operator bool() const noexcept { return object_ != nullptr; }

private:
  Interface* object_ = nullptr;
};

}  // namespace KVST3
