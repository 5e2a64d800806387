// Platform service: message texts.
//
// FormatMessageW with the Win32 behaviour the library relies on. The template comes from a
// string (FORMAT_MESSAGE_FROM_STRING: `source` is the template), from a module's message table
// (FROM_HMODULE: `source` is the module; with FROM_SYSTEM as well, the system texts are the
// fallback) or from the system's texts (FROM_SYSTEM). In the template:
//   %1 .. %99       insert n, as a string ("%1" is "%1!s!")
//   %n!fmt!         insert n formatted with the printf format fmt ("%2!d!", "%1!08lX!",
//                   "%1!*.*s!" takes width and precision from inserts n and n+1 and the value
//                   from n+2); floating-point conversions are refused
//   %0              ends the text here, without a final line break
//   %n %r %t        line break ("\r\n"), carriage return, tab
//   %% %. %! %␠     the character itself; any other character after % stands for itself
// The inserts come from `args`, a va_list* of the caller's variable arguments, or with
// FORMAT_MESSAGE_ARGUMENT_ARRAY from an array of DWORD_PTR values passed in its place
// (reinterpret_cast<va_list*>(array)). With FORMAT_MESSAGE_IGNORE_INSERTS the inserts are
// copied as they stand. The low byte of `flags` (FORMAT_MESSAGE_MAX_WIDTH_MASK) is the maximum
// line width: 0 keeps the template's line breaks, 0xFF turns them into blanks (only %n breaks),
// other values break lines at blanks before that width.
// `buffer` receives the text and its terminator; `size` is its capacity in units (too small:
// ERROR_INSUFFICIENT_BUFFER). With FORMAT_MESSAGE_ALLOCATE_BUFFER `buffer` is a char16_t** that
// receives a new text of at least `size` units, released with LocalFree.
// Returns the text's length without terminator, or 0 with the last error: ERROR_MR_MID_NOT_FOUND
// (317) when there is no message `messageId`, ERROR_INVALID_PARAMETER (87) for a bad template or
// insert, ERROR_INSUFFICIENT_BUFFER (122).
//
// ExpandEnvironmentStringsW replaces each %NAME% of `source` by the variable's value (names
// without regard to case where the exact name is not set); unknown names stay as they are.
// Returns the units needed including the terminator; the text is written only when they fit.
#pragma once

#include <cstdarg>
#include <cstdint>
#include <string>

#include "owutils/WinTypes.h"

#if !defined(_WIN32)
#define FORMAT_MESSAGE_ALLOCATE_BUFFER 0x00000100
#define FORMAT_MESSAGE_IGNORE_INSERTS 0x00000200
#define FORMAT_MESSAGE_FROM_STRING 0x00000400
#define FORMAT_MESSAGE_FROM_HMODULE 0x00000800
#define FORMAT_MESSAGE_FROM_SYSTEM 0x00001000
#define FORMAT_MESSAGE_ARGUMENT_ARRAY 0x00002000
#define FORMAT_MESSAGE_MAX_WIDTH_MASK 0x000000FF
#endif

namespace Platform {

DWORD FormatMessageW(DWORD flags, const void* source, DWORD messageId, DWORD languageId, char16_t* buffer, DWORD size,
                     va_list* args);

// Releases a text FormatMessageW allocated (null is allowed). Returns null, as LocalFree does on
// success.
void* LocalFree(void* memory) noexcept;

DWORD ExpandEnvironmentStringsW(const char16_t* source, char16_t* destination, DWORD size);

// The local time `time` (seconds since 1970-01-01 UTC) as _wctime64_s writes it:
// "Wed Jan 02 02:03:55 1980\n", with English names whatever the locale. False for a negative
// time or one the system cannot convert.
bool CTimeText(std::int64_t time, std::u16string& text);

}  // namespace Platform
