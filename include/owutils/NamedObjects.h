// The named-object registry: a process-wide table from a name to an untyped pointer, through
// which the library and its client programs publish shared objects without linking to each
// other's globals.
//
// The library registers its default event logger as "LM_EVENT_HANDLER" when it is loaded; every
// part of the library that reports instead of throwing fetches the logger there, so a client
// that registers its own logger under that name takes the library's reports over:
//
//   LmObjectAdd(u"LM_EVENT_HANDLER", &myLogger);   // replaces the default logger
//   auto* logger = static_cast<LumoException::EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER"));
//
// Names are compared code unit by code unit, with regard to case. The table never owns, copies
// or destroys the objects: keeping a registered object alive while others may use it is the
// registering party's duty. All three calls may be made from any thread; they are serialised by
// one re-entrant lock.
#pragma once

#include "owutils/Export.h"

// Registers `object` (null allowed) under `name`, replacing what was registered there. False,
// and nothing registered, for a null or empty name.
OWUTILS_API bool LmObjectAdd(const char16_t* name, void* object);
// Removes `name`. False for a null or empty name and for a name that is not registered.
OWUTILS_API bool LmObjectDel(const char16_t* name);
// The pointer registered under `name`; null for a null, empty or unknown name.
OWUTILS_API void* LmObjectGet(const char16_t* name);
