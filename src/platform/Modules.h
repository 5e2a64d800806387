// Platform service: modules and their resources.
//
// A module is a loaded shared object (the main program, the library itself, a resource module).
// String resources are looked up by id; the full loader (LoadLibraryW and friends, message
// tables) builds on this interface.
#pragma once

#include <string>

#include "owutils/WinTypes.h"

namespace Platform {

// With a null name: the module of the main program. Otherwise the already loaded module of that
// file name; null with ERROR_MOD_NOT_FOUND when there is none.
HMODULE GetModuleHandleW(const char16_t* name) noexcept;

// String resource `id` of `module`. With `bufferSize` 0, `buffer` receives a read-only pointer
// to the resource text (not NUL-terminated; write it through reinterpret_cast<char16_t**>) and
// the result is its length. Otherwise copies at most bufferSize-1 units and terminates them.
// Returns 0 with ERROR_RESOURCE_NAME_NOT_FOUND (or another code) when there is no such string.
int LoadStringW(HINSTANCE module, UINT id, char16_t* buffer, int bufferSize) noexcept;

// Message-table entry `id` of `module` (language `languageId`, 0 for the module's own): the
// template text with its %1-style inserts, as FormatMessageW(FROM_HMODULE) reads it. Returns false
// with ERROR_MR_MID_NOT_FOUND when the module has no such message (ERROR_INVALID_HANDLE for a
// null module).
bool FindMessageTemplate(HMODULE module, DWORD id, LANGID languageId, std::u16string& text);

}  // namespace Platform
