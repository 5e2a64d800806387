// The process environment and the console, for tools and client programs.
//
// Environment variables as GetEnvironmentVariableW / SetEnvironmentVariableW give them (UTF-16
// names and values), and whether a standard stream is an interactive console (a terminal here),
// so that a tool can decide to show progress.
//
//   Platform::SetEnvironmentVariableW(u"OWUTILS_STATE_DIR", u"/tmp/sandbox/state");
//   if (Platform::IsConsoleStream(STD_ERROR_HANDLE)) ShowProgress();
#pragma once

#include "owutils/Export.h"
#include "owutils/WinTypes.h"

#if !defined(_WIN32)
#define STD_INPUT_HANDLE (static_cast<DWORD>(-10))
#define STD_OUTPUT_HANDLE (static_cast<DWORD>(-11))
#define STD_ERROR_HANDLE (static_cast<DWORD>(-12))
#endif

namespace Platform {

// Copies variable `name` with its terminator into `buffer` and returns its length without the
// terminator; when `size` is too small, returns the size needed including the terminator and
// copies nothing. A missing variable gives 0 with ERROR_ENVVAR_NOT_FOUND.
OWUTILS_API DWORD GetEnvironmentVariableW(const char16_t* name, char16_t* buffer, DWORD size) noexcept;

// Sets variable `name` to `value` for this process; a null value removes it. FALSE with
// ERROR_INVALID_PARAMETER for an empty name or one holding '='.
OWUTILS_API BOOL SetEnvironmentVariableW(const char16_t* name, const char16_t* value) noexcept;

// Whether standard stream `which` (STD_INPUT_HANDLE, STD_OUTPUT_HANDLE, STD_ERROR_HANDLE) is
// an interactive console.
OWUTILS_API BOOL IsConsoleStream(DWORD which) noexcept;

}  // namespace Platform
