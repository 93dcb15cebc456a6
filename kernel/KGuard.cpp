#include "kernel/KGuard.h"

#include "kernel/KFormat.h"
#include "kernel/KTrace.h"

void KReportSystemException(const KString& operation) noexcept {
  try {
    KTrace(KFormatText("SYSTEM EXCEPTION! {0}", operation));
  } catch (...) {
    // Formatting failed for want of memory; the operation name alone still says where.
    KTrace(operation);
  }
}

void KReportSystemException(const char* operation) noexcept { KReportSystemException(KString::Static(operation)); }
