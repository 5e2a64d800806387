// The printf-style engine behind Lumo::String::Format and CString::Format.
#pragma once

#include <cstdarg>
#include <cstddef>

namespace Lumo::detail {

// Formats `format` with `args` into out[0..capacity), truncating as needed and always
// terminating the text when capacity > 0. Returns the length the whole text has (which may be
// capacity or more, meaning it did not fit), or -1 for a format the engine refuses (an unknown
// conversion, %n, a width or precision beyond 100000).
//
// The conversions are those of the Windows runtime's wide printf: %s/%c take UTF-16, %hs/%hc and
// %S/%C narrow UTF-8; integer conversions take 32 bits, also with `l`; `I`, `z` and `t` are
// pointer-sized, `I64`, `ll` and `j` 64 bits; %p prints the pointer in upper-case hex padded to
// its full width. Numbers are produced by the C library's snprintf in the "C" numeric style.
int FormatUtf16(char16_t* out, size_t capacity, const char16_t* format, va_list args);

}  // namespace Lumo::detail
