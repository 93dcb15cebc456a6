#pragma once

#include <atomic>
#include <mutex>

#include "kernel/KCatalogue.h"
#include "kernel/KExport.h"

struct KFileType {
  KString description;
  KString extension;
};
template <>
struct KIsRelocatable<KFileType> : std::true_type {};

// The main plug-in registry, the effect-module registry, the file types and the pipeline host
// names, built together from a catalogue on first use and read-only afterwards, so that
// lookups take no lock.
class TORVANE_API KRegistries {
public:
  // Module categories in the order the module registry lists them.
  static constexpr const char* kCategories[] = {"Dynamics",   "EQs & Filters", "Distortion", "Reverb & Delay",
                                                "Modulation", "Special",       "Stereo"};

  explicit KRegistries(const KCatalogue& catalogue) : catalogue_(catalogue) {}
  KRegistries(const KRegistries&) = delete;
  KRegistries& operator=(const KRegistries&) = delete;

  // The registries of the product's catalogue.
  static KRegistries& Instance();

  // Builds everything once, under the registry mutex; later calls return at once.
  void EnsureBuilt();

  const KPluginRegistry& Main() const noexcept { return main_; }
  const KPluginRegistry& Modules() const noexcept { return modules_; }
  const KArray<KFileType>& FileTypes() const noexcept { return fileTypes_; }
  const KStringList& PipelineHosts() const noexcept { return pipelineHosts_; }

private:
  void Build();

  const KCatalogue& catalogue_;
  std::mutex mutex_;
  std::atomic<bool> built_{false};
  KPluginRegistry main_;
  KPluginRegistry modules_;
  KArray<KFileType> fileTypes_;
  KStringList pipelineHosts_;
};
