// The UTF-16 formatter: numeric conversions agree with the C library's snprintf, strings take
// UTF-16, and the 1024/8192-unit buffer rule of Format / AppendFormat holds at its edges.
#include <gtest/gtest.h>

#include <cinttypes>
#include <climits>
#include <cstdio>
#include <string>

#include "owutils/CString.h"
#include "owutils/Exceptions.h"
#include "support/TestEnvironment.h"

using OwTest::Narrow;
using OwTest::Widen;

namespace {

template <typename... Args>
std::string Lumo16(const char16_t* format, Args... args) {
  Lumo::String s;
  s.Format(format, args...);
  return Narrow(s);
}

template <typename... Args>
std::string C8(const char* format, Args... args) {
  char buffer[4096];
  std::snprintf(buffer, sizeof buffer, format, args...);
  return buffer;
}

}  // namespace

TEST(Format, IntegerConversionsMatchSnprintf) {
  const int ints[] = {0, 1, -1, 42, -42, 1023, INT_MAX, INT_MIN, 0x7F, 0xBEEF};
  for (int v : ints) {
    SCOPED_TRACE(v);
    EXPECT_EQ(Lumo16(u"%d", v), C8("%d", v));
    EXPECT_EQ(Lumo16(u"%i", v), C8("%i", v));
    EXPECT_EQ(Lumo16(u"%u", static_cast<unsigned>(v)), C8("%u", static_cast<unsigned>(v)));
    EXPECT_EQ(Lumo16(u"%x", static_cast<unsigned>(v)), C8("%x", static_cast<unsigned>(v)));
    EXPECT_EQ(Lumo16(u"%X", static_cast<unsigned>(v)), C8("%X", static_cast<unsigned>(v)));
    EXPECT_EQ(Lumo16(u"%o", static_cast<unsigned>(v)), C8("%o", static_cast<unsigned>(v)));
    EXPECT_EQ(Lumo16(u"%+6d|%-6d|%06d|% d", v, v, v, v), C8("%+6d|%-6d|%06d|% d", v, v, v, v));
    EXPECT_EQ(Lumo16(u"%.8x|%#x|%#o|%08X", v, v, v, v), C8("%.8x|%#x|%#o|%08X", v, v, v, v));
    EXPECT_EQ(Lumo16(u"%*d|%-*d|%.*d", 7, v, 7, v, 5, v), C8("%*d|%-*d|%.*d", 7, v, 7, v, 5, v));
  }
}

TEST(Format, LongIsThirtyTwoBitsAsInTheWindowsRuntime) {
  const DWORD values[] = {0u, 5u, 0x80070005u, 0xFFFFFFFFu};
  for (DWORD v : values) {
    EXPECT_EQ(Lumo16(u"%ld", static_cast<LONG>(v)), C8("%d", static_cast<int32_t>(v)));
    EXPECT_EQ(Lumo16(u"%lu", v), C8("%u", v));
    EXPECT_EQ(Lumo16(u"%lX", v), C8("%X", v));
    EXPECT_EQ(Lumo16(u"%08lX", v), C8("%08X", v));
  }
}

TEST(Format, PointerSizedAndSixtyFourBitConversions) {
  const long long wide[] = {0, -1, 1LL << 40, LLONG_MAX, LLONG_MIN};
  for (long long v : wide) {
    EXPECT_EQ(Lumo16(u"%I64d", v), C8("%lld", v));
    EXPECT_EQ(Lumo16(u"%I64u", static_cast<unsigned long long>(v)), C8("%llu", static_cast<unsigned long long>(v)));
    EXPECT_EQ(Lumo16(u"%lld|%llx", v, v), C8("%lld|%llx", v, v));
    EXPECT_EQ(Lumo16(u"%Id", static_cast<INT_PTR>(v)), C8("%" PRIdPTR, static_cast<intptr_t>(v)));
    EXPECT_EQ(Lumo16(u"%Iu", static_cast<UINT_PTR>(v)), C8("%" PRIuPTR, static_cast<uintptr_t>(v)));
    EXPECT_EQ(Lumo16(u"%zu", static_cast<size_t>(v)), C8("%zu", static_cast<size_t>(v)));
  }
  EXPECT_EQ(Lumo16(u"%I32d", -7), "-7");
  EXPECT_EQ(Lumo16(u"%hd|%hu|%hhd", 70000, 70000, 300), C8("%hd|%hu|%hhd", 70000, 70000, 300));
}

TEST(Format, FloatingConversionsMatchSnprintf) {
  const double values[] = {0.0, 1.5, -2.25, 1234567.891, 1e-7, 99.995, 1e300};
  for (double v : values) {
    EXPECT_EQ(Lumo16(u"%.2f|%f|%10.3f|%-10.1f|%+.0f", v, v, v, v, v), C8("%.2f|%f|%10.3f|%-10.1f|%+.0f", v, v, v, v, v));
    EXPECT_EQ(Lumo16(u"%e|%E|%.3g|%G|%a", v, v, v, v, v), C8("%e|%E|%.3g|%G|%a", v, v, v, v, v));
  }
}

