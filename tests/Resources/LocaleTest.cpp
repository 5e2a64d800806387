// The platform locale service: languages from the environment, date and time pictures.
#include <gtest/gtest.h>

#include <clocale>
#include <string>

#include "ResourceTestSupport.h"
#include "platform/Errors.h"
#include "platform/Locale.h"

namespace {

using ResTest::ScopedEnvironment;

TEST(LocaleTest, LocaleNamesMapToWindowsIdentifiers) {
  const std::pair<const char*, LCID> cases[] = {
      {"de_DE.UTF-8", 0x407}, {"zh_TW", 0x404},       {"zh_CN.GB18030", 0x804}, {"pt_BR", 0x416},
      {"en_US", 0x409},       {"es_ES@euro", 0x40A},  {"fr_FR", 0x40C},         {"it_IT", 0x410},
      {"ja_JP.eucJP", 0x411}, {"ko_KR", 0x412},       {"ru_RU.KOI8-R", 0x419},  {"tr_TR", 0x41F},
      {"de_AT", 0xC07},       {"de_LU.UTF-8", 0x407}, {"zh", 0x804},            {"de-DE", 0x407},
      {"nl_NL", 0x413},       {"C", 0},               {"C.UTF-8", 0},           {"POSIX", 0},
      {"", 0},                {"xx_YY", 0},
  };
  for (const auto& [name, id] : cases) EXPECT_EQ(Platform::LocaleIdFromName(name), id) << name;
  EXPECT_EQ(Platform::LocaleIdFromName(nullptr), 0u);
}

TEST(LocaleTest, UserInterfaceLanguageTakesLcAllThenLcMessagesThenLang) {
  ScopedEnvironment environment;
  ResTest::ClearLocaleVariables(environment);
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x409);  // nothing set

  environment.Set("LANG", "pt_BR.UTF-8");
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x416);
  environment.Set("LC_MESSAGES", "zh_TW.UTF-8");
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x404);
  environment.Set("LC_ALL", "");  // empty counts as not set
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x404);
  environment.Set("LC_ALL", "de_DE.UTF-8");
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x407);
  environment.Set("LC_TIME", "ja_JP.UTF-8");  // the formatting locale only
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x407);
  EXPECT_EQ(Platform::GetUserDefaultLCID(), 0x407u);
  environment.Set("LC_ALL", nullptr);
  EXPECT_EQ(Platform::GetUserDefaultLCID(), 0x411u);
  environment.Set("LC_ALL", "C");
  EXPECT_EQ(Platform::GetUserDefaultUILanguage(), 0x409);
}

TEST(LocaleTest, KnownLocalesCountAsInstalled) {
  for (LCID id : {0x404u, 0x407u, 0x409u, 0x40Au, 0x40Cu, 0x410u, 0x411u, 0x412u, 0x416u, 0x419u, 0x41Fu,
                  0x804u}) {
    EXPECT_TRUE(Platform::IsValidLocale(id, Platform::kLcidInstalled)) << std::hex << id;
    EXPECT_TRUE(Platform::IsValidLocale(id, Platform::kLcidSupported)) << std::hex << id;
  }
  EXPECT_FALSE(Platform::IsValidLocale(0x1234, Platform::kLcidInstalled));
  EXPECT_FALSE(Platform::IsValidLocale(0, Platform::kLcidInstalled));
  EXPECT_FALSE(Platform::IsValidLocale(0x409, 0));
}

std::u16string Date(LCID locale, const SYSTEMTIME& t, const char16_t* picture = nullptr) {
  char16_t buffer[128] = {};
  int n = Platform::GetDateFormatW(locale, picture == nullptr ? Platform::kDateShortDate : 0, &t, picture,
                                   buffer, 128);
  return n > 0 ? std::u16string(buffer) : u"<failed>";
}

std::u16string Time(LCID locale, const SYSTEMTIME& t, DWORD flags = 0) {
  char16_t buffer[128] = {};
  int n = Platform::GetTimeFormatW(locale, flags, &t, nullptr, buffer, 128);
  return n > 0 ? std::u16string(buffer) : u"<failed>";
}

TEST(LocaleTest, ShortDatesAndTimesOfEachLocale) {
  const SYSTEMTIME t = {2024, 3, 2, 5, 14, 7, 9, 0};  // Tuesday 2024-03-05 14:07:09
  EXPECT_EQ(Date(0x409, t), u"3/5/2024");
  EXPECT_EQ(Time(0x409, t), u"2:07:09 PM");
  EXPECT_EQ(Date(0x407, t), u"05.03.2024");
  EXPECT_EQ(Time(0x407, t), u"14:07:09");
  EXPECT_EQ(Date(0x411, t), u"2024/03/05");
  EXPECT_EQ(Date(0x804, t), u"2024/3/5");
  EXPECT_EQ(Time(0x404, t), u"下午 02:07:09");
  EXPECT_EQ(Time(0x412, t), u"오후 2:07:09");
  EXPECT_EQ(Date(0x41F, t), u"5.03.2024");

  const SYSTEMTIME midnight = {2024, 3, 2, 5, 0, 5, 0, 0};
  EXPECT_EQ(Time(0x409, midnight), u"12:05:00 AM");
  EXPECT_EQ(Time(0x409, t, Platform::kTimeNoSeconds), u"2:07 PM");
  EXPECT_EQ(Time(0x409, t, Platform::kTimeForce24HourFormat), u"14:07:09");
  EXPECT_EQ(Time(0x409, t, Platform::kTimeNoTimeMarker), u"2:07:09");
  EXPECT_EQ(Time(0x407, t, Platform::kTimeNoMinutesOrSeconds), u"14");
}

