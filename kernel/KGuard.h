#pragma once

#include "kernel/KExport.h"
#include "kernel/KString.h"

// Writes "SYSTEM EXCEPTION! <operation>" to the trace sink.
TORVANE_API void KReportSystemException(const KString& operation) noexcept;

// Runs a method body so that nothing escapes it: any exception becomes a trace line naming the
// operation ("Class::Method") and the method then returns normally, with whatever its result
// variables hold.
template <class Body>
void KGuard(const KString& operation, Body&& body) noexcept {
  try {
    body();
  } catch (...) {
    KReportSystemException(operation);
  }
}
