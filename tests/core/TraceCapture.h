#pragma once

#include <string>
#include <vector>

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
