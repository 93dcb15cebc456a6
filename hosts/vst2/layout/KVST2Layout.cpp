// Lays out one Linux VST 2 module per plug-in of the kernel's catalogue, all in one folder:
//   <dir>/<Name>.so        a copy of the loader, named after the plug-in (KPluginIds::BundleName)
//   <dir>/<kernel name>    a copy of the kernel, which every module of the folder loads
// and lists the module names in <dir>/modules.txt. Modules the previous list named that the
// catalogue no longer holds are removed. A catalogue with faults lays out nothing: each fault is
// printed and the build fails.
//
//   torvane_vst2_layout <kernel library> <loader> <dir> <kernel name>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>
#include <string>

#include "hosts/common/KLayoutSteps.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace fs = std::filesystem;

int main(int argc, char** argv) {
  if (argc != 5) {
    std::fprintf(stderr, "usage: %s <kernel library> <loader> <dir> <kernel name>\n", argv[0]);
    return 2;
  }
  const fs::path kernel = argv[1], loader = argv[2], dir = argv[3];
  const KCatalogue& catalogue = KProductCatalogue();
  if (!KCatalogueIsSound(catalogue)) return 1;
  try {
    fs::create_directories(dir);
    std::set<std::string> names;
    std::ofstream list(dir / "modules.txt.new");
    for (const KPluginDescription& plugin : catalogue.plugins) {
      const std::string name = KPluginIds::BundleName(plugin.key);
      KCopyIfChanged(loader, dir / (name + loader.extension().string()));
      names.insert(name);
      list << name << "\n";
    }
    KCopyIfChanged(kernel, dir / argv[4]);
    {
      // Closed before the rename: Windows replaces no file that is open.
      std::ifstream previous(dir / "modules.txt");
      for (std::string name; std::getline(previous, name);)
        if (!names.contains(name)) fs::remove(dir / (name + loader.extension().string()));
    }
    list.close();
    fs::rename(dir / "modules.txt.new", dir / "modules.txt");
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "Torvane VST 2 modules: %s\n", failure.what());
    return 1;
  }
  return 0;
}
