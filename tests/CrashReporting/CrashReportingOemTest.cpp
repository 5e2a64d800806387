// The component and an engine module with test OEM data (5.2 build 1234) lie beside the test
// program.
#include <gtest/gtest.h>

#include "CrashTestSupport.h"
#include "LmUtils/ResourceState.h"
#include "owutils/LmCrashReporting.h"

namespace {

using CrashTest::ComponentLog;
using CrashTest::Field;

TEST(CrashReportingInit, ReportAddressCarriesOemNameAndVersion) {
  ComponentLog log;
  ASSERT_TRUE(LmCrashReportingInit(u"App", u"https://reports.example/receive", nullptr, 7, true));
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(Field(lines[0], "version"), "5.2.1234.0");
  EXPECT_EQ(Field(lines[0], "url"), "https://reports.example/receive?cn=Acme%20%26%20Sons%3DOEM&maj=5&min=2&bld=1234");
}

TEST(CrashReportingInit, WithoutTheEngineModuleTheVersionFallsBack) {
  // The modules are looked for in an empty folder instead.
  LmUtils::detail::ResetResourceStateForTesting();
  LmUtils::detail::SetResourceDirectoryForTesting(CString(u"C:\\"));
  ComponentLog log;
  const bool installed = LmCrashReportingInit(u"App", u"https://reports.example/receive", nullptr, 7, true);
  LmUtils::detail::SetResourceDirectoryForTesting(CString());
  LmUtils::detail::ResetResourceStateForTesting();
  ASSERT_TRUE(installed);
  const auto lines = log.Lines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(Field(lines[0], "version"), "19.0.0.0");
  EXPECT_EQ(Field(lines[0], "url"), "https://reports.example/receive?cn=&maj=19&min=0&bld=0");
}

}  // namespace
