// The exported utilities of the library: what a client program calls.
//
// The library frame: when the library is loaded it builds, in this order, the named-object
// table and its lock, then the default event logger (debugger output only), which it installs
// and registers as "LM_EVENT_HANDLER"; when it is unloaded it takes them down in the reverse
// order. Nothing may call into the library once unloading has begun.
//
// Exports of the library frame:
//   LmObjectAdd, LmObjectDel, LmObjectGet       named objects (owutils/NamedObjects.h)
// The event logger they hand out is declared in owutils/EventLogger.h.
#pragma once

#include "owutils/EventLogger.h"
#include "owutils/NamedObjects.h"
