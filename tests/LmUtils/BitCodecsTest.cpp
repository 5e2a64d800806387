#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "owutils/BitCodecs.h"
#include "owutils/Exceptions.h"

namespace {

TEST(BitsToAscii, WritesLowerCaseHighHalfFirst) {
  const unsigned char bytes[] = {0x0F, 0xA0};
  char out[8];
  std::memset(out, 'x', sizeof out);
  EXPECT_EQ(BitsToAscii(bytes, 2, out), 4);
  EXPECT_STREQ(out, "0fa0");
}

TEST(BitsToAscii, ZeroOrNegativeLengthWritesOnlyTheTerminator) {
  const unsigned char bytes[] = {0x12};
  char out[4] = {'x', 'x', 'x', 'x'};
  EXPECT_EQ(BitsToAscii(bytes, 0, out), 0);
  EXPECT_EQ(out[0], 0);
  EXPECT_EQ(out[1], 'x');
  out[0] = 'x';
  EXPECT_EQ(BitsToAscii(bytes, -3, out), -6);
  EXPECT_EQ(out[0], 0);
}

TEST(AsciiToBits, DecodesEitherCaseAndTerminates) {
  unsigned char out[4];
  std::memset(out, 0xEE, sizeof out);
  EXPECT_EQ(AsciiToBits("0fA0", 4, out), 2u);
  EXPECT_EQ(out[0], 0x0F);
  EXPECT_EQ(out[1], 0xA0);
  EXPECT_EQ(out[2], 0x00);
  EXPECT_EQ(out[3], 0xEE);  // nothing beyond the terminator
}

TEST(AsciiToBits, OddLengthGivesHighHalfOnlyAndDoesNotReadPastTheText) {
  unsigned char out[4];
  std::memset(out, 0xEE, sizeof out);
  const char text[3] = {'a', 'b', 'c'};  // no terminator: the fourth character must not be read
  EXPECT_EQ(AsciiToBits(text, 3, out), 1u);
  EXPECT_EQ(out[0], 0xAB);
  EXPECT_EQ(out[1], 0xC0);
  EXPECT_EQ(out[2], 0x00);
  EXPECT_EQ(out[3], 0xEE);
}

TEST(AsciiToBits, NonDigitsCountAsZeroAndTopBitIsIgnored) {
  unsigned char out[3];
  EXPECT_EQ(AsciiToBits("zz", 2, out), 1u);
  EXPECT_EQ(out[0], 0x00);
  // 0xB1 is '1' with its top bit set, 0xC6 is 'F' with its top bit set.
  const char high[] = {static_cast<char>(0xB1), static_cast<char>(0xC6)};
  EXPECT_EQ(AsciiToBits(high, 2, out), 1u);
  EXPECT_EQ(out[0], 0x1F);
}

TEST(AsciiToBits, EmptyTextWritesOneZeroByte) {
  unsigned char out[2] = {0xEE, 0xEE};
  EXPECT_EQ(AsciiToBits("", 0, out), 0u);
  EXPECT_EQ(out[0], 0);
  EXPECT_EQ(out[1], 0xEE);
}

TEST(BitCodecs, HexRoundTripOfEveryByteValue) {
  unsigned char bytes[256];
  for (int i = 0; i < 256; ++i) bytes[i] = static_cast<unsigned char>(i);
  char hex[513];
  ASSERT_EQ(BitsToAscii(bytes, 256, hex), 512);
  unsigned char back[257];
  ASSERT_EQ(AsciiToBits(hex, 512, back), 256u);
  EXPECT_EQ(std::memcmp(bytes, back, 256), 0);
  EXPECT_EQ(back[256], 0);
}

TEST(BitsToDecimal, ThreeDigitsPerByte) {
  const unsigned char bytes[] = {7, 200, 255, 0};
  char out[16];
  EXPECT_EQ(BitsToDecimal(bytes, 4, out), 12);
  EXPECT_STREQ(out, "007200255000");
  EXPECT_EQ(BitsToDecimal(bytes, 0, out), 0);
  EXPECT_STREQ(out, "");
}

TEST(BitCodecs, NullPointersThrowBeforeWriting) {
  unsigned char bytes[2] = {1, 2};
  char text[8] = "keep";
  auto expectPrecondition = [](auto call, const char16_t* expression) {
    try {
      call();
      ADD_FAILURE() << "no exception";
    } catch (LumoException::PreconditionFailed0& e) {
      EXPECT_EQ(e.m_expression, Lumo::String(expression));
      ASSERT_FALSE(e.GetHistory().empty());
      EXPECT_NE(e.GetHistory().front().file.find(u"LmUtils"), Lumo::String::npos);
    }
  };
  expectPrecondition([&] { BitsToAscii(nullptr, 1, text); }, u"input != NULL");
  expectPrecondition([&] { BitsToAscii(bytes, 1, nullptr); }, u"output != NULL");
  expectPrecondition([&] { BitsToDecimal(nullptr, 1, text); }, u"input != NULL");
  expectPrecondition([&] { BitsToDecimal(bytes, 1, nullptr); }, u"output != NULL");
  expectPrecondition([&] { AsciiToBits(nullptr, 2, bytes); }, u"input != NULL");
  expectPrecondition([&] { AsciiToBits("00", 2, nullptr); }, u"output != NULL");
  EXPECT_STREQ(text, "keep");
}

}  // namespace

