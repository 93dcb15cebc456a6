#pragma once

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "kernel/KString.h"

// Runs the body of a method a host called so that nothing escapes into the host: a KException
// gives the neutral answer silently (its message, if any, has reached the user already);
// anything else is traced as "SYSTEM EXCEPTION! <operation>" ("KAudioPluginVST3Adapter::process")
// and gives the neutral answer too. The operation is a literal or a KString, as for KGuard.
template <class Operation, class Result, class Body>
Result KHostGuarded(const Operation& operation, Result neutral, Body&& body) noexcept {
  try {
    return body();
  } catch (const KException&) {
  } catch (...) {
    KReportSystemException(operation);
  }
  return neutral;
}
