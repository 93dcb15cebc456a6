#include "tools/KAudioType.h"

#include <sndfile.h>

#include <algorithm>
#include <cctype>

#include "tools/KCliArguments.h"

namespace {

struct Container {
  const char* name;
  const char* extensions;  // besides the name, " "-separated
  int format;
};
constexpr Container kContainers[] = {{"wav", "", SF_FORMAT_WAV},   {"flac", "", SF_FORMAT_FLAC}, {"aiff", "aif", SF_FORMAT_AIFF},
                                     {"caf", "", SF_FORMAT_CAF},   {"w64", "", SF_FORMAT_W64},   {"au", "snd", SF_FORMAT_AU},
                                     {"ogg", "oga", SF_FORMAT_OGG}};
constexpr const char* kContainerNames = "wav, flac, aiff, caf, w64, au or ogg";

constexpr std::pair<KSampleFormat, int> kEncodings[] = {{KSampleFormat::kInt16, SF_FORMAT_PCM_16},
                                                        {KSampleFormat::kInt24, SF_FORMAT_PCM_24},
                                                        {KSampleFormat::kInt32, SF_FORMAT_PCM_32},
                                                        {KSampleFormat::kFloat32, SF_FORMAT_FLOAT},
                                                        {KSampleFormat::kFloat64, SF_FORMAT_DOUBLE}};
constexpr const char* kFormatNames[] = {"", "s16", "s24", "s32", "f32", "f64"};

const char* NameOf(KSampleFormat format) { return kFormatNames[static_cast<int>(format)]; }

int EncodingOf(KSampleFormat format) {
  for (const auto& [sample, encoding] : kEncodings)
    if (sample == format) return encoding;
  return 0;
}

bool Holds(int container, KSampleFormat format) {
  if (container == SF_FORMAT_OGG) return false;
  if (container == SF_FORMAT_FLAC) return format == KSampleFormat::kInt16 || format == KSampleFormat::kInt24;
  return true;
}

}  // namespace

KSampleFormat KParseSampleFormat(const std::string& name) {
  for (const auto& [format, encoding] : kEncodings)
    if (name == NameOf(format)) return format;
  KCliFail("Unknown sample format '" + name + "': use s16, s24, s32, f32 or f64.");
}

KSampleFormat KSampleFormatOf(int fileFormat) {
  for (const auto& [format, encoding] : kEncodings)
    if ((fileFormat & SF_FORMAT_SUBMASK) == encoding) return format;
  return KSampleFormat::kDefault;
}

int KIntegerBits(KSampleFormat format) noexcept {
  switch (format) {
    case KSampleFormat::kInt16: return 16;
    case KSampleFormat::kInt24: return 24;
    case KSampleFormat::kInt32: return 32;
    default: return 0;
  }
}

int KFileFormat(const std::string& containerName, KSampleFormat format, KSampleFormat preferred) {
  const auto container = std::find_if(std::begin(kContainers), std::end(kContainers), [&](const Container& c) { return containerName == c.name; });
  if (container == std::end(kContainers)) KCliFail("Unknown audio type '" + containerName + "': use " + kContainerNames + ".");
  if (container->format == SF_FORMAT_OGG) {
    if (format != KSampleFormat::kDefault) KCliFail(std::string("Ogg Vorbis files hold no ") + NameOf(format) + " samples: leave out --format.");
    return SF_FORMAT_OGG | SF_FORMAT_VORBIS;
  }
  if (format == KSampleFormat::kDefault)
    format = Holds(container->format, preferred) && preferred != KSampleFormat::kDefault
                 ? preferred
                 : (container->format == SF_FORMAT_FLAC ? KSampleFormat::kInt24 : KSampleFormat::kFloat32);
  if (!Holds(container->format, format))
    KCliFail(std::string("FLAC files cannot hold ") + NameOf(format) + " samples: use --format s24 or s16.");
  return container->format | EncodingOf(format);
}

std::string KContainerOfPath(const std::string& path) {
  const size_t dot = path.find_last_of('.');
  const size_t slash = path.find_last_of('/');
  std::string extension = dot == std::string::npos || (slash != std::string::npos && dot < slash) ? "" : path.substr(dot + 1);
  std::transform(extension.begin(), extension.end(), extension.begin(), [](unsigned char c) { return std::tolower(c); });
  for (const Container& container : kContainers) {
    if (extension == container.name) return container.name;
    for (std::string_view others = container.extensions; !others.empty();) {
      const size_t space = std::min(others.find(' '), others.size());
      if (others.substr(0, space) == extension && !extension.empty()) return container.name;
      others.remove_prefix(std::min(space + 1, others.size()));
    }
  }
  KCliFail("Cannot tell the audio type of '" + path + "' from its name: use an extension or --type (" + kContainerNames + ").");
}
