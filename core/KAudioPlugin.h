#pragma once

#include "kernel/KString.h"

// The base of every plug-in of the catalogue.
class KAudioPlugin {
public:
  KAudioPlugin() = default;
  KAudioPlugin(const KAudioPlugin&) = delete;
  KAudioPlugin& operator=(const KAudioPlugin&) = delete;
  virtual ~KAudioPlugin();

  // The name under which the instance was created, exactly as the caller gave it.
  const KString& Identifier() const noexcept { return identifier_; }
  void SetIdentifier(const KString& identifier) { identifier_ = identifier; }

private:
  KString identifier_;
};
