#pragma once

#include "kernel/KExport.h"
#include "kernel/KString.h"

// Writes "SYSTEM EXCEPTION! <operation>" to the trace sink.
TORVANE_API void KReportSystemException(const KString& operation) noexcept;
// The same for a name of static lifetime (a literal).
TORVANE_API void KReportSystemException(const char* operation) noexcept;

// Runs a method body so that nothing escapes it: any exception becomes a trace line naming the
// operation ("Class::Method") and the method then returns normally, with whatever its result
// variables hold. The operation is a literal or a KString; a literal becomes a string only when
// it is reported, so that a guarded call on the audio thread costs nothing while nothing throws.
template <class Operation, class Body>
void KGuard(const Operation& operation, Body&& body) noexcept {
  try {
    body();
  } catch (...) {
    KReportSystemException(operation);
  }
}