TEST(Format, PointerPrintsUpperCaseHexAtFullWidth) {
  void* p = reinterpret_cast<void*>(static_cast<uintptr_t>(0x401000));
  std::string expected = C8("%0*" PRIXPTR, static_cast<int>(2 * sizeof(void*)), static_cast<uintptr_t>(0x401000));
  EXPECT_EQ(Lumo16(u"%p", p), expected);
  EXPECT_EQ(Lumo16(u"0x%p", nullptr), "0x" + std::string(2 * sizeof(void*), '0'));
}

TEST(Format, StringsAndCharactersTakeUtf16) {
  EXPECT_EQ(Lumo16(u"[%s]", u"Grüße 東京"), "[Grüße 東京]");
  EXPECT_EQ(Lumo16(u"[%5s|%-5s|%.2s]", u"ab", u"ab", u"abcdef"), "[   ab|ab   |ab]");
  EXPECT_EQ(Lumo16(u"%s", static_cast<const char16_t*>(nullptr)), "(null)");
  EXPECT_EQ(Lumo16(u"%c%lc%wc", u'A', u'ß', u'€'), "Aß€");
  EXPECT_EQ(Lumo16(u"%hs|%S", "narrow", "ütf8"), "narrow|ütf8");
  EXPECT_EQ(Lumo16(u"%ls", u"wide"), "wide");
  EXPECT_EQ(Lumo16(u"100%% done"), "100% done");
  // A surrogate pair passes through untouched.
  EXPECT_EQ(Lumo16(u"%s", u"\U0001F600"), "\U0001F600");
}

TEST(Format, RefusedConversionsKeepTheTargetUnchanged) {
  Lumo::String s(u"before");
  int n = 0;
  // %n would write through a pointer; the formatter refuses it like an encoding error, and a
  // refused format counts as "does not fit", ending in BufferTooSmall.
  EXPECT_THROW(s.Format(u"x%n", &n), LumoException::BufferTooSmall);
  EXPECT_EQ(Narrow(s), "before");
  EXPECT_EQ(n, 0);
}

TEST(Format, NullFormatIsAPreconditionFailure) {
  Lumo::String s(u"kept");
  try {
    s.Format(nullptr);
    FAIL() << "no exception";
  } catch (LumoException::PreconditionFailed0& e) {
    EXPECT_EQ(Narrow(e.m_expression), "format != NULL");
  }
  EXPECT_EQ(Narrow(s), "kept");
}

TEST(Format, BufferEdges) {
  auto lengthOf = [](size_t units) {
    Lumo::String s;
    s.Format(u"%s", std::u16string(units, u'x').c_str());
    return s.size();
  };
  EXPECT_EQ(lengthOf(1023), 1023u);  // the stack buffer
  EXPECT_EQ(lengthOf(1024), 1024u);  // the heap buffer
  EXPECT_EQ(lengthOf(8191), 8191u);
  Lumo::String s(u"unchanged");
  try {
    s.Format(u"%s", std::u16string(8192, u'x').c_str());
    FAIL() << "no exception";
  } catch (LumoException::BufferTooSmall& e) {
    EXPECT_EQ(e.m_size, 8192);
    EXPECT_EQ(Narrow(e.GetMessage()), "Buffer size 8192 is insufficient for requested data.");
    ASSERT_FALSE(e.GetHistory().empty());
    EXPECT_EQ(Narrow(e.GetHistory().front().file), "Strings/tstring.cpp");
  }
  EXPECT_EQ(Narrow(s), "unchanged");
}

TEST(Format, AppendFormatPastTheStackBufferStillAppendsTheCallersArguments) {
  Lumo::String s(u"head:");
  const std::u16string body(2000, u'y');
  s.AppendFormat(u"%s|%d|%s", body.c_str(), 77, u"tail");
  EXPECT_EQ(s.size(), 5u + 2000u + 8u);
  EXPECT_EQ(Narrow(s.substr(0, 5)), "head:");
  EXPECT_EQ(Narrow(s.substr(2005)), "|77|tail");
  // A failed append leaves the string as it was.
  EXPECT_THROW(s.AppendFormat(u"%s", std::u16string(9000, u'z').c_str()), LumoException::BufferTooSmall);
  EXPECT_EQ(s.size(), 2013u);
}

TEST(Format, CStringFormatHasNoLengthLimit) {
  CString c;
  c.Format(u"%s-%d", std::u16string(10000, u'q').c_str(), 5);
  EXPECT_EQ(c.GetLength(), 10002);
  c.AppendFormat(u"%.2f GB", 1.5);
  EXPECT_EQ(Narrow(c.Right(7).str()), "1.50 GB");
}
