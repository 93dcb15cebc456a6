#include "ui/platform/KWGLDispatch.h"

#include <windows.h>

#include <cstdint>
#include <mutex>

#include "ui/platform/KWin32Module.h"

// The loader's own entry and the thread-local slots it fills.
extern "C" BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID reserved);
extern "C" uint32_t gl_tls_index, wgl_tls_index;

void KPrepareWGLDispatch() noexcept {
  static std::once_flag process;
  std::call_once(process, [] {
    // In a program nobody calls the entry: its slots do not exist yet.
    if (KThisModule() == ::GetModuleHandleW(nullptr)) DllMain(KThisModule(), DLL_PROCESS_ATTACH, nullptr);
  });
  thread_local bool ready = false;
  if (ready) return;
  if (!::TlsGetValue(gl_tls_index) || !::TlsGetValue(wgl_tls_index)) DllMain(KThisModule(), DLL_THREAD_ATTACH, nullptr);
  ready = true;
}
