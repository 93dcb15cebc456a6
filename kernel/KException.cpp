#include "kernel/KException.h"

// Out of line so that the class's type information lives in the kernel library once.
KException::~KException() = default;
