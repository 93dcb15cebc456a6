#pragma once

#include "hosts/aax/KAAXBase.h"
#include "kernel/KExport.h"

struct KTransport;

// The plug-in's transport snapshot from the host's transport (null: unknown): each query that
// succeeds raises its validity, positions come in ticks and become quarter notes, and the rules
// every host format shares (KAcceptTransport) decide what counts. A host transport that throws is the caller's to catch.
TORVANE_API void GetPlaybackInfo(const KAAX::ITransport* transport, bool offline, KTransport& snapshot);
