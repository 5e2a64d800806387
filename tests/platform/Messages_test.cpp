// FormatMessageW and ExpandEnvironmentStringsW.
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

#include "platform/Errors.h"
#include "platform/Messages.h"

using namespace Platform;

namespace {

// Formats `format` with the variable arguments, as the event logger does.
std::u16string Format(DWORD flags, const char16_t* format, ...) {
  char16_t buffer[512];
  va_list args;
  va_start(args, format);
  DWORD n = FormatMessageW(FORMAT_MESSAGE_FROM_STRING | flags, format, 0, 0, buffer, 512, &args);
  va_end(args);
  return n == 0 ? u"<failed " + std::u16string(1, static_cast<char16_t>(u'0' + GetLastError() % 10)) + u">"
                : std::u16string(buffer, n);
}

DWORD FormatArray(const char16_t* format, const DWORD_PTR* array, std::u16string& out, DWORD flags = 0) {
  char16_t buffer[512];
  DWORD n = FormatMessageW(FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ARGUMENT_ARRAY | flags, format, 0, 0, buffer, 512,
                           reinterpret_cast<va_list*>(const_cast<DWORD_PTR*>(array)));
  out.assign(buffer, n);
  return n;
}

}  // namespace

TEST(FormatMessage, InsertsAndEscapes) {
  EXPECT_EQ(Format(0, u"Exception '%1!s!'\r\n(%2!s!)", u"Base:4", u"ctx"), u"Exception 'Base:4'\r\n(ctx)");
  EXPECT_EQ(Format(0, u"%1 and %1 again, %2!d! items, %3!04X!", u"x", -5, 0xAB), u"x and x again, -5 items, 00AB");
  EXPECT_EQ(Format(0, u"100%% sure%.%n%r%t% end%!"), u"100% sure.\r\n\r\t end!");
  EXPECT_EQ(Format(0, u"cut here%0 never seen %1"), u"cut here");
  EXPECT_EQ(Format(0, u"%2 before %1", u"one", u"two"), u"two before one");
  EXPECT_EQ(Format(0, u"%1!I64u! %2!s!", 12345678901234ULL, u"z"), u"12345678901234 z");
  // Explicit sizes take exactly what the caller passed: 32 bits for I32, a pointer for I.
  EXPECT_EQ(Format(0, u"%1!I32d! %2!s! %3!Iu!", -7, u"z", static_cast<size_t>(1) << 40), u"-7 z 1099511627776");
  // Width and precision from the following inserts.
  EXPECT_EQ(Format(0, u"%1!*.*s! %4 %5!*s!", 4, 2, u"Bill", u"Bob", 6, u"Bill"), u"  Bi Bob   Bill");
  // Inserts copied as they stand.
  EXPECT_EQ(Format(FORMAT_MESSAGE_IGNORE_INSERTS, u"%1!s! and %2%n"), u"%1!s! and %2\r\n");
}

TEST(FormatMessage, ArgumentArray) {
  const DWORD_PTR args[] = {reinterpret_cast<DWORD_PTR>(u"File"), 42, reinterpret_cast<DWORD_PTR>(u"x")};
  std::u16string out;
  EXPECT_EQ(FormatArray(u"%1!s!(%2!d!) %3", args, out), 10u);
  EXPECT_EQ(out, u"File(42) x");
  // The insert strings joined by line feeds, as a record that has no message.
  const DWORD_PTR joined[] = {reinterpret_cast<DWORD_PTR>(u"a\nb\nc")};
  FormatArray(u"%1", joined, out);
  EXPECT_EQ(out, u"a\nb\nc");
}

TEST(FormatMessage, LineWidth) {
  const DWORD_PTR none[] = {0};
  std::u16string out;
  FormatArray(u"one\r\ntwo%nthree\r\n", none, out, FORMAT_MESSAGE_MAX_WIDTH_MASK);
  EXPECT_EQ(out, u"one two\r\nthree");
  FormatArray(u"aaa bbb ccc ddd", none, out, 8);
  EXPECT_EQ(out, u"aaa bbb\r\nccc ddd");
}

TEST(FormatMessage, SystemTextsBuffersAndFailures) {
  char16_t buffer[256];
  DWORD n = FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr, ERROR_FILE_NOT_FOUND, 0,
                           buffer, 256, nullptr);
  EXPECT_EQ(std::u16string(buffer, n), u"The file cannot be found.\r\n");
  EXPECT_EQ(FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM, nullptr, 0x12345678, 0, buffer, 256, nullptr), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_MR_MID_NOT_FOUND));
  // No module message table: the system text is the fallback, or 317 without it.
  EXPECT_EQ(FormatMessageW(FORMAT_MESSAGE_FROM_HMODULE, nullptr, 5, 0, buffer, 256, nullptr), 0u);
  EXPECT_NE(FormatMessageW(FORMAT_MESSAGE_FROM_HMODULE | FORMAT_MESSAGE_FROM_SYSTEM, nullptr, 5, 0, buffer, 256, nullptr), 0u);

  // Too small a buffer.
  EXPECT_EQ(FormatMessageW(FORMAT_MESSAGE_FROM_STRING, u"12345", 0, 0, buffer, 5, nullptr), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
  EXPECT_EQ(FormatMessageW(FORMAT_MESSAGE_FROM_STRING, u"12345", 0, 0, buffer, 6, nullptr), 5u);
  // An allocated buffer of at least the size asked for.
  char16_t* allocated = nullptr;
  n = FormatMessageW(FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ALLOCATE_BUFFER, u"allocated", 0, 0,
                     reinterpret_cast<char16_t*>(&allocated), 6144, nullptr);
  ASSERT_NE(allocated, nullptr);
  EXPECT_EQ(std::u16string(allocated, n), u"allocated");
  allocated[6143] = u'x';  // the whole minimum size is usable
  LocalFree(allocated);

  // Malformed templates and inserts without arguments.
  EXPECT_EQ(Format(0, u"%1!f!", 1.0), u"<failed 7>");  // 87
  EXPECT_EQ(Format(0, u"%1!s", u"x"), u"<failed 7>");
  EXPECT_EQ(FormatMessageW(FORMAT_MESSAGE_FROM_STRING, u"%1", 0, 0, buffer, 256, nullptr), 0u);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
}

TEST(ExpandEnvironmentStrings, ReplacesKnownNamesOnly) {
  setenv("OWTEST_DIR", "/opt/ow", 1);
  char16_t buffer[128];
  const char16_t* in = u"%owtest_dir%\\bin;%OWTEST_NOT_SET%;50%";
  DWORD needed = ExpandEnvironmentStringsW(in, nullptr, 0);
  EXPECT_EQ(ExpandEnvironmentStringsW(in, buffer, 128), needed);
  EXPECT_EQ(std::u16string(buffer), u"/opt/ow\\bin;%OWTEST_NOT_SET%;50%");
  EXPECT_EQ(needed, std::u16string(buffer).size() + 1);
  // Too small: the size needed, nothing written.
  buffer[0] = u'#';
  EXPECT_EQ(ExpandEnvironmentStringsW(in, buffer, 4), needed);
  EXPECT_EQ(buffer[0], u'#');
}
