#include <gtest/gtest.h>

#include <cstdint>
#include <iterator>
#include <memory>
#include <string>

#include "owutils/Exceptions.h"
#include "owutils/RemoteException.h"
#include "support/TestEnvironment.h"

namespace {

using LumoException::Exception;
using LumoException::RemoteException;
using LumoException::ToXml;
using Lumo::String;

std::string N(const std::u16string& s) { return OwTest::Narrow(s); }

size_t ChainLength(const Exception& e) {
  size_t n = 0;
  for (const Exception* p = &e; p != nullptr; p = p->GetCause()) ++n;
  return n;
}

void ThrowInner() {
  LumoException::UnexpectedValue inner(u"\u013Cauj\u0101 \u0126al \u4e2d\u6587 \u0437\u043d\u0430\u0447\u0435\u043d\u0438\u0435", 7);
  inner.SetUserMessage(u"\u0412\u043d\u0443\u0442\u0440\u0438 <&>");
  THROW_AT(inner);
}

void ThrowMiddle() {
  try {
    CHECKPOINT_TRY
      ThrowInner();
    CHECKPOINT_CATCH
  } catch (Exception& e) {
    THROW_AT(LumoStringUnableToDecodeStringFromURI(String(u"\u0126ello \u013C \"quoted\" & 'single'"), e));
  }
}

// Three deep: AssertionFailed1 <- LumoStringUnableToDecodeStringFromURI <- UnexpectedValue.
void ThrowOuter() {
  try {
    ThrowMiddle();
  } catch (Exception& e) {
    LumoException::AssertionFailed1 outer(String(u"status == 0"), 1, e);
    outer.SetUserMessage(u"\u65e5\u672c\u8a9e\u306e\u30e1\u30c3\u30bb\u30fc\u30b8");
    THROW_AT(outer);
  }
}

void ExpectSameException(const Exception& original, const Exception& copy) {
  const Exception* a = &original;
  const Exception* b = &copy;
  for (int level = 0; a != nullptr; ++level, a = a->GetCause(), b = b->GetCause()) {
    SCOPED_TRACE(level);
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(std::u16string(a->GetType().name), std::u16string(b->GetType().name));
    EXPECT_EQ(std::u16string(a->GetType().module), std::u16string(b->GetType().module));
    EXPECT_EQ(a->GetType().code, b->GetType().code);
    EXPECT_EQ(N(a->GetMessage()), N(b->GetMessage()));
    EXPECT_EQ(N(a->GetUserMessage()), N(b->GetUserMessage()));
    ASSERT_EQ(a->GetHistory().size(), b->GetHistory().size());
    for (size_t i = 0; i < a->GetHistory().size(); ++i) {
      EXPECT_EQ(a->GetHistory()[i].file, b->GetHistory()[i].file);
      EXPECT_EQ(a->GetHistory()[i].line, b->GetHistory()[i].line);
      EXPECT_EQ(a->GetHistory()[i].kind, b->GetHistory()[i].kind);
    }
  }
  EXPECT_EQ(b, nullptr);
}

TEST(ExceptionXml, WritesTypeMessageAndEmptyHistory) {
  LumoException::PreconditionFailed0 e(String(u"p != NULL"));
  const String xml = ToXml(e);
  EXPECT_NE(xml.find(u"<exception name=\"PreconditionFailed0\" module=\"Base\" code=\"4\">"), String::npos) << N(xml);
  EXPECT_NE(xml.find(u"<message>precondition failed for expression &apos;p != NULL&apos;</message>"),
            String::npos)
      << N(xml);
  EXPECT_NE(xml.find(u"<history/>"), String::npos) << N(xml);
  EXPECT_EQ(xml.find(u"usermessage"), String::npos);
  EXPECT_EQ(xml.find(u"<?xml"), String::npos);
}

TEST(ExceptionXml, RoundTripThreeDeepChainWithNonLatinText) {
  try {
    ThrowOuter();
    FAIL();
  } catch (Exception& original) {
    ASSERT_EQ(ChainLength(original), 3u);
    const String xml = ToXml(original);
    // The characters whose low bytes are '<' (U+013C) and '&' (U+0126) are written as they are.
    EXPECT_NE(xml.find(u"\u013Cauj\u0101"), String::npos);
    EXPECT_NE(xml.find(u"\u0126ello"), String::npos);

    RemoteException remote(xml);
    ExpectSameException(original, remote);
    EXPECT_EQ(N(remote.GetRootCauseId()), N(original.GetRootCauseId()));
    EXPECT_EQ(N(remote.GetRootCauseId()), "Base:11");
    EXPECT_EQ(N(remote.ToString()), N(original.ToString()));
    // Writing the re-created exception gives the same text again.
    EXPECT_EQ(N(ToXml(remote)), N(xml));
  }
}

TEST(ExceptionXml, MessagesKeepWhitespaceMarkupAndEmptiness) {
  for (const char16_t* message : {u"  two\r\n\tlines  ", u"", u"a < b && c > \"d\" 'e' ]]> <!-- x -->", u"\U0001F600 \u00e9"}) {
    LumoException::Exception e(message);
    e.SetUserMessage(message);
    RemoteException remote(ToXml(e));
    EXPECT_EQ(N(remote.GetMessage()), N(message));
    EXPECT_EQ(N(remote.GetUserMessage()), *message != 0 ? N(message) : "");
    EXPECT_EQ(std::u16string(remote.GetType().name), u"Exception");
  }
}

TEST(ExceptionXml, ReadsRawNonLatinMarkupLookalikes) {
  // Hand-written XML (not from ToXml) with U+013C and U+0126 in values and attributes.
  RemoteException remote(
      u"<exception name=\"\u013C\u0126\" module=\"M\u0126\" code=\"-3\"><message>a\u013Cb\u0126c</message>"
      u"<history><event type=\"1\" filename=\"d\u013C\\f.cpp\" linenumber=\"12\"/></history></exception>");
  EXPECT_EQ(std::u16string(remote.GetType().name), u"\u013C\u0126");
  EXPECT_EQ(std::u16string(remote.GetType().module), u"M\u0126");
  EXPECT_EQ(remote.GetType().code, -3);
  EXPECT_EQ(remote.GetMessage(), String(u"a\u013Cb\u0126c"));
  ASSERT_EQ(remote.GetHistory().size(), 1u);
  EXPECT_EQ(remote.GetHistory()[0].file, String(u"d\u013C\\f.cpp"));
  EXPECT_EQ(remote.GetHistory()[0].kind, 1);
}

TEST(ExceptionXml, TextThatIsNotAnExceptionKeepsTheRawText) {
  for (const char16_t* text : {u"no markup here", u"<exception name=\"X\"><message>unclosed", u"<other/>", u""}) {
    RemoteException remote(text);
    EXPECT_EQ(remote.GetMessage(), String(text));
    EXPECT_EQ(std::u16string(remote.GetType().name), u"RemoteException");
    EXPECT_EQ(std::u16string(remote.GetType().module), u"");
    EXPECT_EQ(remote.GetType().code, 0);
    EXPECT_EQ(remote.GetCause(), nullptr);
  }
}

TEST(ExceptionXml, ReaderDefaultsAndTolerance) {
  RemoteException remote(
      u"\uFEFF<exception name=\"N\" extra=\"x\" code=\"  42abc\">"
      u"<history><event/><event filename=\"a/b/c/d.cpp\"/><entry type=\"5\" linenumber=\"-9\"/></history>"
      u"<unknown>zzz</unknown><message/>"
      u"<exception name=\"First\"><message>one</message></exception>"
      u"<exception name=\"Second\"><message>two</message></exception>"
      u"</exception>");
  EXPECT_EQ(std::u16string(remote.GetType().name), u"N");
  EXPECT_EQ(std::u16string(remote.GetType().module), u"");
  EXPECT_EQ(remote.GetType().code, 42);
  EXPECT_EQ(remote.GetMessage(), String());
  const auto& history = remote.GetHistory();
  ASSERT_EQ(history.size(), 3u);
  EXPECT_EQ(history[0].file, String());
  EXPECT_EQ(history[0].line, -1);
  EXPECT_EQ(history[0].kind, 0);
  EXPECT_EQ(history[1].file, String(u"a/b/c/d.cpp"));  // as written, not shortened
  EXPECT_EQ(history[2].line, -9);
  EXPECT_EQ(history[2].kind, 5);
  // Only the first nested exception becomes the cause.
  ASSERT_EQ(ChainLength(remote), 2u);
  EXPECT_EQ(std::u16string(remote.GetCause()->GetType().name), u"First");
  EXPECT_EQ(remote.GetCause()->GetMessage(), String(u"one"));
}

String NestedExceptions(int count) {
  String xml;
  for (int i = 0; i < count; ++i) xml.AppendFormat(u"<exception name=\"E%d\"><message>m%d</message>", i, i);
  for (int i = 0; i < count; ++i) xml += u"</exception>";
  return xml;
}

TEST(ExceptionXml, CauseChainIsReadToAFixedDepth) {
  RemoteException exact(NestedExceptions(RemoteException::kMaxChainDepth));
  EXPECT_EQ(ChainLength(exact), static_cast<size_t>(RemoteException::kMaxChainDepth));

  RemoteException deeper(NestedExceptions(100));
  ASSERT_EQ(ChainLength(deeper), static_cast<size_t>(RemoteException::kMaxChainDepth));
  const Exception* last = &deeper;
  while (last->GetCause() != nullptr) last = last->GetCause();
  EXPECT_EQ(std::u16string(last->GetType().name), u"E63");
  EXPECT_EQ(N(deeper.GetRootCauseId()), ":0");
}

TEST(ExceptionXml, HostileNestingNeverExhaustsTheStack) {
  // Far deeper than any stack could recurse: refused before parsing, the raw text is kept.
  String xml;
  for (int i = 0; i < 200000; ++i) xml += u"<exception>";
  RemoteException remote(xml);
  EXPECT_EQ(remote.GetMessage().size(), xml.size());
  EXPECT_EQ(std::u16string(remote.GetType().name), u"RemoteException");
  EXPECT_EQ(remote.GetCause(), nullptr);

  // Quoted '>' and "/>" inside attribute values do not hide the nesting.
  String tricky;
  for (int i = 0; i < 200000; ++i) tricky += u"<a x=\"/>\" y='>'>";
  RemoteException trickyRemote(tricky);
  EXPECT_EQ(std::u16string(trickyRemote.GetType().name), u"RemoteException");
}

TEST(ExceptionXml, DamagedTextNeverFailsTheReader) {
  String xml;
  try {
    ThrowOuter();
  } catch (Exception& e) {
    xml = ToXml(e);
  }
  ASSERT_FALSE(xml.empty());
  // Deterministic damage: replaced units (markup characters among them) and cut-off text.
  const char16_t pieces[] = {u'<', u'>', u'/', u'"', u'\'', u'&', u'=', u'!', u'?', u'[', u'\u013C', u'\0'};
  std::uint32_t seed = 12345;
  auto next = [&seed] { return seed = seed * 1664525u + 1013904223u; };
  for (int round = 0; round < 2000; ++round) {
    String damaged = xml;
    for (int n = 1 + next() % 4; n > 0; --n) damaged[next() % damaged.size()] = pieces[next() % std::size(pieces)];
    if (next() % 3 == 0) damaged.resize(next() % damaged.size());
    RemoteException remote(damaged);
    EXPECT_LE(ChainLength(remote), 3u);
    EXPECT_FALSE(remote.ToString().empty());
    (void)ToXml(remote);
  }
}

TEST(ExceptionXml, ThrowAndCloneKeepTheRemoteType) {
  RemoteException remote(u"<exception name=\"FileNotFound\" module=\"Files\" code=\"9\"><message>gone</message>"
                         u"<exception name=\"Inner\" module=\"Base\" code=\"1\"/></exception>");
  try {
    THROW_AT(remote);
  } catch (Exception& e) {
    EXPECT_EQ(std::u16string(e.GetType().name), u"FileNotFound");
    EXPECT_EQ(std::u16string(e.GetType().module), u"Files");
    EXPECT_EQ(e.GetType().code, 9);
    EXPECT_EQ(e.GetHistory().size(), 1u);
    std::unique_ptr<Exception> clone(e.Clone());
    EXPECT_EQ(std::u16string(clone->GetType().name), u"FileNotFound");
    EXPECT_EQ(N(clone->GetRootCauseId()), "Base:1");
    // The moved-from object reads as post-cloned with the static type.
    EXPECT_TRUE(e.IsPostCloned());
    EXPECT_EQ(std::u16string(e.GetType().name), u"RemoteException");
  }
}

}  // namespace

