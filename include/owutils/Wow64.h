// Wow64: whether the process runs under WOW64 (a 32-bit process on a 64-bit system), and the
// per-thread switch of WOW64 file-system redirection.
//
// The system functions behind these are looked up at run time; where one is missing the
// operation does nothing and gives the neutral answer (false, oldValue untouched). Disable and
// revert on the same thread, with the value Disable gave, in a guarded scope:
//
//   PVOID old = nullptr;
//   Wow64::DisableWow64FsRedirection(&old);
//   ... // access the native system directory
//   Wow64::RevertWow64FsRedirection(&old);
//
// A failing system call raises Wow64Exception ("Wow64::IsWow64 failure"...) whose cause is the
// LumoException::Win32Error naming the system function.
#pragma once

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Wow64 {

OWUTILS_API bool IsWow64();
OWUTILS_API void DisableWow64FsRedirection(PVOID* oldValue);
OWUTILS_API void RevertWow64FsRedirection(PVOID* oldValue);

}  // namespace Wow64
