// Environment variables and console streams through the platform layer.
#include <gtest/gtest.h>

#include "owutils/Environment.h"
#include "platform/Errors.h"

using namespace Platform;

TEST(Environment, SetGetAndRemoveWithTheWin32SizeProtocol) {
  ASSERT_TRUE(SetEnvironmentVariableW(u"OWUTILS_TEST_VAR", u"Grüße"));
  EXPECT_EQ(GetEnvironmentVariableW(u"OWUTILS_TEST_VAR", nullptr, 0), 6u);  // needed, with terminator
  char16_t small[3];
  EXPECT_EQ(GetEnvironmentVariableW(u"OWUTILS_TEST_VAR", small, 3), 6u);
  char16_t buffer[6];
  EXPECT_EQ(GetEnvironmentVariableW(u"OWUTILS_TEST_VAR", buffer, 6), 5u);
  EXPECT_EQ(std::u16string(buffer), u"Grüße");
  ASSERT_TRUE(SetEnvironmentVariableW(u"OWUTILS_TEST_VAR", nullptr));
  EXPECT_EQ(GetEnvironmentVariableW(u"OWUTILS_TEST_VAR", buffer, 6), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ENVVAR_NOT_FOUND));
  EXPECT_FALSE(SetEnvironmentVariableW(u"A=B", u"x"));
  EXPECT_FALSE(SetEnvironmentVariableW(u"", u"x"));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
}

TEST(Environment, UnknownStreamsAreNoConsole) {
  EXPECT_FALSE(IsConsoleStream(12345));
}
