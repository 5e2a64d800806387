// Platform service: modules and their resources.
//
// A module is a loaded shared object (the main program, the library itself, a resource module).
// Module file names and the module holding an address are in platform/Process.h.
// A module handle is the system loader's own handle, so handles from any part of the platform
// layer mix freely. A module loaded as a data file gets the loader's handle with its lowest bit
// set, as on Windows: it serves resources but no exports.
//
// Resources live in the table a resource module exports (owutils/ResourceModule.h): string
// resources by id (LoadStringW) and message-table entries by id (FindMessageTemplate).
//
// The process-wide current resource module is the module the client programs load their own
// resources from by default (the class library's AfxSetResourceHandle / AfxGetResourceHandle).
#pragma once

#include <string>

#include "owutils/WinTypes.h"

namespace Platform {

// The file-name suffix of a loadable module on this platform: u".so" here, u".dll" on Windows.
const char16_t* ModuleFileSuffix() noexcept;

// LoadLibraryW: loads the module at `path` (Windows path syntax; a name without a directory is
// searched for by the system loader) or adds a reference to it when it is already loaded.
// Returns null with the last error set: ERROR_MOD_NOT_FOUND (126) for a missing file,
// ERROR_BAD_EXE_FORMAT (193) for a file that is not a module, ERROR_INVALID_PARAMETER for a
// null or empty path.
HMODULE LoadLibraryW(const char16_t* path) noexcept;

constexpr DWORD kLoadLibraryAsDatafile = 0x00000002;            // LOAD_LIBRARY_AS_DATAFILE
constexpr DWORD kLoadLibraryAsImageResource = 0x00000020;       // LOAD_LIBRARY_AS_IMAGE_RESOURCE
constexpr DWORD kLoadLibraryAsDatafileExclusive = 0x00000040;   // LOAD_LIBRARY_AS_DATAFILE_EXCLUSIVE

// LoadLibraryExW: as LoadLibraryW; with one of the data-file flags the module is loaded for its
// resources only: the handle has its lowest bit set, GetProcAddress on it fails and
// LoadStringW / FindMessageTemplate work. `file` must be null (ERROR_INVALID_PARAMETER).
HMODULE LoadLibraryExW(const char16_t* path, HANDLE file, DWORD flags) noexcept;

// FreeLibrary: drops one reference; the module is unloaded with its last reference. A null
// handle, or one the loader does not know, fails with ERROR_INVALID_HANDLE. The main program
// is never unloaded.
BOOL FreeLibrary(HMODULE module) noexcept;

// GetProcAddress: the address of the exported function or data symbol `name` of `module`
// itself (not of the modules it depends on). Null with ERROR_PROC_NOT_FOUND (127) when the
// module does not export it; ERROR_INVALID_HANDLE for a null handle or a data-file handle.
void* GetProcAddress(HMODULE module, const char* name) noexcept;

// GetModuleHandleW: with a null name, the module of the main program. Otherwise the already
// loaded module whose file name (with or without directory) is `name`, without adding a
// reference; null with ERROR_MOD_NOT_FOUND when there is none.
HMODULE GetModuleHandleW(const char16_t* name) noexcept;

// LoadStringW: string resource `id` of `module` (a null module means the main program). With
// `bufferSize` 0, `buffer` receives a read-only pointer to the resource text (not
// NUL-terminated; write it through reinterpret_cast<char16_t**>) and the result is its length.
// Otherwise copies at most bufferSize-1 units, terminates them and returns the units copied.
// Returns 0 with ERROR_RESOURCE_NAME_NOT_FOUND (1814) when the module has no such string (an
// empty string counts as missing), ERROR_RESOURCE_DATA_NOT_FOUND (1812) when it has no resource
// table, ERROR_INVALID_PARAMETER for a null buffer or a negative size. With a buffer of at least
// one unit, a failure leaves it holding the empty string.
int LoadStringW(HINSTANCE module, UINT id, char16_t* buffer, int bufferSize) noexcept;

// Message-table entry `id` of `module` (language `languageId`, 0 for the module's own): the
// template text with its %1-style inserts, as FormatMessageW(FROM_HMODULE) reads it; each line
// of the message ends with "\r\n". Returns false with ERROR_MR_MID_NOT_FOUND (317) when the
// module has no such message, ERROR_RESOURCE_LANG_NOT_FOUND (1815) when its messages are in
// another language, ERROR_RESOURCE_DATA_NOT_FOUND when it has no resource table and
// ERROR_INVALID_HANDLE for a null module.
bool FindMessageTemplate(HMODULE module, DWORD id, LANGID languageId, std::u16string& text);

// The language of the module's resources (0 without a resource table).
LANGID GetModuleResourceLanguage(HMODULE module) noexcept;

// The current resource module: the one set last, or the main program when none was set.
// Process-wide; set without a lock (client programs set it during start-up).
HINSTANCE GetResourceHandle() noexcept;
void SetResourceHandle(HINSTANCE module) noexcept;

}  // namespace Platform
