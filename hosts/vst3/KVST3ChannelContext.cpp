#include "hosts/vst3/KVST3ChannelContext.h"

#include <string>

#include "hosts/vst3/KVST3Controller.h"
#include "hosts/vst3/KVST3Util.h"

namespace KVST3 {

namespace {
KString LocationName(int64_t code) {
  switch (code) {
    case ChannelContext::kPreVolumeFader: return "pre-fader";
    case ChannelContext::kPostVolumeFader: return "post-fader";
    case ChannelContext::kUsedAsPanner: return "panner";
    default: return KString::FromUtf8(std::to_string(code));
  }
}
}  // namespace

void KReadChannelContext(IAttributeList& list, KChannelContext& context) {
  using namespace ChannelContext;
  String128 text = {};
  int64_t number = 0;
  if (list.GetString(kChannelNameKey, text, sizeof(text)) == kResultTrue) context.name = KTextOf(text, 128);
  if (list.GetInt(kChannelColorKey, number) == kResultTrue) {
    context.color = static_cast<uint32_t>(number);
    context.hasColor = true;
  }
  if (list.GetString(kChannelPluginLocationKey, text, sizeof(text)) == kResultTrue) context.location = KTextOf(text, 128);
  else if (list.GetInt(kChannelPluginLocationKey, number) == kResultTrue) context.location = LocationName(number);
}

}  // namespace KVST3
