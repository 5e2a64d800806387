// Platform layer: the Win32 rules of the UTF-8 converters, the errno table, system texts and
// debugger output.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <thread>

#include "platform/Debug.h"
#include "platform/Errors.h"
#include "platform/Text.h"
#include "support/TestEnvironment.h"

using namespace Platform;

TEST(PlatformText, SizeQueryThenConversion) {
  const char* text = "a\xC3\xA9\xF0\x9F\x98\x80";  // a, e-acute, U+1F600
  int needed = MultiByteToWideChar(kCodePageUtf8, kMbErrInvalidChars, text, -1, nullptr, 0);
  EXPECT_EQ(needed, 5);  // a, e, surrogate pair, terminator
  char16_t out[5];
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, kMbErrInvalidChars, text, -1, out, 5), 5);
  EXPECT_EQ(std::u16string(out), u"aé\U0001F600");
  // Explicit length without the terminator.
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0, text, 3, out, 5), 2);
}

TEST(PlatformText, TooSmallOutputFailsWithInsufficientBuffer) {
  char16_t out[2];
  SetLastError(0);
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0, "abc", -1, out, 2), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
  char narrow[2];
  EXPECT_EQ(WideCharToMultiByte(kCodePageUtf8, 0, u"é", -1, narrow, 2, nullptr, nullptr), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
}

TEST(PlatformText, LenientAndStrictModes) {
  char16_t out[8];
  // Without the strict flag each bad byte becomes U+FFFD.
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0, "a\xFF" "b", -1, out, 8), 4);
  EXPECT_EQ(out[1], 0xFFFD);
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, kMbErrInvalidChars, "a\xFF" "b", -1, out, 8), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_NO_UNICODE_TRANSLATION));

  const char16_t lone[] = {u'x', 0xDC01, 0};
  char narrow[16];
  EXPECT_EQ(WideCharToMultiByte(kCodePageUtf8, kWcErrInvalidChars, lone, -1, narrow, 16, nullptr, nullptr), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_NO_UNICODE_TRANSLATION));
  EXPECT_EQ(WideCharToMultiByte(kCodePageUtf8, 0, lone, -1, narrow, 16, nullptr, nullptr), 5);
  EXPECT_STREQ(narrow, "x\xEF\xBF\xBD");
}

TEST(PlatformText, RejectsOtherCodePagesAndBadArguments) {
  char16_t out[4];
  EXPECT_EQ(MultiByteToWideChar(1252, 0, "a", -1, out, 4), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0x1, "a", -1, out, 4), 0);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_FLAGS));
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0, nullptr, -1, out, 4), 0);
  EXPECT_EQ(MultiByteToWideChar(kCodePageUtf8, 0, "a", 0, out, 4), 0);
  char narrow[4];
  BOOL used = FALSE;
  EXPECT_EQ(WideCharToMultiByte(kCodePageUtf8, 0, u"a", -1, narrow, 4, "?", &used), 0);
}

TEST(PlatformErrors, LastErrorIsPerThread) {
  SetLastError(ERROR_ACCESS_DENIED);
  DWORD seen = 1;
  std::thread([&] { seen = GetLastError(); }).join();
  EXPECT_EQ(seen, 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
}

TEST(PlatformErrors, ErrnoTable) {
  EXPECT_EQ(Win32ErrorFromErrno(ENOENT), static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
  EXPECT_EQ(Win32ErrorFromErrno(ENOTDIR), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
  EXPECT_EQ(Win32ErrorFromErrno(EACCES), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_EQ(Win32ErrorFromErrno(EEXIST), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  EXPECT_EQ(Win32ErrorFromErrno(ENOSPC), static_cast<DWORD>(ERROR_DISK_FULL));
  EXPECT_EQ(Win32ErrorFromErrno(ENOTEMPTY), static_cast<DWORD>(ERROR_DIR_NOT_EMPTY));
  EXPECT_EQ(Win32ErrorFromErrno(EIO), static_cast<DWORD>(ERROR_IO_DEVICE));
  EXPECT_EQ(Win32ErrorFromErrno(EILSEQ), static_cast<DWORD>(ERROR_NO_UNICODE_TRANSLATION));
  EXPECT_EQ(Win32ErrorFromErrno(99999), static_cast<DWORD>(ERROR_GEN_FAILURE));
  EXPECT_EQ(SetLastErrorFromErrno(EXDEV), static_cast<DWORD>(ERROR_NOT_SAME_DEVICE));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_NOT_SAME_DEVICE));
}

TEST(PlatformErrors, SystemMessagesEndInALineBreakAndHResultsMapToTheirCode) {
  std::u16string text;
  ASSERT_TRUE(GetSystemMessage(ERROR_FILE_NOT_FOUND, text));
  EXPECT_EQ(text.substr(text.size() - 2), u"\r\n");
  std::u16string viaHResult;
  ASSERT_TRUE(GetSystemMessage(0x80070002u, viaHResult));
  EXPECT_EQ(text, viaHResult);
  EXPECT_FALSE(GetSystemMessage(0x7777, text));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_MR_MID_NOT_FOUND));
  EXPECT_FALSE(ErrnoText(ENOENT).empty());
}

TEST(PlatformDebug, OutputIsDroppedUnlessAskedForAndGoesToTheNamedFile) {
  const std::string file = OwTest::MakeTempDirectory() + "/debug.log";
  unsetenv("OWUTILS_DEBUG_OUTPUT");
  OutputDebugStringW(u"dropped\n");
  setenv("OWUTILS_DEBUG_OUTPUT", file.c_str(), 1);
  OutputDebugStringW(u"first line\n");
  OutputDebugStringW(u"Grüße\n");
  OutputDebugStringW(nullptr);
  unsetenv("OWUTILS_DEBUG_OUTPUT");
  std::ifstream in(file);
  std::stringstream all;
  all << in.rdbuf();
  EXPECT_EQ(all.str(), "first line\nGrüße\n");
}

TEST(PlatformDebug, HookCapturesDebugOutputAndMessageBoxes) {
  std::vector<std::string> seen;
  SetOutputHook([&](const char* kind, const std::u16string& text) { seen.push_back(std::string(kind) + "|" + OwTest::Narrow(text)); });
  OutputDebugStringW(u"one");
  EXPECT_EQ(MessageBoxW(nullptr, u"body", u"Caption", kMbIconHand | kMbSystemModal), kIdOk);
  SetOutputHook(nullptr);
  OutputDebugStringW(u"not captured");
  ASSERT_EQ(seen.size(), 2u);
  EXPECT_EQ(seen[0], "debug|one");
  EXPECT_EQ(seen[1], "messagebox|Caption: body");
  EXPECT_FALSE(IsWindow(reinterpret_cast<HWND>(static_cast<uintptr_t>(1))));
}
