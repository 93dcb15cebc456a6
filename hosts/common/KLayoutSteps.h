#pragma once
// What the build steps share that lay out the files hosts load (the VST 3 bundles, the VST 2
// modules) from the kernel's catalogue. Header only: the steps are programs of their own.

#include <cstdio>
#include <filesystem>

#include "kernel/KCatalogue.h"

// Copies only a changed file, so that a file a host has open is not rewritten without need.
inline void KCopyIfChanged(const std::filesystem::path& from, const std::filesystem::path& to) {
  namespace fs = std::filesystem;
  if (fs::exists(to) && fs::file_size(to) == fs::file_size(from) && fs::last_write_time(to) >= fs::last_write_time(from)) return;
  // Removed first: MinGW's standard library refuses to copy over an existing file.
  fs::remove(to);
  fs::copy_file(from, to);
}

// Prints each fault of the catalogue; true when it has none (a faulty one lays out nothing).
inline bool KCatalogueIsSound(const KCatalogue& catalogue) {
  const KStringList problems = KCatalogueProblems(catalogue);
  for (const KString& problem : problems) std::fprintf(stderr, "Torvane catalogue: %s\n", problem.ToUtf8().c_str());
  return problems.Count() == 0;
}
