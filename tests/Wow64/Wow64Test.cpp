// Wow64: neutral answers without the system functions; failures wrapped with their cause.
#include <gtest/gtest.h>

#include "owutils/Exceptions.h"
#include "owutils/Wow64.h"
#include "platform/Errors.h"
#include "platform/Wow64.h"
#include "support/TestEnvironment.h"

namespace {

class Wow64Test : public ::testing::Test {
 protected:
  void TearDown() override { Platform::ClearKernelFunctionOverrides(); }
};

BOOL Fails(HANDLE, BOOL*) {
  Platform::SetLastError(ERROR_ACCESS_DENIED);
  return FALSE;
}
BOOL SaysYes(HANDLE, BOOL* flag) {
  *flag = TRUE;
  return TRUE;
}
PVOID g_state = reinterpret_cast<PVOID>(0x1234);
int g_disabled = 0;
BOOL Disable(PVOID* old) {
  *old = g_state;
  ++g_disabled;
  return TRUE;
}
BOOL Revert(PVOID old) {
  if (old != g_state) {
    Platform::SetLastError(ERROR_INVALID_PARAMETER);
    return FALSE;
  }
  --g_disabled;
  return TRUE;
}

TEST_F(Wow64Test, ThisBuildGetsTheNeutralAnswers) {
  // A 64-bit process, or a 32-bit one on a 32-bit kernel, is not under WOW64; nothing redirects.
  if (sizeof(void*) == 8) {
    EXPECT_FALSE(Wow64::IsWow64());
  }
  PVOID old = reinterpret_cast<PVOID>(0x77);
  Wow64::DisableWow64FsRedirection(&old);
  EXPECT_EQ(old, reinterpret_cast<PVOID>(0x77));  // untouched
  Wow64::RevertWow64FsRedirection(&old);
}

TEST_F(Wow64Test, MissingFunctionIsNotAnError) {
  Platform::SetKernelFunctionOverride("IsWow64Process", nullptr);
  EXPECT_FALSE(Wow64::IsWow64());
  Platform::SetKernelFunctionOverride("IsWow64Process", reinterpret_cast<void*>(&SaysYes));
  EXPECT_TRUE(Wow64::IsWow64());
}

TEST_F(Wow64Test, FailuresRaiseWow64ExceptionWithTheSystemError) {
  Platform::SetKernelFunctionOverride("IsWow64Process", reinterpret_cast<void*>(&Fails));
  try {
    Wow64::IsWow64();
    FAIL();
  } catch (Wow64Exception& e) {
    EXPECT_EQ(OwTest::Narrow(e.GetMessage()), "Wow64::IsWow64 failure");
    const auto* cause = dynamic_cast<const LumoException::Win32Error*>(e.GetCause());
    ASSERT_NE(cause, nullptr);
    EXPECT_EQ(OwTest::Narrow(cause->m_function), "IsWow64Process");
    EXPECT_EQ(cause->m_error, ERROR_ACCESS_DENIED);
  }
}

TEST_F(Wow64Test, RevertWithAValueNeverObtainedRaises) {
  Platform::SetKernelFunctionOverride("Wow64DisableWow64FsRedirection", reinterpret_cast<void*>(&Disable));
  Platform::SetKernelFunctionOverride("Wow64RevertWow64FsRedirection", reinterpret_cast<void*>(&Revert));
  PVOID old = nullptr;
  Wow64::DisableWow64FsRedirection(&old);
  EXPECT_EQ(old, g_state);
  Wow64::RevertWow64FsRedirection(&old);
  EXPECT_EQ(g_disabled, 0);
  PVOID bogus = reinterpret_cast<PVOID>(0x99);
  try {
    Wow64::RevertWow64FsRedirection(&bogus);
    FAIL();
  } catch (Wow64Exception& e) {
    EXPECT_EQ(OwTest::Narrow(e.GetMessage()), "Wow64::RevertWow64FsRedirection failure");
    const auto* cause = dynamic_cast<const LumoException::Win32Error*>(e.GetCause());
    ASSERT_NE(cause, nullptr);
    EXPECT_EQ(OwTest::Narrow(cause->m_function), "Wow64RevertWow64FsRedirection");
  }
}

}  // namespace
