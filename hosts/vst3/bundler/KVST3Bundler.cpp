// Lays out one bundle per plug-in of the kernel's catalogue, in the layout that VST 3
// (<extension> ".vst3") and AAX (".aaxplugin") hosts alike look for:
//   <dir>/<Name><extension>/Contents/<arch>/<Name>.so       the loader, named after the bundle
//                                                           (<Name><extension> on Windows)
//   <dir>/<Name><extension>/Contents/<arch>/libtorvane.so   a copy of the kernel (torvane.dll)
//   <dir>/<Name><extension>/Contents/<arch>/<file>          a copy of each further file (the fonts)
// and lists the bundle names in <dir>/bundles.txt. Bundles of plug-ins the catalogue no longer
// holds are removed. A catalogue with faults lays out nothing: each fault is printed and the
// build fails.
//
//   torvane_vst3_bundler <kernel library> <loader> <dir> <extension> <arch> [<file>...]

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>
#include <string>

#include "hosts/common/KLayoutSteps.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace fs = std::filesystem;

// A bundle's binary: "<Name>.so" on Linux, named as the bundle itself on Windows.
std::string BinarySuffix([[maybe_unused]] const std::string& extension) {
#if defined(_WIN32)
  return extension;
#else
  return ".so";
#endif
}

int main(int argc, char** argv) {
  if (argc < 6) {
    std::fprintf(stderr, "usage: %s <kernel library> <loader> <dir> <extension> <arch> [<file>...]\n", argv[0]);
    return 2;
  }
  const fs::path kernel = argv[1], loader = argv[2], dir = argv[3];
  const std::string extension = argv[4], arch = argv[5];
  const KCatalogue& catalogue = KProductCatalogue();
  if (!KCatalogueIsSound(catalogue)) return 1;
  try {
    std::set<std::string> names;
    std::ofstream list(dir / "bundles.txt.new");
    for (const KPluginDescription& plugin : catalogue.plugins) {
      const std::string name = KPluginIds::BundleName(plugin.key);
      const fs::path binaries = dir / (name + extension) / "Contents" / arch;
      fs::create_directories(binaries);
      KCopyIfChanged(loader, binaries / (name + BinarySuffix(extension)));
      KCopyIfChanged(kernel, binaries / kernel.filename());
      for (int i = 6; i < argc; ++i) KCopyIfChanged(argv[i], binaries / fs::path(argv[i]).filename());
      names.insert(name);
      list << name << "\n";
    }
    // Only folders that hold a copy of the kernel are ours to remove.
    for (const fs::directory_entry& entry : fs::directory_iterator(dir)) {
      const fs::path bundle = entry.path();
      if (bundle.extension() == extension && !names.contains(bundle.stem().string()) &&
          fs::exists(bundle / "Contents" / arch / kernel.filename()))
        fs::remove_all(bundle);
    }
    list.close();
    fs::rename(dir / "bundles.txt.new", dir / "bundles.txt");
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "Torvane bundles: %s\n", failure.what());
    return 1;
  }
  return 0;
}
