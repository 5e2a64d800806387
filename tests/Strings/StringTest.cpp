// Lumo::String conversions, editing and lists; CString; the whitespace tokenizer.
#include <gtest/gtest.h>

#include <clocale>
#include <cstring>

#include "owutils/CString.h"
#include "owutils/Exceptions.h"
#include "support/TestEnvironment.h"

using OwTest::Narrow;

TEST(StringConstruction, NullPointersGiveEmptyStrings) {
  Lumo::String a(static_cast<const char16_t*>(nullptr));
  EXPECT_TRUE(a.empty());
  Lumo::String b(u"x");
  b = static_cast<const char16_t*>(nullptr);
  EXPECT_TRUE(b.empty());
  Lumo::String c(static_cast<const char*>(nullptr));
  EXPECT_TRUE(c.empty());
  EXPECT_TRUE(CString(static_cast<const char16_t*>(nullptr)).IsEmpty());
}

TEST(StringUtf8, RoundTripKeepsEveryPlane) {
  const char* text = "plain, Grüße, 東京, \U0001F600 and Ω";
  Lumo::String s(text);
  EXPECT_EQ(s.size(), std::u16string(u"plain, Grüße, 東京, \U0001F600 and Ω").size());
  Lumo::CharArrayHolder back = s.ToUtf8();
  EXPECT_STREQ(back.Get(), text);
}

TEST(StringUtf8, EmptyTextConvertsWithoutError) {
  Lumo::String s(u"previous");
  s.AssignUtf8("");
  EXPECT_TRUE(s.empty());
  Lumo::CharArrayHolder empty = Lumo::String().ToUtf8();
  ASSERT_NE(empty.Get(), nullptr);
  EXPECT_EQ(empty.Get()[0], '\0');
}

TEST(StringUtf8, InvalidSequencesRaiseWithTheConverterAsCause) {
  const char* invalid[] = {"\xC3", "a\xFFz", "\xED\xA0\x80" /* encoded surrogate */, "\xC0\xAF" /* overlong */,
                           "\xF4\x90\x80\x80" /* beyond U+10FFFF */};
  for (const char* text : invalid) {
    Lumo::String s(u"previous");
    try {
      s.AssignUtf8(text);
      ADD_FAILURE() << "accepted invalid UTF-8";
    } catch (LumoStringNarrowToWideFailed& e) {
      EXPECT_EQ(Narrow(e.GetMessage()), "Unable to convert string to UTF-16");
      auto* cause = dynamic_cast<const LumoException::Win32ErrorCode*>(e.GetCause());
      ASSERT_NE(cause, nullptr);
      EXPECT_EQ(Narrow(cause->m_function), "MultiByteToWideChar");
      EXPECT_EQ(cause->m_error, 1113);
    }
    EXPECT_TRUE(s.empty());
  }
}

TEST(StringUtf8, NarrowConstructorAddsItsPlaceToTheHistory) {
  try {
    Lumo::String s("bad \xFF");
    FAIL();
  } catch (LumoStringNarrowToWideFailed& e) {
    // thrown in AssignUtf8, then checkpointed and rethrown by the constructor
    ASSERT_EQ(e.GetHistory().size(), 3u);
    EXPECT_EQ(e.GetHistory()[0].kind, LumoException::Thrown);
    EXPECT_EQ(e.GetHistory()[1].kind, LumoException::Checkpointed);
    EXPECT_EQ(Narrow(e.GetHistory()[2].file), "Strings/tstring.cpp");
  }
}

TEST(StringUtf8, UnpairedSurrogateBecomesTheReplacementCharacter) {
  // Windows converts with flags 0 without failing: a lone surrogate comes out as U+FFFD.
  Lumo::String s(u"a");
  s.push_back(static_cast<char16_t>(0xD800));
  s.push_back(u'b');
  EXPECT_STREQ(s.ToUtf8().Get(), "a\xEF\xBF\xBD" "b");
}

