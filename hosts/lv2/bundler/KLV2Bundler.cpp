// Lays out one LV2 bundle per plug-in of the kernel's catalogue, from the plug-ins themselves:
//   <dir>/<Name>.lv2/manifest.ttl    the plug-in's URI and binary, and its factory presets' URIs
//   <dir>/<Name>.lv2/<Name>.ttl      its ports, ranges, units and features
//   <dir>/<Name>.lv2/presets.ttl     its factory presets' port values (and state where needed)
//   <dir>/<Name>.lv2/<Name>.so       the loader, named after the bundle (no plug-in code)
//   <dir>/<Name>.lv2/libtorvane.so   a copy of the kernel
//   <dir>/<Name>.lv2/<font>          a copy of each font file, for the UI
// and lists the bundle names in <list> (outside <dir>: hosts take every entry there for a bundle).
//
//   torvane_lv2_bundler <kernel library> <loader> <dir> <list> [<font>...]

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/lv2/bundler/KLV2Turtle.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace fs = std::filesystem;

namespace {
// Rewrites a file only when its text changes, so that an open bundle is not touched without need.
void WriteIfChanged(const fs::path& path, const std::string& text) {
  std::error_code missing;
  if (fs::file_size(path, missing) == text.size() && !missing) {
    std::string present(text.size(), '\0');
    std::ifstream(path, std::ios::binary).read(present.data(), static_cast<std::streamsize>(present.size()));
    if (present == text) return;
  }
  std::ofstream(path, std::ios::binary | std::ios::trunc) << text;
}

void CopyIfChanged(const fs::path& from, const fs::path& to) {
  if (fs::exists(to) && fs::file_size(to) == fs::file_size(from) && fs::last_write_time(to) >= fs::last_write_time(from)) return;
  fs::copy_file(from, to, fs::copy_options::overwrite_existing);
}
}  // namespace

int main(int argc, char** argv) {
  if (argc < 5) {
    std::fprintf(stderr, "usage: %s <kernel library> <loader> <dir> <list> [<font>...]\n", argv[0]);
    return 2;
  }
  const fs::path kernel = argv[1], loader = argv[2], dir = argv[3], names = argv[4];
  try {
    std::ofstream list(names.string() + ".new");
    for (const KPluginDescription& entry : KProductCatalogue().plugins) {
      const std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(entry.key, "");
      if (!plugin || !plugin->SetChannelsPerBus(KAudioPlugin::kChannelCounts[0])) {
        std::fprintf(stderr, "Torvane LV2 bundles: %s cannot be made in stereo\n", entry.key);
        return 1;
      }
      const std::string name = KPluginIds::BundleName(entry.key), uri = KPluginIds::LV2URI(entry.identity);
      const fs::path bundle = dir / (name + ".lv2");
      fs::create_directories(bundle);
      WriteIfChanged(bundle / "manifest.ttl", KLV2::KManifestTurtle(*plugin, uri, name));
      WriteIfChanged(bundle / (name + ".ttl"), KLV2::KPluginTurtle(*plugin, uri, entry.name));
      WriteIfChanged(bundle / KLV2::kPresetsFile, KLV2::KPresetsTurtle(*plugin, uri));  // last: it changes the plug-in's values
      CopyIfChanged(loader, bundle / (name + ".so"));
      CopyIfChanged(kernel, bundle / kernel.filename());
      for (int font = 5; font < argc; ++font) CopyIfChanged(argv[font], bundle / fs::path(argv[font]).filename());
      list << name << "\n";
    }
    list.close();
    fs::rename(names.string() + ".new", names);
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "Torvane LV2 bundles: %s\n", failure.what());
    return 1;
  } catch (...) {
    std::fprintf(stderr, "Torvane LV2 bundles: a plug-in could not be described\n");
    return 1;
  }
  return 0;
}
