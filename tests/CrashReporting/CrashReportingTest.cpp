// The component lies beside the test program; no engine module does.
#include <gtest/gtest.h>

#include <cstdlib>

#include "CrashTestSupport.h"
#include "owutils/LmCrashReporting.h"

namespace {

using CrashTest::CapturedOutput;
using CrashTest::ComponentLog;
using CrashTest::Field;

bool EndsWith(const std::string& text, const std::string& end) {
  return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

TEST(CrashReportingInit, InstallsWithDefaultVersionWithoutEngine) {
  ComponentLog log;
  CapturedOutput output;
  ASSERT_TRUE(LmCrashReportingInit(u"Backup Agent", u"https://reports.example/receive", &CrashTest::TestCallback,
                                   1001, true));
  const auto lines = log.Lines();
  ASSERT_GE(lines.size(), 2u);
  const std::string& install = lines[0];
  EXPECT_EQ(install.rfind("crInstallW ", 0), 0u) << install;
  EXPECT_EQ(Field(install, "cb"), std::to_string(sizeof(LmCrashInstallInfo)));
  EXPECT_EQ(Field(install, "app"), "Backup Agent");
  EXPECT_EQ(Field(install, "version"), "19.0.0.0");
  // Without the engine module there is no OEM name.
  EXPECT_EQ(Field(install, "url"), "https://reports.example/receive?cn=&maj=19&min=0&bld=0");
  EXPECT_EQ(Field(install, "callback"), "set");
  EXPECT_EQ(lines[1], "callback=42");  // the caller's callback arrived unchanged
  EXPECT_EQ(Field(install, "prio"), "0,-1,-1,0,0");
  EXPECT_EQ(Field(install, "flags"), "0x5FFF");
  EXPECT_EQ(Field(install, "dump"), "0");
  EXPECT_EQ(Field(install, "others"), "zero");
  const std::string lang = Field(install, "lang");
  EXPECT_EQ(lang.rfind("\\\\?\\", 0), 0u) << lang;  // long-path form
  EXPECT_TRUE(EndsWith(lang, "\\present\\crashrpt_lang_enu.ini")) << lang;
  EXPECT_EQ(output.Count("crInstall failure"), 0u) << output.Text();
}

TEST(CrashReportingInit, NonInteractiveSendsWithoutGui) {
  ComponentLog log;
  ASSERT_TRUE(LmCrashReportingInit(u"Service", u"http://r.example/x", nullptr, 7, false));
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(Field(lines[0], "flags"), "0x7FFF");
  EXPECT_EQ(Field(lines[0], "callback"), "null");
}

TEST(CrashReportingInit, LanguageFileFollowsTheUserInterfaceLanguage) {
  ComponentLog log;
  setenv("LC_ALL", "ja_JP.UTF-8", 1);
  const bool installed = LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true);
  unsetenv("LC_ALL");
  ASSERT_TRUE(installed);
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_TRUE(EndsWith(Field(lines[0], "lang"), "\\present\\crashrpt_lang_jpn.ini")) << lines[0];
}

TEST(CrashReportingInit, ComponentRefusalIsReportedWithItsText) {
  ComponentLog log;
  CapturedOutput output;
  setenv("OWTEST_CRASHRPT_INSTALL_RESULT", "1", 1);
  setenv("OWTEST_CRASHRPT_ERROR", "Invalid parameter: pszUrl", 1);
  EXPECT_FALSE(LmCrashReportingInit(u"App", u"bad", nullptr, 7, true));
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[1], "crGetLastErrorMsgW size=256");
  EXPECT_EQ(output.Count("crInstall failure: Invalid parameter: pszUrl"), 1u) << output.Text();
}

TEST(CrashReportingAddProperty, FailureIsReportedOnceAndLaterCallsWork) {
  ComponentLog log;
  ASSERT_TRUE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  CapturedOutput output;
  setenv("OWTEST_CRASHRPT_PROPERTY_RESULT", "1", 1);
  EXPECT_FALSE(LmCrashReportingAddProperty(u"session", u"\u00e9t\u00e9 42"));
  EXPECT_EQ(output.Count("status == 0"), 1u) << output.Text();
  EXPECT_NE(output.Text().find("LmCrashReportingAddProperty"), std::string::npos) << output.Text();
  unsetenv("OWTEST_CRASHRPT_PROPERTY_RESULT");
  EXPECT_TRUE(LmCrashReportingAddProperty(u"user", u"alice"));
  EXPECT_EQ(output.Count("status == 0"), 1u);
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[1], "crAddPropertyW name=session value=\xC3\xA9t\xC3\xA9 42");
  EXPECT_EQ(lines[2], "crAddPropertyW name=user value=alice");
}

TEST(CrashReportingAddFile, PassesFileAndDescription) {
  ComponentLog log;
  ASSERT_TRUE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  LmCrashReportingAddFile(u"C:\\logs\\agent.log", u"agent log");
  LmCrashReportingDeinit();
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[1], "crAddFile2W file=C:\\logs\\agent.log dest=(null) desc=agent log flags=0");
  EXPECT_EQ(lines[2], "crUninstall");
}

}  // namespace