TEST(LocaleTest, DatePictures) {
  const SYSTEMTIME t = {2024, 3, 2, 5, 14, 7, 9, 0};
  EXPECT_EQ(Date(0x409, t, u"dddd, MMMM d, yyyy"), u"Tuesday, March 5, 2024");
  EXPECT_EQ(Date(0x407, t, u"ddd d. MMM yy"), u"Di 5. Mär 24");
  EXPECT_EQ(Date(0x409, t, u"'Day' d 'of the year''s' M"), u"Day 5 of the year's 3");
}

TEST(LocaleTest, UserDefaultFollowsTheEnvironmentAndLeavesTheGlobalLocaleAlone) {
  ScopedEnvironment environment;
  ResTest::ClearLocaleVariables(environment);
  std::string before = std::setlocale(LC_ALL, nullptr);
  const SYSTEMTIME t = {2024, 12, 2, 31, 9, 30, 0, 0};
  environment.Set("LANG", "de_DE.UTF-8");
  EXPECT_EQ(Date(Platform::kLocaleUserDefault, t), u"31.12.2024");
  environment.Set("LC_TIME", "en_GB.UTF-8");
  EXPECT_EQ(Date(Platform::kLocaleUserDefault, t), u"31/12/2024");
  EXPECT_EQ(Time(Platform::kLocaleUserDefault, t), u"09:30:00");
  EXPECT_EQ(std::setlocale(LC_ALL, nullptr), before);
}

TEST(LocaleTest, BufferSizesAndInvalidInput) {
  const SYSTEMTIME t = {2024, 3, 2, 5, 14, 7, 9, 0};
  EXPECT_EQ(Platform::GetDateFormatW(0x409, 0, &t, nullptr, nullptr, 0), 9);  // "3/5/2024" + NUL
  char16_t small[8];
  EXPECT_EQ(Platform::GetDateFormatW(0x409, 0, &t, nullptr, small, 8), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
  char16_t exact[9];
  EXPECT_EQ(Platform::GetDateFormatW(0x409, 0, &t, nullptr, exact, 9), 9);

  const SYSTEMTIME february30 = {2023, 2, 0, 29, 0, 0, 0, 0};
  EXPECT_EQ(Platform::GetDateFormatW(0x409, 0, &february30, nullptr, exact, 9), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
  const SYSTEMTIME badHour = {2024, 3, 2, 5, 24, 0, 0, 0};
  EXPECT_EQ(Platform::GetTimeFormatW(0x409, 0, &badHour, nullptr, exact, 9), 0);
  EXPECT_EQ(Platform::GetDateFormatW(0x1234, 0, &t, nullptr, exact, 9), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
  EXPECT_EQ(Platform::GetDateFormatW(0x409, 0x80, &t, nullptr, exact, 9), 0);
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_FLAGS));
}

TEST(LocaleTest, LocalTimeHasTheRuntimesRange) {
  ScopedEnvironment environment;
  environment.Set("TZ", "UTC0");
  SYSTEMTIME t{};
  ASSERT_TRUE(Platform::LocalTimeFromUnixTime(1700000000, t));
  EXPECT_EQ(t.wYear, 2023);
  EXPECT_EQ(t.wMonth, 11);
  EXPECT_EQ(t.wDay, 14);
  EXPECT_EQ(t.wDayOfWeek, 2);
  EXPECT_EQ(t.wHour, 22);
  EXPECT_EQ(t.wMinute, 13);
  EXPECT_EQ(t.wSecond, 20);
  EXPECT_TRUE(Platform::LocalTimeFromUnixTime(-43200, t));
  EXPECT_FALSE(Platform::LocalTimeFromUnixTime(-43201, t));
  EXPECT_FALSE(Platform::LocalTimeFromUnixTime(-86400, t));
  EXPECT_TRUE(Platform::LocalTimeFromUnixTime(32535215999LL, t));
  EXPECT_EQ(t.wYear, 3000);
  EXPECT_FALSE(Platform::LocalTimeFromUnixTime(32535215999LL + 13 * 3600 + 1, t));

  environment.Set("TZ", "CET-1");
  ASSERT_TRUE(Platform::LocalTimeFromUnixTime(1700000000, t));
  EXPECT_EQ(t.wHour, 23);
}

}  // namespace
