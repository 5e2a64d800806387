// Size and time texts, days in a month, message texts.
#include <gtest/gtest.h>

#include "ResourceTestSupport.h"
#include "owutils/LmFormat.h"
#include "owutils/LmResources.h"
#include "support/TestEnvironment.h"

namespace {

TEST(FormatSizeTest, AroundEachThreshold) {
  const std::pair<std::int64_t, const char16_t*> cases[] = {
      {0, u"0 KB"},
      {1, u"1 KB"},
      {1023, u"1 KB"},
      {1024, u"2 KB"},
      {996147, u"973 KB"},          // the last size in KB
      {996148, u"0.95 MB"},         // the first in MB
      {1048576, u"1.00 MB"},
      {1020054732, u"972.80 MB"},   // the last in MB
      {1020054733, u"0.95 GB"},     // the first in GB
      {5368709120, u"5.00 GB"},
      {1099511627776, u"1024.00 GB"},
      {-1, u"0 KB"},
      {-5000, u"-4 KB"},            // no increment for negative sizes
  };
  for (const auto& [bytes, text] : cases) {
    EXPECT_EQ(FormatSize(bytes), CString(text)) << bytes;
  }
}

TEST(GetLastDayOfMonthTest, GregorianCalendar) {
  for (int month : {1, 3, 5, 7, 8, 10, 12}) EXPECT_EQ(GetLastDayOfMonth(month, 2023), 31) << month;
  for (int month : {4, 6, 9, 11}) EXPECT_EQ(GetLastDayOfMonth(month, 2023), 30) << month;
  EXPECT_EQ(GetLastDayOfMonth(2, 2023), 28);
  EXPECT_EQ(GetLastDayOfMonth(2, 2024), 29);
  EXPECT_EQ(GetLastDayOfMonth(2, 2000), 29);
  EXPECT_EQ(GetLastDayOfMonth(2, 1900), 28);  // century years are leap years only by 400
  EXPECT_EQ(GetLastDayOfMonth(2, 2100), 28);
  EXPECT_EQ(GetLastDayOfMonth(2, -4), 29);
  // Month values outside 1-12 keep their old answer.
  for (int month : {0, 13, -1}) EXPECT_EQ(GetLastDayOfMonth(month, 2024), 30) << month;
}

class FormatTimeTest : public ResTest::ResourceTest {
 protected:
  void SetUp() override {
    ResourceTest::SetUp();
    m_environment.Set("TZ", "UTC0");
  }
};

TEST_F(FormatTimeTest, ShortDateSpaceTimeInTheUsersLocale) {
  m_environment.Set("LANG", "en_US.UTF-8");
  EXPECT_EQ(FormatTime(1700000000), CString(u"11/14/2023 10:13:20 PM"));
  m_environment.Set("LANG", "de_DE.UTF-8");
  EXPECT_EQ(FormatTime(1700000000), CString(u"14.11.2023 22:13:20"));
  m_environment.Set("TZ", "CET-1");
  EXPECT_EQ(FormatTime(1700000000), CString(u"14.11.2023 23:13:20"));
}

TEST_F(FormatTimeTest, TimesTheRuntimeCannotConvertGiveEmptyText) {
  EXPECT_TRUE(FormatTime(0).IsEmpty());
  EXPECT_TRUE(FormatTime(-86400).IsEmpty());             // a day before 1970
  EXPECT_TRUE(FormatTime(32535215999LL + 86400).IsEmpty());  // after the year 3000
  EXPECT_EQ(FormatTime(32535215999LL), CString(u"12/31/3000 11:59:59 PM"));
}

class GetErrorMessageTest : public ResTest::ResourceTest {};

TEST_F(GetErrorMessageTest, JoinsTheLinesOfAMessage) {
  UseModules(ResTest::MakeModuleFolder({"OWAppMsg409.so"}));
  CString text(u"old");
  GetErrorMessage(0x20000002, text);
  EXPECT_EQ(text, CString(u"First line.Second line.Third line."));
  GetErrorMessage(0x20000001, text);
  EXPECT_EQ(text, CString(u"One line with an insert %1."));  // inserts stay as written
}

TEST_F(GetErrorMessageTest, FallsBackToSystemTextsThenToNothing) {
  UseModules(ResTest::MakeModuleFolder({"OWAppMsg409.so"}));
  CString text;
  GetErrorMessage(ERROR_FILE_NOT_FOUND, text);
  EXPECT_FALSE(text.IsEmpty());
  EXPECT_EQ(text.Find(u'\r'), -1);
  EXPECT_EQ(text.Find(u'\n'), -1);
  text = u"old";
  GetErrorMessage(0x2000FFFF, text);
  EXPECT_TRUE(text.IsEmpty());
}

TEST_F(GetErrorMessageTest, NoMessageModuleGivesEmptyText) {
  UseModules(ResTest::MakeModuleFolder({}));
  CString text(u"old");
  GetErrorMessage(0x20000002, text);
  EXPECT_TRUE(text.IsEmpty());
}

TEST_F(GetErrorMessageTest, ShippedMessageModules) {
  UseModules(ResTest::MakeModuleFolder({"OWAppMsg409.so", "OWAppMsg407.so"}, OWTEST_SHIPPED_DIR));
  CString text;
  GetErrorMessage(0xE0001001, text);
  EXPECT_EQ(text, CString(u"The backup destination %1 cannot be reached.Check that the device is connected and try again."));
}

TEST_F(GetErrorMessageTest, ShippedGermanMessageModule) {
  m_environment.Set("LANG", "de_DE.UTF-8");
  UseModules(ResTest::MakeModuleFolder({"OWAppMsg409.so", "OWAppMsg407.so"}, OWTEST_SHIPPED_DIR));
  CString text;
  GetErrorMessage(0xE0001002, text);
  EXPECT_EQ(text, CString(u"Auf %1 ist nicht genügend freier Speicherplatz vorhanden."));
}

}  // namespace
