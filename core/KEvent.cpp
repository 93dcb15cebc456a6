#include "core/KEvent.h"

// One critical section for the pending queues of all events: it is held only to append or take
// one argument, so sharing it costs nothing worth a lock per event.
std::mutex KEventBase::pendingLock_;

// Out of line so that the vtable is emitted once.
KEventBase::~KEventBase() = default;
