// Inputs found by the fuzz targets (fuzz/), kept as tests. Each case names the target that
// found it; its raw input also stays in that target's seed corpus.
#include <gtest/gtest.h>

#include "GuardedMemory.h"
#include "support/TestEnvironment.h"
#include "owutils/Exceptions.h"
#include "owutils/RemoteException.h"
#include "owutils/tstring.h"
#include "platform/Errors.h"
#include "platform/Messages.h"

namespace {

// format: "%.3ws" with an array of exactly three units and no terminator. A precision bounds
// what is read, so the array need not be terminated; the engine read one unit past it.
TEST(FuzzRegressionFormat, PrecisionBoundsAnUnterminatedWideString) {
  const char16_t units[] = {u'a', u'b', u'c'};
  OwTest::GuardedArray<char16_t> text(units, 3);
  Lumo::String s;
  s.Format(u"[%.3ws|%.2s|%-5.3s]", text.get(), text.get(), text.get());
  EXPECT_EQ(s, u"[abc|ab|abc  ]");
}

// format: "%.3hs" with an unterminated narrow array: the precision bounds what is read there too
// (the narrow text used to be measured with strlen before its precision applied).
TEST(FuzzRegressionFormat, PrecisionBoundsAnUnterminatedNarrowString) {
  const char bytes[] = {'x', '\xC3', '\xA9', 'z'};  // x, e-acute, z
  OwTest::GuardedArray<char> text(bytes, 4);
  Lumo::String s;
  s.Format(u"[%.3hs|%.2hs]", text.get(), text.get());
  EXPECT_EQ(s, u"[x\u00e9z|x\u00e9]");
}

// xml: the text " " (not XML, so it becomes the message) written with ToXml and read back
// came back with an empty message: the XML parser drops element text made only of white space.
TEST(FuzzRegressionXml, MessageOfOnlyWhiteSpaceSurvivesTheExchange) {
  for (const char16_t* text : {u" ", u"\t\r\n", u"  "}) {
    LumoException::RemoteException first{Lumo::String(text)};
    ASSERT_EQ(first.GetMessage(), Lumo::String(text));
    LumoException::RemoteException second(LumoException::ToXml(first));
    EXPECT_EQ(second.GetMessage(), first.GetMessage());
  }
}

// xml: a message with white space around other text keeps it.
TEST(FuzzRegressionXml, WhiteSpaceAroundTextSurvivesTheExchange) {
  LumoException::RemoteException first{Lumo::String(u"  a b \r\n")};
  LumoException::RemoteException second(LumoException::ToXml(first));
  EXPECT_EQ(second.GetMessage(), first.GetMessage());
}

// messages: an insert's printf format holding a '%' of its own ("%1!s%s!") was handed
// to the printf engine as a whole format, which then read further arguments than the one the
// insert supplies: garbage from the registers, or a crash for a further %s. Such a
// format is refused like any other malformed insert. So is one with more than the two
// '*' a width and a precision can take ("%1!*.*.*s!" wrote a third width past its array), and
// one with anything after its conversion: in "%49!S .*s!" the engine took %S and read the
// width meant for the '*' as a string pointer.
TEST(FuzzRegressionMessages, InsertSpecificationWithItsOwnPercentIsRefused) {
  const char16_t* texts[] = {u"one", u"two", u"three", u"four", u"five", u"six", u"seven", u"eight"};
  for (const char16_t* format : {u"%1!s%s!", u"%1!d%A!", u"%2!A%hA% ad nos!", u"%1!%!", u"%1!*%s!", u"%1!*.*.*s!", u"%1!***s!", u"%4!S .*s!",
                             u"%1!s*!", u"%1!d x!"}) {
    char16_t buffer[256] = {};
    Platform::SetLastError(ERROR_SUCCESS);
    const DWORD n = Platform::FormatMessageW(FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ARGUMENT_ARRAY, format, 0, 0,
                                             buffer, 256, reinterpret_cast<va_list*>(texts));
    EXPECT_EQ(n, 0u) << OwTest::Narrow(format);
    EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER)) << OwTest::Narrow(format);
  }
  // Well-formed formats still work.
  DWORD_PTR widths[] = {reinterpret_cast<DWORD_PTR>(u"one"), reinterpret_cast<DWORD_PTR>(u"two"), 5, 2,
                              reinterpret_cast<DWORD_PTR>(u"four")};
  char16_t buffer[256] = {};
  const DWORD n = Platform::FormatMessageW(FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ARGUMENT_ARRAY,
                                           u"%1!s! %2!5s!|%%|%3!-*.*s!|", 0, 0, buffer, 256,
                                           reinterpret_cast<va_list*>(widths));
  EXPECT_EQ(std::u16string(buffer, n), u"one   two|%|fo   |");
}

}  // namespace
