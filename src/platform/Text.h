// Platform service: text conversions.
//
// MultiByteToWideChar / WideCharToMultiByte for UTF-8 (code page 65001) with the Win32 rules:
// with MB_ERR_INVALID_CHARS an invalid byte sequence fails with ERROR_NO_UNICODE_TRANSLATION
// (1113), without it each bad byte becomes U+FFFD; with WC_ERR_INVALID_CHARS an unpaired
// surrogate fails with 1113, without it it becomes U+FFFD. A source length of -1 includes the
// terminating NUL. An output size of 0 asks for the needed size; a too-small output fails with
// ERROR_INSUFFICIENT_BUFFER. Other code pages fail with ERROR_INVALID_PARAMETER.
//
// LocaleToWide / WideToLocale convert through the C library's current multibyte locale, with the
// semantics of mbstowcs_s / wcstombs_s used with a count of _TRUNCATE.
#pragma once

#include <cstddef>

#include "owutils/WinTypes.h"

namespace Platform {

constexpr UINT kCodePageUtf8 = 65001;
constexpr DWORD kMbErrInvalidChars = 0x00000008;
constexpr DWORD kWcErrInvalidChars = 0x00000080;

int MultiByteToWideChar(UINT codePage, DWORD flags, const char* text, int length, char16_t* out,
                        int outSize) noexcept;
int WideCharToMultiByte(UINT codePage, DWORD flags, const char16_t* text, int length, char* out,
                        int outSize, const char* defaultChar, BOOL* usedDefault) noexcept;

// Converts NUL-terminated narrow `text` in the current locale. With `out` null, `*needed` is
// set to the units needed including the terminator. Returns 0 or an errno value (EILSEQ for
// text the locale cannot convert, ERANGE when `outSize` is too small).
int LocaleToWide(size_t* needed, char16_t* out, size_t outSize, const char* text);
// The reverse: bytes needed including the terminator, or an errno value.
int WideToLocale(size_t* needed, char* out, size_t outSize, const char16_t* text);

}  // namespace Platform
