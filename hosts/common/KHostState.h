#pragma once

#include <string>
#include <string_view>

#include "kernel/KExport.h"

class KAudioPlugin;

// The plug-in's state as every host format carries it: one UTF-8 XML text (a VST 2 chunk, a
// VST 3 state stream, an AAX chunk). User-interface thread.
class TORVANE_API KHostState {
public:
  // The whole state stored into a settings tree and written out as text. The text stays valid
  // until the next Store: formats that hand the host a pointer into it need nothing more.
  std::string_view Store(KAudioPlugin& plugin);
  // A whole text parsed first and then loaded; a KException from reading leaves the plug-in
  // exactly as it was (all or nothing).
  static void Load(KAudioPlugin& plugin, std::string_view text);

private:
  std::string text_;
};
