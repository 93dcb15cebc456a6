#pragma once

// The OpenGL loader keeps a table of entry points per thread, which its DLL entry sets up for
// the threads it hears of. It hears of none when the kernel is linked into a program, and not of
// threads that existed before the kernel's DLL was loaded (a host's user-interface thread, say).
// Call before making a context current on the calling thread.
void KPrepareWGLDispatch() noexcept;