TEST(StringAnsi, ConvertsThroughTheCurrentLocale) {
  const char* previous = std::setlocale(LC_CTYPE, nullptr);
  std::string saved = previous != nullptr ? previous : "C";
  if (std::setlocale(LC_CTYPE, "C.UTF-8") == nullptr) GTEST_SKIP() << "no C.UTF-8 locale";
  Lumo::String s;
  s.AssignAnsi("Grüße");
  EXPECT_EQ(Narrow(s), "Grüße");
  EXPECT_STREQ(s.ToAnsi().Get(), "Grüße");
  s.AssignAnsi("bad \xFF");  // unconvertible: empty, no report
  EXPECT_TRUE(s.empty());
  Lumo::String lone;
  lone.push_back(static_cast<char16_t>(0xDC00));
  try {
    lone.ToAnsi();
    ADD_FAILURE();
  } catch (LumoStringWideToNarrow& e) {
    auto* cause = dynamic_cast<const LumoException::AssertionFailed1*>(e.GetCause());
    ASSERT_NE(cause, nullptr);
    EXPECT_EQ(Narrow(cause->m_expression), "err == 0");
  }
  std::setlocale(LC_CTYPE, saved.c_str());
}

TEST(StringEditing, Trim) {
  Lumo::String s(u" \t a b \r\n");
  EXPECT_EQ(Narrow(s.Trim(nullptr)), "a b");
  Lumo::String only(u" \t\r\n ");
  EXPECT_TRUE(only.Trim(nullptr).empty());
  Lumo::String quoted(u"\"Orbis Works\"");
  EXPECT_EQ(Narrow(quoted.Trim(u"\"")), "Orbis Works");
}

TEST(StringEditing, CompareNoCase) {
  EXPECT_EQ(Lumo::String(u"Software").CompareNoCase(u"SOFTWARE"), 0);
  EXPECT_LT(Lumo::String(u"abc").CompareNoCase(u"ABD"), 0);
  EXPECT_GT(Lumo::String(u"abcd").CompareNoCase(u"ABC"), 0);
  EXPECT_GT(Lumo::String(u"a").CompareNoCase(nullptr), 0);
}

TEST(StringSplit, MaxCountAndCutLast) {
  Lumo::String s(u"a,b,c");
  Lumo::StringList keep = s.Split(u",", 2, false);
  ASSERT_EQ(keep.size(), 2u);
  EXPECT_EQ(Narrow(keep[0]), "a");
  EXPECT_EQ(Narrow(keep[1]), "b,c");
  Lumo::StringList cut = s.Split(u",", 2, true);
  ASSERT_EQ(cut.size(), 2u);
  EXPECT_EQ(Narrow(cut[1]), "b");
  EXPECT_EQ(s.Split(u",", 10, false).size(), 3u);
  EXPECT_TRUE(s.Split(u",", 0, false).empty());
}

TEST(StringSplit, DelimiterIsAWholeStringAndATrailingOneGivesAnEmptyElement) {
  Lumo::StringList parts = Lumo::String(u"a::b:c::").Split(u"::", 10, false);
  ASSERT_EQ(parts.size(), 3u);
  EXPECT_EQ(Narrow(parts[1]), "b:c");
  EXPECT_TRUE(parts[2].empty());
  Lumo::StringList trailing = Lumo::String(u"a,").Split(u",", 5, true);
  ASSERT_EQ(trailing.size(), 2u);
  EXPECT_TRUE(trailing[1].empty());
}

TEST(StringSplit, EmptyDelimiterEndsWithTheWholeString) {
  Lumo::StringList parts = Lumo::String(u"abc").Split(u"", 5, false);
  ASSERT_EQ(parts.size(), 1u);
  EXPECT_EQ(Narrow(parts[0]), "abc");
  EXPECT_TRUE(Lumo::String(u"abc").Split(u"", 0, true).empty());
}

TEST(StringList, MultiStringsAndJoin) {
  Lumo::StringList list(u"x\0y\0\0");
  ASSERT_EQ(list.size(), 2u);
  EXPECT_EQ(Narrow(list.Join(nullptr, false)), "xy");
  EXPECT_EQ(Narrow(list.Join(u", ", true)), "y, x");
  EXPECT_TRUE(Lumo::StringList(u"\0x\0\0").empty());
  EXPECT_TRUE(Lumo::StringList(static_cast<const char16_t*>(nullptr)).empty());
  list.AssignMultiString(u"only\0\0");
  EXPECT_EQ(list.size(), 1u);
}

