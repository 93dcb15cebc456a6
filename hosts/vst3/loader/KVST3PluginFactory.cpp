#include "hosts/vst3/loader/KVST3PluginFactory.h"

#include <cstring>


namespace KVST3 {
namespace {
// An ASCII text into a fixed field, cut to fit and terminated; either character width.
template <class Char, size_t N>
void Copy(const char* text, Char (&field)[N]) noexcept {
  size_t i = 0;
  for (; text && text[i] != 0 && i + 1 < N; ++i) field[i] = static_cast<Char>(static_cast<unsigned char>(text[i]));
  for (; i < N; ++i) field[i] = 0;
}

// The fields every class-info record has.
template <class Info>
void FillBasic(Info& info, const KClassDescription& description) noexcept {
  std::memcpy(info.cid, description.classId, sizeof info.cid);
  info.cardinality = PClassInfo::kManyInstances;
  Copy(kAudioModuleClass, info.category);
  Copy(description.name, info.name);
}

// The fields the second and third forms add (one text width each).
template <class Info>
void FillExtended(Info& info, const KClassDescription& description) noexcept {
  FillBasic(info, description);
  info.classFlags = 0;  // processor and controller are one object: not distributable
  Copy(description.subCategories, info.subCategories);
  Copy(description.vendor, info.vendor);
  Copy(description.version, info.version);
  Copy(KPluginFactory::kSdkVersion, info.sdkVersion);
}
}  // namespace

bool KPluginFactory::Describe() noexcept {
  if (described_.load(std::memory_order_acquire)) return true;
  std::lock_guard<std::mutex> lock(describing_);
  if (!described_.load(std::memory_order_relaxed) && kernel_.Describe(description_)) described_.store(true, std::memory_order_release);
  return described_.load(std::memory_order_relaxed);
}

TResult KPluginFactory::QueryInterface(const char* iid, void** object) {
  if (!object) return kInvalidArgument;
  const bool known = FUnknown::kIID.Is(iid) || IPluginFactory::kIID.Is(iid) || IPluginFactory2::kIID.Is(iid) || IPluginFactory3::kIID.Is(iid);
  *object = known ? this : nullptr;
  if (!known) return kNoInterface;
  AddRef();
  return kResultOk;
}

uint32_t KPluginFactory::AddRef() { return references_.fetch_add(1) + 1; }

uint32_t KPluginFactory::Release() {
  const uint32_t left = references_.fetch_sub(1) - 1;
  if (left == 0) SetHostContext(nullptr);
  return left;
}

TResult KPluginFactory::GetFactoryInfo(PFactoryInfo* info) {
  if (!info) return kInvalidArgument;
  Copy(description_.vendor, info->vendor);
  Copy("", info->url);
  Copy("", info->email);
  info->flags = PFactoryInfo::kUnicode;
  return kResultOk;
}

int32_t KPluginFactory::CountClasses() { return 1; }

TResult KPluginFactory::GetClassInfo(int32_t index, PClassInfo* info) {
  if (index != 0 || !info) return kInvalidArgument;
  FillBasic(*info, description_);
  return kResultOk;
}

TResult KPluginFactory::GetClassInfo2(int32_t index, PClassInfo2* info) {
  if (index != 0 || !info) return kInvalidArgument;
  FillExtended(*info, description_);
  return kResultOk;
}

TResult KPluginFactory::GetClassInfoUnicode(int32_t index, PClassInfoW* info) {
  if (index != 0 || !info) return kInvalidArgument;
  FillExtended(*info, description_);
  return kResultOk;
}

TResult KPluginFactory::CreateInstance(FIDString classId, FIDString iid, void** object) {
  if (!object) return kInvalidArgument;
  *object = nullptr;
  if (!classId || std::memcmp(classId, description_.classId, sizeof description_.classId) != 0) return kNoInterface;
  FUnknown* instance = kernel_.Create(hostContext_, description_.key);
  if (!instance) return kResultFalse;
  const TResult result = instance->QueryInterface(iid, object);
  instance->Release();
  return result;
}

TResult KPluginFactory::SetHostContext(FUnknown* context) {
  if (context) context->AddRef();
  if (hostContext_) hostContext_->Release();
  hostContext_ = context;
  return kResultOk;
}

}  // namespace KVST3
