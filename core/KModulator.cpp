#include "core/KModulator.h"

#include <atomic>

namespace {
std::atomic<KModulatorMaker> gMaker{nullptr};
}  // namespace

void KSetModulatorMaker(KModulatorMaker maker) noexcept { gMaker.store(maker, std::memory_order_release); }
KModulatorMaker KGetModulatorMaker() noexcept { return gMaker.load(std::memory_order_acquire); }
