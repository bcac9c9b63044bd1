#ifndef SSOCLIENT_VERIFY_H
#define SSOCLIENT_VERIFY_H

// Invariant checks of the library. A failure ends the process through the core layer, naming the
// expression as the sources have always spelled it, so that crash reports stay comparable.

#include "tamber/Panic.h"

// Verifies that `pointer` is not null; the failure names "<pointer> != __null".
#define SSOCLIENT_VERIFY_NOT_NULL(pointer) TAMBER_VERIFY_TEXT((pointer) != nullptr, #pointer " != __null")

#endif
