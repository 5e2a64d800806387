#include "owutils/StringEncodeDecode.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <iterator>

#include "owutils/Exceptions.h"
#include "support/TestEnvironment.h"

namespace {

using Lumo::String;

// Runs `call`, expecting the wrapping exception `Outer`; returns the class name of its cause
// (empty when there is none) and fills `causeMessage`.
template <typename Outer, typename Call>
std::u16string WrappedCause(Call call, std::u16string* causeMessage = nullptr) {
  try {
    call();
  } catch (Outer& e) {
    if (e.GetCause() == nullptr) return u"";
    if (causeMessage != nullptr) *causeMessage = e.GetCause()->GetMessage();
    return e.GetCause()->GetType().name;
  } catch (LumoException::Exception& e) {
    ADD_FAILURE() << "unexpected " << OwTest::Narrow(e.GetType().name) << ": " << OwTest::Narrow(e.GetMessage());
    return u"<wrong>";
  }
  ADD_FAILURE() << "nothing was thrown";
  return u"<none>";
}

TEST(Utf8Conversion, RoundTripsAndSubstitutes) {
  EXPECT_EQ(Lumo::WideToUtf8(u"Gr\u00fc\u00dfe \u4e2d \U0001F600"), "Gr\xC3\xBC\xC3\x9F" "e \xE4\xB8\xAD \xF0\x9F\x98\x80");
  EXPECT_EQ(Lumo::Utf8ToWide("\xC4\xBC\xC4\xA6"), String(u"\u013C\u0126"));
  EXPECT_EQ(Lumo::WideToUtf8(u""), "");
  EXPECT_EQ(Lumo::Utf8ToWide(""), String());
  // Not rejected: bad input is replaced.
  EXPECT_EQ(Lumo::Utf8ToWide("a\xFF" "b"), String(u"a\uFFFDb"));
  const char16_t lone[] = {u'x', 0xD800, u'y', 0};
  EXPECT_EQ(Lumo::WideToUtf8(lone), "x\xEF\xBF\xBDy");
}

TEST(Utf8Conversion, NullInputIsAPrecondition) {
  try {
    Lumo::WideToUtf8(nullptr);
    FAIL();
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(e.m_expression, String(u"pStrIn != NULL"));
  }
  EXPECT_THROW(Lumo::Utf8ToWide(nullptr), LumoException::PreconditionFailed0);
  // Null is checked before any work and never wrapped.
  EXPECT_THROW(Lumo::EncodeURI(nullptr), LumoException::PreconditionFailed0);
  EXPECT_THROW(Lumo::DecodeURI(nullptr), LumoException::PreconditionFailed0);
  EXPECT_THROW(Lumo::EncodeSpecialChars(nullptr), LumoException::PreconditionFailed0);
  EXPECT_THROW(Lumo::DecodeSpecialChars(nullptr), LumoException::PreconditionFailed0);
}

TEST(HexDigitValue, BothCasesAndRejects) {
  EXPECT_EQ(Lumo::HexDigitValue('0'), 0u);
  EXPECT_EQ(Lumo::HexDigitValue('9'), 9u);
  EXPECT_EQ(Lumo::HexDigitValue('a'), 10u);
  EXPECT_EQ(Lumo::HexDigitValue('F'), 15u);
  EXPECT_EQ(Lumo::HexDigitValue(u'f'), 15u);
  EXPECT_EQ(Lumo::HexDigitValue(u'B'), 11u);
  for (char c : {'g', 'G', '%', ' ', '/', ':', '@', '\0', '\xC3'}) EXPECT_GT(Lumo::HexDigitValue(c), 15u) << int(c);
  for (char16_t c : {u'g', u'Z', u'\u212A', u'\uFF21', u'\u0130'}) EXPECT_GT(Lumo::HexDigitValue(c), 15u) << int(c);
}

TEST(EncodeURI, EscapesAllButUnreserved) {
  EXPECT_EQ(Lumo::EncodeURI(u"a b"), String(u"a%20b"));
  EXPECT_EQ(Lumo::EncodeURI(u"\u00e9"), String(u"%C3%A9"));
  EXPECT_EQ(Lumo::EncodeURI(u"A-Z_a.z~0"), String(u"A-Z_a.z~0"));
  EXPECT_EQ(Lumo::EncodeURI(u"x&y=z?%/"), String(u"x%26y%3Dz%3F%25%2F"));
  EXPECT_EQ(Lumo::EncodeURI(u""), String());
}

TEST(DecodeURI, DecodesEscapes) {
  EXPECT_EQ(Lumo::DecodeURI(u"a%20b"), String(u"a b"));
  EXPECT_EQ(Lumo::DecodeURI(u"%c3%A9"), String(u"\u00e9"));
  // A percent sign without two following characters is copied literally.
  EXPECT_EQ(Lumo::DecodeURI(u"ab%"), String(u"ab%"));
  EXPECT_EQ(Lumo::DecodeURI(u"ab%4"), String(u"ab%4"));
  // Unescaped non-ASCII text passes through.
  EXPECT_EQ(Lumo::DecodeURI(u"\u4e2d%20x"), String(u"\u4e2d x"));
}

TEST(DecodeURI, EscapedNulDoesNotCutTheText) {
  const String decoded = Lumo::DecodeURI(u"a%00b");
  ASSERT_EQ(decoded.size(), 3u);
  EXPECT_EQ(decoded, String(u"a\0b", 3));
}

TEST(DecodeURI, StrictFailuresCarryInputAndCause) {
  std::u16string causeMessage;
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeStringFromURI>([] { Lumo::DecodeURI(u"%41"); }, &causeMessage),
            u"LumoStringInvalidDecodedCharA");
  EXPECT_EQ(causeMessage, u"'A' is not a valid decoded character.");
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeStringFromURI>([] { Lumo::DecodeURI(u"%G0"); }, &causeMessage),
            u"LumoStringInvalidHexCharA");
  EXPECT_EQ(causeMessage, u"'G' is not a valid hexadecimal character.");
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeStringFromURI>([] { Lumo::DecodeURI(u"ok%2x"); }, &causeMessage),
            u"LumoStringInvalidHexCharA");
  EXPECT_EQ(causeMessage, u"'x' is not a valid hexadecimal character.");
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeStringFromURI>([] { Lumo::DecodeURI(u"%7e"); }),
            u"LumoStringInvalidDecodedCharA");

  try {
    Lumo::DecodeURI(u"abc%41def");
    FAIL();
  } catch (LumoStringUnableToDecodeStringFromURI& e) {
    EXPECT_EQ(e.m_text, String(u"abc%41def"));
    EXPECT_EQ(e.GetMessage(), String(u"Unable to decode URI string 'abc%41def'."));
    EXPECT_EQ(e.GetType().module, std::u16string(u"LumoString"));
    EXPECT_EQ(e.GetType().code, 50);
  }
}

