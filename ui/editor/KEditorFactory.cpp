#include "ui/editor/KEditorFactory.h"

#include <atomic>

namespace {
std::atomic<KEditorMaker> gMaker{nullptr};
}  // namespace

void KSetEditorMaker(KEditorMaker maker) noexcept { gMaker.store(maker, std::memory_order_release); }

std::unique_ptr<KEditor> KMakeEditor(KAudioPlugin& plugin, KEditorHost* host, KStyle style) {
  if (const KEditorMaker maker = gMaker.load(std::memory_order_acquire)) return maker(plugin, host, std::move(style));
  return std::make_unique<KEditor>(plugin, plugin.Identifier(), KEditorDescription{}, host, std::move(style));
}
