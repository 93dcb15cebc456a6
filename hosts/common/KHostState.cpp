#include "hosts/common/KHostState.h"

#include "core/KAudioPlugin.h"

std::string_view KHostState::Store(KAudioPlugin& plugin) {
  text_ = plugin.WriteState();
  return text_;
}

void KHostState::Load(KAudioPlugin& plugin, std::string_view text) { plugin.ReadState(text); }