TEST(SpecialChars, Encode) {
  EXPECT_EQ(Lumo::EncodeSpecialChars(u"a/b c"), String(u"a%2Fb c"));
  EXPECT_EQ(Lumo::EncodeSpecialChars(u"a\tb\r\n"), String(u"a\tb\r\n"));
  EXPECT_EQ(Lumo::EncodeSpecialChars(u"\u00fc\u4e2d"), String(u"\u00fc\u4e2d"));
  EXPECT_EQ(Lumo::EncodeSpecialChars(u"%\x01\x7F"), String(u"%25%01%7F"));
}

TEST(SpecialChars, Decode) {
  EXPECT_EQ(Lumo::DecodeSpecialChars(u"a%2Fb"), String(u"a/b"));
  EXPECT_EQ(Lumo::DecodeSpecialChars(u"a%2fb"), String(u"a/b"));
  EXPECT_EQ(Lumo::DecodeSpecialChars(u"%"), String(u"%"));
  EXPECT_EQ(Lumo::DecodeSpecialChars(u"x%"), String(u"x%"));
  EXPECT_EQ(Lumo::DecodeSpecialChars(u"x%2"), String(u"x%2"));

  std::u16string causeMessage;
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeSpecialCharsInString>([] { Lumo::DecodeSpecialChars(u"%41"); },
                                                                       &causeMessage),
            u"LumoStringInvalidDecodedCharW");
  EXPECT_EQ(causeMessage, u"'A' is not a valid decoded character.");
  // White space and non-ASCII values are never escaped either.
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeSpecialCharsInString>([] { Lumo::DecodeSpecialChars(u"%20"); }),
            u"LumoStringInvalidDecodedCharW");
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeSpecialCharsInString>([] { Lumo::DecodeSpecialChars(u"%E9"); }),
            u"LumoStringInvalidDecodedCharW");
  EXPECT_EQ(WrappedCause<LumoStringUnableToDecodeSpecialCharsInString>([] { Lumo::DecodeSpecialChars(u"%\u00e92"); },
                                                                       &causeMessage),
            u"LumoStringInvalidHexCharW");
  EXPECT_EQ(causeMessage, u"'\u00e9' is not a valid hexadecimal character.");
}

TEST(Encodings, DecodersOnlyEverRaiseTheirOwnFailure) {
  const char16_t alphabet[] = {u'%', u'%', u'0', u'9', u'a', u'F', u'g', u'G', u' ', u'/', u'~', u'\u00e9', u'\u4e2d', 0xD800};
  std::uint32_t seed = 2024;
  auto next = [&seed] { return seed = seed * 1664525u + 1013904223u; };
  for (int round = 0; round < 3000; ++round) {
    String text;
    for (int n = next() % 9; n > 0; --n) text.push_back(alphabet[next() % std::size(alphabet)]);
    try {
      Lumo::DecodeURI(text.c_str());
    } catch (LumoStringUnableToDecodeStringFromURI& e) {
      EXPECT_EQ(e.m_text, text);
      ASSERT_NE(e.GetCause(), nullptr);
    }
    try {
      Lumo::DecodeSpecialChars(text.c_str());
    } catch (LumoStringUnableToDecodeSpecialCharsInString& e) {
      EXPECT_EQ(e.m_text, text);
      ASSERT_NE(e.GetCause(), nullptr);
    }
  }
}

TEST(Encodings, RoundTripWellFormedText) {
  const char16_t* samples[] = {
      u"",
      u"plain",
      u"100% sure? a/b\\c & <d> \"e\" 'f'",
      u"\u013Cetvi\u0161u \u0126 \u4e2d\u6587 \U0001F600",
      u"tab\tnew\nline\r\x01\x1F\x7F",
      u"-_.~ !#$&'()*+,/:;=?@[]",
  };
  for (const char16_t* text : samples) {
    EXPECT_EQ(Lumo::DecodeURI(Lumo::EncodeURI(text).c_str()), String(text)) << OwTest::Narrow(text);
    EXPECT_EQ(Lumo::DecodeSpecialChars(Lumo::EncodeSpecialChars(text).c_str()), String(text))
        << OwTest::Narrow(text);
  }
}

}  // namespace

