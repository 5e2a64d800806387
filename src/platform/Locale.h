// Platform service: languages, locales and local time.
//
// On POSIX the user's languages come from the locale environment variables, read afresh on
// every call, and never from the process's global C locale, which stays untouched:
//   user-interface language   LC_ALL, then LC_MESSAGES, then LANG
//   formatting locale         LC_ALL, then LC_TIME, then LANG
// The first variable that is set and not empty decides; "C", "POSIX" and names the platform
// layer does not know give English (United States), 0x409. A name such as "de_DE.UTF-8" gives
// its Windows identifier (0x407); a known language with an unknown country gives the
// language's main identifier ("de_LU" gives 0x407).
//
// Dates and times are formatted from the platform layer's own table of the Windows short date
// and time pictures of each known locale, so the result depends neither on the C-library
// locales a machine has compiled nor on the global locale.
#pragma once

#include <cstdint>

#include "owutils/WinTypes.h"

namespace Platform {

constexpr LCID kLocaleUserDefault = 0x0400;    // LOCALE_USER_DEFAULT
constexpr LCID kLocaleSystemDefault = 0x0800;  // LOCALE_SYSTEM_DEFAULT
constexpr LCID kLocaleInvariant = 0x007F;      // LOCALE_INVARIANT
constexpr DWORD kLcidInstalled = 1;            // LCID_INSTALLED
constexpr DWORD kLcidSupported = 2;            // LCID_SUPPORTED

constexpr DWORD kDateShortDate = 0x1;          // DATE_SHORTDATE
constexpr DWORD kTimeNoMinutesOrSeconds = 0x1; // TIME_NOMINUTESORSECONDS
constexpr DWORD kTimeNoSeconds = 0x2;          // TIME_NOSECONDS
constexpr DWORD kTimeNoTimeMarker = 0x4;       // TIME_NOTIMEMARKER
constexpr DWORD kTimeForce24HourFormat = 0x8;  // TIME_FORCE24HOURFORMAT

// GetUserDefaultUILanguage: the user-interface language (see above).
LANGID GetUserDefaultUILanguage() noexcept;
// GetUserDefaultLCID: the formatting locale (see above).
LCID GetUserDefaultLCID() noexcept;
// The Windows identifier of a POSIX locale name ("pt_BR.UTF-8" gives 0x416); 0 when the name is
// empty, "C", "POSIX" or unknown.
LCID LocaleIdFromName(const char* name) noexcept;

// IsValidLocale: whether `locale` is one the platform layer knows; with LCID_INSTALLED as well
// as with LCID_SUPPORTED every known locale counts, whatever the C library has installed.
// Other flags give FALSE.
BOOL IsValidLocale(LCID locale, DWORD flags) noexcept;

// GetDateFormatW: `date` as text of `locale` (LOCALE_USER_DEFAULT and LOCALE_SYSTEM_DEFAULT
// mean the formatting locale). With `format` null, the locale's short date (DATE_SHORTDATE, the
// default); otherwise the Windows picture `format` (d dd ddd dddd M MM MMM MMMM y yy yyyy gg and
// 'quoted text'). With `size` 0 returns the units needed including the terminator; otherwise
// writes the terminated text and returns its units including the terminator. Fails with 0 and
// ERROR_INSUFFICIENT_BUFFER (122) when `size` is too small, ERROR_INVALID_PARAMETER for an
// unknown locale, a null or invalid date or a null `out` with a non-zero size, and
// ERROR_INVALID_FLAGS for flags other than DATE_SHORTDATE, or with a picture.
int GetDateFormatW(LCID locale, DWORD flags, const SYSTEMTIME* date, const char16_t* format,
                   char16_t* out, int size) noexcept;

// GetTimeFormatW: the same for the time of day, from the locale's time picture (h hh H HH m mm
// s ss t tt), with the TIME_* flags.
int GetTimeFormatW(LCID locale, DWORD flags, const SYSTEMTIME* time, const char16_t* format,
                   char16_t* out, int size) noexcept;

// Seconds since 1970-01-01 00:00:00 UTC as local broken-down time in the time zone of the
// environment (TZ), as the Windows runtime's 64-bit local-time conversion gives it: fails (false)
// for times before 1970-01-01 less 12 hours and after 3000-12-31 23:59:59 plus 13 hours.
// Milliseconds are 0; wDayOfWeek is 0 for Sunday.
bool LocalTimeFromUnixTime(std::int64_t seconds, SYSTEMTIME& local) noexcept;

}  // namespace Platform
