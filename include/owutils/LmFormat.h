// Small presentation services: a byte count as a short size text, a stored time as the user's
// local short date and time, the days of a month, and the text of a message code.
//
//   FormatSize(1536);                  // "2 KB"
//   FormatSize(5368709120);            // "5.00 GB"
//   FormatTime(1700000000);            // "11/14/2023 10:13:20 PM" for en_US in UTC
//   GetLastDayOfMonth(2, 2024);        // 29
//   CString text; GetErrorMessage(code, text);   // one line, line breaks removed
//
// None of them throws; each gives a neutral result (empty text) when the platform call it
// relies on fails.
#pragma once

#include <cstdint>

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

// "%.2f GB" above 0x3CCCCCCC bytes, "%.2f MB" above 0xF3333 bytes, else "%d KB" (whole KiB plus
// one for a positive size). Single-precision arithmetic; no thousands separators.
OWUTILS_API CString FormatSize(std::int64_t bytes);
// Seconds since 1970-01-01 UTC as the user's short date, one space and the time, in the local
// time zone and the user's formatting locale. Empty for 0 and for times the runtime cannot
// convert (before 1970 less its zone allowance, after the year 3000).
OWUTILS_API CString FormatTime(std::int64_t time);
// Days in `month` (1-12) of `year` by the Gregorian calendar; 30 for any other month value.
OWUTILS_API int GetLastDayOfMonth(int month, int year);
// The text of message `code` from the message-table module (then the system's texts), with every
// carriage return and line feed removed; empty when there is none.
OWUTILS_API void GetErrorMessage(DWORD code, CString& text);
