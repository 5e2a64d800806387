// The component beside the test program lacks crAddPropertyW.
#include <gtest/gtest.h>

#include "CrashTestSupport.h"
#include "owutils/LmCrashReporting.h"

namespace {

using CrashTest::CapturedOutput;
using CrashTest::ComponentLog;

TEST(CrashReportingWithPartialComponent, IsRefusedWholeInsteadOfFailingLater) {
  ComponentLog log;
  CapturedOutput output;
  EXPECT_FALSE(LmCrashReportingInit(u"App", u"http://r.example/x", nullptr, 7, true));
  EXPECT_EQ(output.Count("crInstall failure: unable to load module 'CrashRpt1403.so', error = 0x8007007F"), 1u)
      << output.Text();
  EXPECT_TRUE(log.Lines().empty());  // nothing of it was called
  EXPECT_FALSE(LmCrashReportingAddProperty(u"user", u"alice"));
  LmCrashReportingAddFile(u"C:\\a.log", u"a");
  LmCrashReportingDeinit();
  EXPECT_TRUE(log.Lines().empty());
}

}  // namespace
