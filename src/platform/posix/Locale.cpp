// POSIX backend: languages from the locale environment, Windows date and time pictures from a
// table of our own, local time from the C library.
#include "platform/Locale.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <string>

#include "platform/Errors.h"

namespace Platform {
namespace {

enum class Names { English, German };

struct LocaleInfo {
  LCID id;
  const char* language;  // ISO 639 code as in POSIX locale names
  const char* country;   // ISO 3166 code, or null for the language's main entry
  const char16_t* shortDate;
  const char16_t* time;
  const char16_t* am;
  const char16_t* pm;
  Names names;
};

// The Windows short date and time pictures of the locales we know. The first entry of a
// language is its main one: the answer for the bare language and for unknown countries.
constexpr LocaleInfo kLocales[] = {
    {0x0409, "en", "US", u"M/d/yyyy", u"h:mm:ss tt", u"AM", u"PM", Names::English},
    {0x0809, "en", "GB", u"dd/MM/yyyy", u"HH:mm:ss", u"AM", u"PM", Names::English},
    {0x0C09, "en", "AU", u"d/MM/yyyy", u"h:mm:ss tt", u"AM", u"PM", Names::English},
    {0x1009, "en", "CA", u"yyyy-MM-dd", u"h:mm:ss tt", u"a.m.", u"p.m.", Names::English},
    {0x1809, "en", "IE", u"dd/MM/yyyy", u"HH:mm:ss", u"a.m.", u"p.m.", Names::English},
    {0x0407, "de", "DE", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::German},
    {0x0C07, "de", "AT", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::German},
    {0x0807, "de", "CH", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::German},
    {0x040A, "es", "ES", u"dd/MM/yyyy", u"H:mm:ss", u"", u"", Names::English},
    {0x0C0A, "es", nullptr, u"dd/MM/yyyy", u"H:mm:ss", u"", u"", Names::English},
    {0x040C, "fr", "FR", u"dd/MM/yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0C0C, "fr", "CA", u"yyyy-MM-dd", u"HH:mm:ss", u"", u"", Names::English},
    {0x080C, "fr", "BE", u"dd-MM-yy", u"HH:mm:ss", u"", u"", Names::English},
    {0x100C, "fr", "CH", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0410, "it", "IT", u"dd/MM/yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0411, "ja", "JP", u"yyyy/MM/dd", u"H:mm:ss", u"午前", u"午後", Names::English},
    {0x0412, "ko", "KR", u"yyyy-MM-dd", u"tt h:mm:ss", u"오전", u"오후", Names::English},
    {0x0416, "pt", "BR", u"dd/MM/yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0816, "pt", "PT", u"dd/MM/yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0419, "ru", "RU", u"dd.MM.yyyy", u"H:mm:ss", u"", u"", Names::English},
    {0x041F, "tr", "TR", u"d.MM.yyyy", u"HH:mm:ss", u"ÖÖ", u"ÖS", Names::English},
    {0x0804, "zh", "CN", u"yyyy/M/d", u"H:mm:ss", u"上午", u"下午", Names::English},
    {0x0404, "zh", "TW", u"yyyy/M/d", u"tt hh:mm:ss", u"上午", u"下午", Names::English},
    {0x0C04, "zh", "HK", u"d/M/yyyy", u"H:mm:ss", u"上午", u"下午", Names::English},
    {0x1004, "zh", "SG", u"yyyy/M/d", u"tt h:mm:ss", u"上午", u"下午", Names::English},
    {0x1404, "zh", "MO", u"d/M/yyyy", u"H:mm:ss", u"上午", u"下午", Names::English},
    {0x0413, "nl", "NL", u"d-M-yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0813, "nl", "BE", u"d/MM/yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0415, "pl", "PL", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0405, "cs", "CZ", u"dd.MM.yyyy", u"H:mm:ss", u"", u"", Names::English},
    {0x041D, "sv", "SE", u"yyyy-MM-dd", u"HH:mm:ss", u"", u"", Names::English},
    {0x0406, "da", "DK", u"dd-MM-yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x0414, "nb", "NO", u"dd.MM.yyyy", u"HH:mm:ss", u"", u"", Names::English},
    {0x040B, "fi", "FI", u"d.M.yyyy", u"H:mm:ss", u"", u"", Names::English},
    {0x040E, "hu", "HU", u"yyyy. MM. dd.", u"H:mm:ss", u"", u"", Names::English},
    {0x0408, "el", "GR", u"d/M/yyyy", u"h:mm:ss tt", u"πμ", u"μμ", Names::English},
};

// The locale of LOCALE_INVARIANT.
constexpr LocaleInfo kInvariant = {kLocaleInvariant, "", nullptr, u"MM/dd/yyyy", u"HH:mm:ss",
                                   u"AM", u"PM", Names::English};

constexpr const char16_t* kMonthNames[2][12] = {
    {u"January", u"February", u"March", u"April", u"May", u"June", u"July", u"August",
     u"September", u"October", u"November", u"December"},
    {u"Januar", u"Februar", u"März", u"April", u"Mai", u"Juni", u"Juli", u"August",
     u"September", u"Oktober", u"November", u"Dezember"}};
constexpr const char16_t* kMonthAbbreviations[2][12] = {
    {u"Jan", u"Feb", u"Mar", u"Apr", u"May", u"Jun", u"Jul", u"Aug", u"Sep", u"Oct", u"Nov",
     u"Dec"},
    {u"Jan", u"Feb", u"Mär", u"Apr", u"Mai", u"Jun", u"Jul", u"Aug", u"Sep", u"Okt", u"Nov",
     u"Dez"}};
constexpr const char16_t* kDayNames[2][7] = {
    {u"Sunday", u"Monday", u"Tuesday", u"Wednesday", u"Thursday", u"Friday", u"Saturday"},
    {u"Sonntag", u"Montag", u"Dienstag", u"Mittwoch", u"Donnerstag", u"Freitag", u"Samstag"}};
constexpr const char16_t* kDayAbbreviations[2][7] = {
    {u"Sun", u"Mon", u"Tue", u"Wed", u"Thu", u"Fri", u"Sat"},
    {u"So", u"Mo", u"Di", u"Mi", u"Do", u"Fr", u"Sa"}};

const LocaleInfo* FindLocale(LCID id) {
  id &= 0xFFFF;  // the sort identifier does not matter for formatting
  if (id == kLocaleInvariant) return &kInvariant;
  for (const LocaleInfo& info : kLocales) {
    if (info.id == id) return &info;
  }
  return nullptr;
}

const char* FirstSet(const char* a, const char* b, const char* c) {
  for (const char* name : {a, b, c}) {
    const char* value = std::getenv(name);
    if (value != nullptr && *value != 0) return value;
  }
  return nullptr;
}

LCID LocaleFromEnvironment(const char* category) {
  LCID id = LocaleIdFromName(FirstSet("LC_ALL", category, "LANG"));
  return id != 0 ? id : 0x0409;
}

const LocaleInfo* ResolveLocale(LCID locale) {
  if (locale == kLocaleUserDefault || locale == kLocaleSystemDefault || locale == 0) {
    locale = GetUserDefaultLCID();
  }
  return FindLocale(locale);
}

bool IsLeapYear(int year) { return (year % 4 == 0 && year % 100 != 0) || year % 400 == 0; }

bool IsValidDate(const SYSTEMTIME& t) {
  static constexpr int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (t.wYear < 1601 || t.wYear > 30827 || t.wMonth < 1 || t.wMonth > 12 || t.wDay < 1) {
    return false;
  }
  int days = kDays[t.wMonth - 1] + (t.wMonth == 2 && IsLeapYear(t.wYear) ? 1 : 0);
  return t.wDay <= days;
}

bool IsValidTime(const SYSTEMTIME& t) {
  return t.wHour < 24 && t.wMinute < 60 && t.wSecond < 60 && t.wMilliseconds < 1000;
}

void AppendNumber(std::u16string& out, unsigned value, int minDigits) {
  std::u16string digits;
  do {
    digits.insert(digits.begin(), static_cast<char16_t>(u'0' + value % 10));
    value /= 10;
  } while (value != 0);
  while (static_cast<int>(digits.size()) < minDigits) digits.insert(digits.begin(), u'0');
  out += digits;
}

// Length of the run of `c` starting at `p`.
int RunLength(const char16_t* p, char16_t c) {
  int n = 0;
  while (p[n] == c) ++n;
  return n;
}

// Copies a 'quoted' stretch ('' stands for one quote); returns the position after it.
const char16_t* CopyQuoted(const char16_t* p, std::u16string& out) {
  ++p;
  while (*p != 0) {
    if (*p == u'\'') {
      if (p[1] == u'\'') {
        out += u'\'';
        p += 2;
        continue;
      }
      return p + 1;
    }
    out += *p++;
  }
  return p;
}

std::u16string FormatDatePicture(const LocaleInfo& info, const SYSTEMTIME& t,
                                 const char16_t* picture) {
  const int names = info.names == Names::German ? 1 : 0;
  std::u16string out;
  const char16_t* p = picture;
  while (*p != 0) {
    char16_t c = *p;
    if (c == u'\'') {
      p = CopyQuoted(p, out);
      continue;
    }
    int n = RunLength(p, c);
    switch (c) {
      case u'd':
        if (n == 1 || n == 2) {
          AppendNumber(out, t.wDay, n);
        } else {
          out += (n == 3 ? kDayAbbreviations : kDayNames)[names][t.wDayOfWeek % 7];
        }
        break;
      case u'M':
        if (n == 1 || n == 2) {
          AppendNumber(out, t.wMonth, n);
        } else {
          out += (n == 3 ? kMonthAbbreviations : kMonthNames)[names][t.wMonth - 1];
        }
        break;
      case u'y':
        if (n == 1) {
          AppendNumber(out, t.wYear % 100, 1);
        } else if (n == 2) {
          AppendNumber(out, t.wYear % 100, 2);
        } else {
          AppendNumber(out, t.wYear, 4);
        }
        break;
      case u'g':
        break;  // era: the Gregorian calendar of these locales shows none
      default:
        out.append(static_cast<size_t>(n), c);
        break;
    }
    p += n;
  }
  return out;
}

std::u16string FormatTimePicture(const LocaleInfo& info, DWORD flags, const SYSTEMTIME& t,
                                 const char16_t* picture) {
  std::u16string out;
  const char16_t* p = picture;
  // With a field dropped, the separator text before it goes too.
  auto drop = [&out](size_t mark) { out.erase(mark); };
  size_t lastFieldEnd = 0;
  while (*p != 0) {
    char16_t c = *p;
    if (c == u'\'') {
      p = CopyQuoted(p, out);
      continue;
    }
    int n = RunLength(p, c);
    switch (c) {
      case u'h':
      case u'H': {
        bool twelve = c == u'h' && (flags & kTimeForce24HourFormat) == 0;
        unsigned hour = t.wHour;
        if (twelve) hour = hour % 12 == 0 ? 12 : hour % 12;
        AppendNumber(out, hour, n >= 2 ? 2 : 1);
        lastFieldEnd = out.size();
        break;
      }
      case u'm':
        if (flags & kTimeNoMinutesOrSeconds) {
          drop(lastFieldEnd);
        } else {
          AppendNumber(out, t.wMinute, n >= 2 ? 2 : 1);
          lastFieldEnd = out.size();
        }
        break;
      case u's':
        if (flags & (kTimeNoSeconds | kTimeNoMinutesOrSeconds)) {
          drop(lastFieldEnd);
        } else {
          AppendNumber(out, t.wSecond, n >= 2 ? 2 : 1);
          lastFieldEnd = out.size();
        }
        break;
      case u't': {
        if (flags & (kTimeNoTimeMarker | kTimeForce24HourFormat)) {
          // The marker and the blank beside it go.
          if (!out.empty() && out.back() == u' ') out.pop_back();
          if (p[n] == u' ') ++n;
          break;
        }
        std::u16string marker = t.wHour < 12 ? info.am : info.pm;
        out += n == 1 ? marker.substr(0, 1) : marker;
        lastFieldEnd = out.size();
        break;
      }
      default:
        out.append(static_cast<size_t>(n), c);
        break;
    }
    p += n;
  }
  // A marker that is empty in this locale leaves no trailing blank behind.
  while (!out.empty() && out.back() == u' ') out.pop_back();
  return out;
}

int Deliver(const std::u16string& text, char16_t* out, int size) {
  int needed = static_cast<int>(text.size()) + 1;
  if (size == 0) return needed;
  if (size < needed) {
    SetLastError(ERROR_INSUFFICIENT_BUFFER);
    return 0;
  }
  std::copy(text.begin(), text.end(), out);
  out[text.size()] = 0;
  return needed;
}

}  // namespace

LCID LocaleIdFromName(const char* name) noexcept {
  if (name == nullptr || *name == 0) return 0;
  std::string language;
  std::string country;
  const char* p = name;
  while (*p != 0 && std::isalpha(static_cast<unsigned char>(*p))) {
    language += static_cast<char>(std::tolower(static_cast<unsigned char>(*p++)));
  }
  if (*p == '_' || *p == '-') {
    ++p;
    while (*p != 0 && std::isalpha(static_cast<unsigned char>(*p))) {
      country += static_cast<char>(std::toupper(static_cast<unsigned char>(*p++)));
    }
  }
  if (language.size() < 2 || language.size() > 3) return 0;  // also "C" and "POSIX"
  const LocaleInfo* main = nullptr;
  for (const LocaleInfo& info : kLocales) {
    if (language != info.language) continue;
    if (main == nullptr) main = &info;
    if (info.country != nullptr && country == info.country) return info.id;
  }
  if (language == "no" || language == "nn") return 0x0414;  // Norwegian under its older names
  return main != nullptr ? main->id : 0;
}

LANGID GetUserDefaultUILanguage() noexcept {
  return static_cast<LANGID>(LocaleFromEnvironment("LC_MESSAGES"));
}

LCID GetUserDefaultLCID() noexcept { return LocaleFromEnvironment("LC_TIME"); }

BOOL IsValidLocale(LCID locale, DWORD flags) noexcept {
  if (flags != kLcidInstalled && flags != kLcidSupported) return FALSE;
  return FindLocale(locale) != nullptr && (locale & 0xFFFF) != kLocaleInvariant ? TRUE : FALSE;
}

int GetDateFormatW(LCID locale, DWORD flags, const SYSTEMTIME* date, const char16_t* format,
                   char16_t* out, int size) noexcept {
  try {
    if (size < 0 || (size > 0 && out == nullptr) || date == nullptr) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return 0;
    }
    if ((flags & ~kDateShortDate) != 0 || (format != nullptr && flags != 0)) {
      SetLastError(ERROR_INVALID_FLAGS);
      return 0;
    }
    const LocaleInfo* info = ResolveLocale(locale);
    if (info == nullptr || !IsValidDate(*date)) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return 0;
    }
    return Deliver(FormatDatePicture(*info, *date, format != nullptr ? format : info->shortDate),
                   out, size);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

int GetTimeFormatW(LCID locale, DWORD flags, const SYSTEMTIME* time, const char16_t* format,
                   char16_t* out, int size) noexcept {
  try {
    constexpr DWORD kKnown =
        kTimeNoMinutesOrSeconds | kTimeNoSeconds | kTimeNoTimeMarker | kTimeForce24HourFormat;
    if (size < 0 || (size > 0 && out == nullptr) || time == nullptr) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return 0;
    }
    if ((flags & ~kKnown) != 0) {
      SetLastError(ERROR_INVALID_FLAGS);
      return 0;
    }
    const LocaleInfo* info = ResolveLocale(locale);
    if (info == nullptr || !IsValidTime(*time)) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return 0;
    }
    return Deliver(FormatTimePicture(*info, flags, *time, format != nullptr ? format : info->time),
                   out, size);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

bool LocalTimeFromUnixTime(std::int64_t seconds, SYSTEMTIME& local) noexcept {
  // The Windows runtime's limits: 1970-01-01 less 12 hours to 3000-12-31 23:59:59 plus 13 hours.
  constexpr std::int64_t kMinimum = -12 * 3600;
  constexpr std::int64_t kMaximum = 32535215999LL + 13 * 3600;
  if (seconds < kMinimum || seconds > kMaximum) return false;
  time_t value = static_cast<time_t>(seconds);
  tzset();  // localtime_r need not look at TZ again by itself
  struct tm parts;
  if (localtime_r(&value, &parts) == nullptr) return false;
  local.wYear = static_cast<WORD>(parts.tm_year + 1900);
  local.wMonth = static_cast<WORD>(parts.tm_mon + 1);
  local.wDayOfWeek = static_cast<WORD>(parts.tm_wday);
  local.wDay = static_cast<WORD>(parts.tm_mday);
  local.wHour = static_cast<WORD>(parts.tm_hour);
  local.wMinute = static_cast<WORD>(parts.tm_min);
  local.wSecond = static_cast<WORD>(parts.tm_sec);
  local.wMilliseconds = 0;
  return true;
}

}  // namespace Platform
