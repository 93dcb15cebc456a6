#pragma once

#include <string>

#include "core/Element.h"
#include "kernel/KExport.h"
#include "kernel/KStringList.h"

class KModule;

// The presets of one plug-in, kept in "presets.xml" in its user data folder:
//   <Presets>
//     <Preset Name="Warm"><the plug-in's state tree/></Preset>
//   </Presets>
// and the configuration shared by the whole family, "KPluginConfiguration.xml" with the root
// "Configuration" in the family's shared folder. State trees are stored as given.
//
// Every change reads the file, changes the tree and replaces the whole file atomically, so the
// file on disk is always whole. Changes are not serialised between writers: when two stores
// change one file at the same time, the last to write wins and the other change is lost.
//
// A missing file holds no presets (or an empty configuration). A file that cannot be read as
// settings is reported, "Could not read the file '{0}'. " followed by the reader's message, and
// never overwritten: every change fails with that message until the user repairs or removes
// the file. The same holds for a file with another root ("The file '{0}' is not a presets
// file.", "... not a configuration file.").
//
// Children of the root other than "Preset" are kept as they are; of several presets with one
// name, the first counts.
class TORVANE_API KPresetStore {
public:
  // The files of `module`'s plug-in; creates its data folders (KException when it cannot).
  explicit KPresetStore(const KModule& module);

  const std::string& PresetsPath() const noexcept { return presetsPath_; }
  const std::string& ConfigurationPath() const noexcept { return configurationPath_; }

  // In file order.
  KStringList ListNames() const;
  // "There is no preset named '{0}'."; "The preset '{0}' holds no settings." for an entry
  // without a state tree.
  Element Load(const KString& name) const;
  // Replaces the preset of that name in its place, or appends a new one.
  // "A preset needs a name." for an empty name.
  void Store(const KString& name, const Element& state);
  // "There is no preset named '{0}'.", "A preset named '{0}' already exists.", "A preset
  // needs a name."
  void Rename(const KString& from, const KString& to);
  // "There is no preset named '{0}'."
  void Delete(const KString& name);

  // An empty "Configuration" root when the file is missing.
  Element LoadConfiguration() const;
  // Written with the root named "Configuration", whatever `configuration` is called.
  void StoreConfiguration(Element configuration);

private:
  Element ReadPresets() const;
  void WritePresets(const Element& presets) const;

  std::string presetsPath_;
  std::string configurationPath_;
};
