// Lays out one VST 3 bundle per plug-in of the kernel's catalogue, in the Linux layout:
//   <dir>/<Name>.vst3/Contents/<arch>/<Name>.so       the loader, named after the bundle
//   <dir>/<Name>.vst3/Contents/<arch>/libtorvane.so   a copy of the kernel
//   <dir>/<Name>.vst3/Contents/<arch>/<file>          a copy of each further file (the fonts)
// and lists the bundle names in <dir>/bundles.txt. Bundles of plug-ins the catalogue no longer
// holds are removed. A catalogue with faults lays out nothing: each fault is printed and the
// build fails.
//
//   torvane_vst3_bundler <kernel library> <loader> <dir> <arch> [<file>...]

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>
#include <string>

#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"

namespace fs = std::filesystem;

namespace {
// Copies only a changed file, so that a host's open bundle is not rewritten without need.
void CopyIfChanged(const fs::path& from, const fs::path& to) {
  if (fs::exists(to) && fs::file_size(to) == fs::file_size(from) && fs::last_write_time(to) >= fs::last_write_time(from)) return;
  fs::copy_file(from, to, fs::copy_options::overwrite_existing);
}
}  // namespace

int main(int argc, char** argv) {
  if (argc < 5) {
    std::fprintf(stderr, "usage: %s <kernel library> <loader> <dir> <arch> [<file>...]\n", argv[0]);
    return 2;
  }
  const fs::path kernel = argv[1], loader = argv[2], dir = argv[3];
  const std::string arch = argv[4];
  const KCatalogue& catalogue = KProductCatalogue();
  const KStringList problems = KCatalogueProblems(catalogue);
  for (const KString& problem : problems) std::fprintf(stderr, "Torvane catalogue: %s\n", problem.ToUtf8().c_str());
  if (problems.Count() > 0) return 1;
  try {
    std::set<std::string> names;
    std::ofstream list(dir / "bundles.txt.new");
    for (const KPluginDescription& plugin : catalogue.plugins) {
      const std::string name = KPluginIds::BundleName(plugin.key);
      const fs::path binaries = dir / (name + ".vst3") / "Contents" / arch;
      fs::create_directories(binaries);
      CopyIfChanged(loader, binaries / (name + ".so"));
      CopyIfChanged(kernel, binaries / kernel.filename());
      for (int i = 5; i < argc; ++i) CopyIfChanged(argv[i], binaries / fs::path(argv[i]).filename());
      names.insert(name);
      list << name << "\n";
    }
    // Only folders that hold a copy of the kernel are ours to remove.
    for (const fs::directory_entry& entry : fs::directory_iterator(dir)) {
      const fs::path bundle = entry.path();
      if (bundle.extension() == ".vst3" && !names.contains(bundle.stem().string()) &&
          fs::exists(bundle / "Contents" / arch / kernel.filename()))
        fs::remove_all(bundle);
    }
    list.close();
    fs::rename(dir / "bundles.txt.new", dir / "bundles.txt");
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "Torvane VST 3 bundles: %s\n", failure.what());
    return 1;
  }
  return 0;
}