TEST(StringList, OutOfRangeAccessRaisesSTLException) {
  Lumo::StringList list{u"a", u"b"};
  EXPECT_EQ(Narrow(list.GetAt(1)), "b");
  try {
    list.GetAt(2);
    FAIL();
  } catch (LumoException::STLException& e) {
    EXPECT_EQ(Narrow(e.GetMessage()), "invalid vector<T> subscript");
  }
  EXPECT_THROW(list[5], LumoException::STLException);
  const Lumo::StringList& constList = list;
  EXPECT_THROW(constList[2], LumoException::STLException);
}

TEST(WhitespaceTokenizer, WordsAndSeparatorTokens) {
  Lumo::WhitespaceTokenizer tokens(u"ab  c\n");
  ASSERT_EQ(tokens.GetTokenCount(), 5u);
  EXPECT_EQ(std::u16string(tokens.GetToken(0)), u"ab");
  EXPECT_EQ(tokens.GetToken(1)[0], u' ');
  EXPECT_EQ(tokens.GetToken(2)[0], u' ');
  EXPECT_EQ(std::u16string(tokens.GetToken(3)), u"c");
  EXPECT_EQ(tokens.GetToken(4)[0], u'\n');
  EXPECT_EQ(tokens.GetToken(5), nullptr);

  Lumo::WhitespaceTokenizer::Cursor cursor(tokens);
  EXPECT_EQ(cursor.Previous(), nullptr);
  EXPECT_EQ(std::u16string(cursor.Next()), u"ab");
  cursor.Next();
  EXPECT_EQ(cursor.Previous()[0], u' ');
  EXPECT_EQ(std::u16string(cursor.Previous()), u"ab");
  for (int i = 0; i < 5; ++i) cursor.Next();
  EXPECT_EQ(cursor.Next(), nullptr);

  Lumo::WhitespaceTokenizer empty(nullptr);
  EXPECT_EQ(empty.GetTokenCount(), 0u);
  EXPECT_EQ(empty.GetToken(0), nullptr);
}

TEST(StringResources, MissingResourceRaisesResourceNotFound) {
  Lumo::String s(u"previous");
  try {
    s.LoadString(42, nullptr);
    FAIL();
  } catch (LumoStringResourceNotFound& e) {
    EXPECT_EQ(Narrow(e.GetMessage()), "Resource not found: 42");
    auto* cause = dynamic_cast<const LumoException::Win32Error*>(e.GetCause());
    ASSERT_NE(cause, nullptr);
    EXPECT_EQ(Narrow(cause->m_function), "LoadString");
  }
  EXPECT_TRUE(s.empty());
}

TEST(CString, EditingAndSearch) {
  CString path(u"C:\\data\\report.txt");
  EXPECT_EQ(path.ReverseFind(u'\\'), 7);
  EXPECT_EQ(path.Left(2), u"C:");
  EXPECT_EQ(path.Mid(8), u"report.txt");
  EXPECT_EQ(path.Mid(3, 4), u"data");
  EXPECT_EQ(path.Right(3), u"txt");
  EXPECT_EQ(path.Left(100), path);
  EXPECT_EQ(path.Mid(100), u"");
  EXPECT_EQ(path.Find(u"data"), 3);
  EXPECT_EQ(path.Find(u'z'), -1);
  EXPECT_EQ(path.FindOneOf(u".:"), 1);

  CString s(u"  a-b-c  ");
  s.Trim();
  EXPECT_EQ(s, u"a-b-c");
  EXPECT_EQ(s.Replace(u"-", u"--"), 2);
  EXPECT_EQ(s, u"a--b--c");
  EXPECT_EQ(s.Remove(u'-'), 4);
  s.Insert(1, u"+");
  s.Delete(0);
  EXPECT_EQ(s, u"+bc");
  s.MakeUpper();
  EXPECT_EQ(s.CompareNoCase(u"+BC"), 0);
  EXPECT_EQ(s.CompareNoCase(u"+bc"), 0);

  char16_t* buffer = s.GetBuffer(10);
  std::memcpy(buffer, u"xyz", 4 * sizeof(char16_t));
  s.ReleaseBuffer();
  EXPECT_EQ(s.GetLength(), 3);
  EXPECT_EQ(CString(u"a") + u"b" + CString(u"c") + u'd', u"abcd");
}
