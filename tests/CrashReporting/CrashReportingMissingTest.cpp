// No component lies beside the test program, and the system loader finds none either.
#include <gtest/gtest.h>

#include "CrashTestSupport.h"
#include "owutils/LmCrashReporting.h"

namespace {

using CrashTest::CapturedOutput;

TEST(CrashReportingWithoutComponent, InitReportsWhyTheModuleCouldNotBeLoaded) {
  CapturedOutput output;
  EXPECT_FALSE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  EXPECT_EQ(output.Count("crInstall failure: unable to load module 'CrashRpt1403.so', error = 0x8007007E"), 1u)
      << output.Text();
  // A second attempt looks again, and fails the same way.
  EXPECT_FALSE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  EXPECT_EQ(output.Count("crInstall failure: unable to load module"), 2u);
}

TEST(CrashReportingWithoutComponent, OtherCallsDoNothingAndNeverCrash) {
  CapturedOutput output;
  LmCrashReportingAddFile(u"C:\\logs\\agent.log", u"agent log");
  EXPECT_FALSE(LmCrashReportingAddProperty(u"user", u"alice"));
  EXPECT_EQ(output.Count("LmCrashReportingAddProperty"), 1u) << output.Text();
  LmCrashReportingDeinit();
  EXPECT_FALSE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  LmCrashReportingAddFile(u"C:\\logs\\agent.log", u"agent log");
  EXPECT_FALSE(LmCrashReportingAddProperty(u"user", u"alice"));
  LmCrashReportingDeinit();
}

}  // namespace
