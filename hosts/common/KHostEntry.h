#pragma once

#include <memory>

#include "kernel/KException.h"
#include "kernel/KExport.h"

class KAudioPlugin;

// What every host format's exported creation entry shares (KVST3DispatchCreateInstance, and the
// VST 2 and AAX entries alike): the plug-in named by the loader's two narrow texts, and the guard
// that lets nothing cross the export.

// The plug-in named `pluginName` followed by `subName` (each byte one character), made through
// the registry; null when its factory makes none. KException for a name the registry does not
// know.
TORVANE_API std::unique_ptr<KAudioPlugin> KHostCreatePlugin(const char* pluginName, const char* subName);

// Shows "<caption>\n\nSYSTEM EXCEPTION! <entry>" to the user (the message box has no title of its
// own, so the caption leads the text).
TORVANE_API void KShowEntryFailure(const char* caption, const char* entry) noexcept;

// Runs an exported entry: a KException answers `neutral` silently (the user has been told what
// there was to tell); anything else is shown with the format's caption ("VST3 Plugin main") and
// the entry's name, and answers `neutral` too.
template <class Result, class Body>
Result KHostEntryGuarded(const char* caption, const char* entry, Result neutral, Body&& body) noexcept {
  try {
    return body();
  } catch (const KException&) {
  } catch (...) {
    KShowEntryFailure(caption, entry);
  }
  return neutral;
}

// The same for entries that make an object: null is the neutral answer.
template <class Result, class Body>
Result* KHostEntryGuarded(const char* caption, const char* entry, Body&& body) noexcept {
  return KHostEntryGuarded<Result*>(caption, entry, nullptr, body);
}
