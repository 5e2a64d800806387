// Platform service: errors.
//
// The library speaks Win32 error codes everywhere (owutils/WinTypes.h). The platform layer keeps
// a per-thread last error, maps the native error numbers onto Win32 codes in one table, and
// gives each code a system text of its own.
#pragma once

#include <string>

#include "owutils/WinTypes.h"

namespace Platform {

// The calling thread's last error, as GetLastError / SetLastError.
DWORD GetLastError() noexcept;
void SetLastError(DWORD error) noexcept;

// Maps a native error number (errno on POSIX) to the Win32 code the Windows call would have
// failed with; unknown numbers give ERROR_GEN_FAILURE.
DWORD Win32ErrorFromErrno(int error) noexcept;
// Sets the last error from a native error number and returns the Win32 code.
DWORD SetLastErrorFromErrno(int error) noexcept;

// The system's message text for `code`, as FormatMessageW(FROM_SYSTEM | IGNORE_INSERTS) gives
// it: the text followed by "\r\n". `code` may be a Win32 error or an HRESULT; an HRESULT of
// the Win32 facility (0x8007xxxx) gives the text of its Win32 code. Returns false (and sets
// ERROR_MR_MID_NOT_FOUND) when the system has no text for the value.
bool GetSystemMessage(DWORD code, std::u16string& text);

// The C library's text for an errno value, as _wcserror_s gives it.
std::u16string ErrnoText(int error);

}  // namespace Platform
