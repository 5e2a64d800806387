// Platform service: the running process: module files, command line, current directory,
// temporary files.
//
// Paths handed out here are in the library's Windows form, mapped back from native paths through
// platform/PathMap.h (the drive map and the UNC root). Buffer-filling functions follow Win32:
// they return the length written without terminator, or (where said) the size needed including
// the terminator when the buffer is too small. Each function checks the fault-injection switch
// (platform/FaultInjection.h) under the name in its comment.
#pragma once

#include "owutils/WinTypes.h"

namespace Platform {

// --- Modules ----------------------------------------------------------------------------------

// GetModuleFileNameW ("GetModuleFileName"): the full path of the file `module` was loaded from
// (a module handle as platform/Modules.h hands out; null for the main program). A buffer too
// small receives the truncated, terminated path; the result is then `size` and the last error
// ERROR_INSUFFICIENT_BUFFER (122). 0 on failure.
DWORD GetModuleFileNameW(HMODULE module, char16_t* buffer, DWORD size) noexcept;

// The module that contains `address` (GetModuleHandleExW with
// GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS): given the address of one of the library's own
// functions, the library itself, not the program that loaded it. With `addReference` false the
// module's reference count is left unchanged (GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT).
// Null with ERROR_MOD_NOT_FOUND when no module holds the address.
HMODULE GetModuleHandleFromAddress(const void* address, bool addReference) noexcept;

// --- Command line -----------------------------------------------------------------------------

// GetCommandLineW: the process command line, built once from the process's arguments and quoted
// so that CommandLineToArgvW gives them back unchanged. Valid for the life of the process.
const char16_t* GetCommandLineW() noexcept;

// CommandLineToArgvW ("CommandLineToArgv"): splits a command line by the Windows rules (blanks
// separate; double quotes group; 2n backslashes before a quote give n backslashes and the quote
// delimits, 2n+1 give n and a literal quote; other backslashes are literal; the program name,
// the first argument, ends at the first blank outside quotes and takes backslashes literally).
// An empty line gives the program's file name alone. The array and its strings are one block,
// released with LocalFree. Null (last error set) on failure.
char16_t** CommandLineToArgvW(const char16_t* commandLine, int* count) noexcept;

// LocalFree: releases a block handed out by this layer (CommandLineToArgvW). Returns null.
void* LocalFree(void* block) noexcept;

// --- Current directory ------------------------------------------------------------------------

// GetCurrentDirectoryW ("GetCurrentDirectory"): the process's current directory; when `size`
// is too small, the size needed including the terminator.
DWORD GetCurrentDirectoryW(DWORD size, char16_t* buffer) noexcept;

// SetCurrentDirectoryW ("SetCurrentDirectory"): process-wide; fails with 2 or 3 for a missing
// directory, ERROR_DIRECTORY (267) for a file.
BOOL SetCurrentDirectoryW(const char16_t* path) noexcept;

// --- Temporary files --------------------------------------------------------------------------

// GetTempPathW ("GetTempPath"): the temporary directory (TMPDIR, else /tmp), with a trailing
// backslash; when `size` is too small, the size needed including the terminator.
DWORD GetTempPathW(DWORD size, char16_t* buffer) noexcept;

// GetTempFileNameW ("GetTempFileName"): "<directory>\<up to three characters of prefix><hex>.TMP"
// into `buffer` (MAX_PATH units). With `unique` 0 a number is picked and the empty file is
// created atomically (exclusive create, owner-only access), so nobody else can take the name;
// otherwise the name is only formed from `unique`. Returns the number used, 0 on failure
// (ERROR_BUFFER_OVERFLOW, 111, when the name does not fit; ERROR_FILE_EXISTS when every number
// is taken; the creation's error otherwise).
UINT GetTempFileNameW(const char16_t* directory, const char16_t* prefix, UINT unique, char16_t* buffer) noexcept;

}  // namespace Platform
