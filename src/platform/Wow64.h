// Platform service: the WOW64 functions of the system library, looked up at run time.
//
// On Windows, IsWow64Process, Wow64DisableWow64FsRedirection and Wow64RevertWow64FsRedirection
// are looked up in "kernel32" (GetModuleHandleW, then GetProcAddress with the narrow name) and may
// be missing on older systems. On POSIX there is no file-system redirection: the lookups of the
// two redirection functions find nothing, and IsWow64Process is found only in a 32-bit build
// running on a 64-bit kernel, where it answers TRUE.
#pragma once

#include "owutils/WinTypes.h"

namespace Platform {

using IsWow64ProcessFunction = BOOL (*)(HANDLE process, BOOL* isWow64);
using Wow64DisableWow64FsRedirectionFunction = BOOL (*)(PVOID* oldValue);
using Wow64RevertWow64FsRedirectionFunction = BOOL (*)(PVOID oldValue);

// GetProcAddress(GetModuleHandleW(u"kernel32"), name): the function, or null when the system has
// none of that name.
void* FindKernelFunction(const char* name) noexcept;

// GetCurrentProcess: the pseudo handle of the calling process.
HANDLE GetCurrentProcess() noexcept;

// For tests: makes FindKernelFunction answer `function` for `name` (null: "missing") until
// ClearKernelFunctionOverrides. Process-wide; not for concurrent use with lookups.
void SetKernelFunctionOverride(const char* name, void* function);
void ClearKernelFunctionOverrides();

}  // namespace Platform
