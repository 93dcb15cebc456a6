#include "kernel/KModule.h"

#include <memory>
#include <string_view>

#include "kernel/platform/KPlatform.h"

namespace {
// The plug-in's name as one folder name, the same on every system (user data may be copied
// between them). A name of dots alone would climb out of the family's folder.
std::string FolderName(const KString& name) {
  std::string folder = name.ToUtf8();
  for (char& c : folder) {
    const bool control = static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
    if (control || std::string_view("<>:\"/\\|?*").find(c) != std::string_view::npos) c = '_';
  }
  if (folder.find_first_not_of('.') == std::string::npos) folder = "_" + folder;
  return folder;
}
}  // namespace

std::string KModule::GetDataPath_User() const {
  const std::string folder = KPlatform::SubfolderPath(GetDataPath_Shared(), FolderName(name_));
  KPlatform::CreateFolders(folder);
  return folder;
}

std::string KModule::GetDataPath_Shared() {
  const std::string folder = KPlatform::SubfolderPath(KPlatform::UserDataHome(), "Torvane");
  KPlatform::CreateFolders(folder);
  return folder;
}

KModuleMap::~KModuleMap() {
  for (KModule* module : owned_) delete module;
}

KModuleMap& KModuleMap::Instance() {
  static KModuleMap map;
  return map;
}

KModule* KModuleMap::Acquire(const KString& name) {
  std::lock_guard<std::mutex> lock(mutex_);
  if (KModule* const* found = modules_.Find(name)) return *found;
  auto module = std::make_unique<KModule>(name);
  owned_.Append(module.get());
  // owned_ deletes the module from here on, so a failure to index it cannot leave a dangling
  // pointer in the index.
  KModule* made = module.release();
  modules_.Insert(name, made);
  return made;
}

KModule* KModuleMap::Find(const KString& name) const {
  std::lock_guard<std::mutex> lock(mutex_);
  KModule* const* found = modules_.Find(name);
  return found ? *found : nullptr;
}

int32_t KModuleMap::Count() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return modules_.Count();
}
