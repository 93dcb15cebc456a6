#pragma once

#include <string>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KTrace.h"

// Collects the trace sink's lines while it lives, for tests that run on one thread.
class KTraceCapture {
public:
  KTraceCapture() : previous_(KSetTraceHook(&Collect)) { Lines().clear(); }
  KTraceCapture(const KTraceCapture&) = delete;
  KTraceCapture& operator=(const KTraceCapture&) = delete;
  ~KTraceCapture() { KSetTraceHook(previous_); }

  static std::vector<std::string>& Lines() {
    static std::vector<std::string> lines;
    return lines;
  }

private:
  static void Collect(const KString& line) { Lines().push_back(line.ToUtf8()); }

  KTraceHook previous_;
};

// The message of the KException that `body` throws, or "(no failure)".
template <class Body>
std::string KFailureOf(Body&& body) {
  try {
    body();
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}
