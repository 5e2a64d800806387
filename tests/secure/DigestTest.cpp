// Digests of buffers and strings through CEncrypt, and the key digest.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "support/TestEnvironment.h"

namespace {

std::string DigestOf(int type, const char16_t* text) {
  CEncrypt digest(type, TRUE);
  EXPECT_TRUE(digest.DigestString(text));
  return OwTest::Narrow(digest.GetDigestResultString().str());
}

// Published values: FIPS 180-1 ("abc"), the RIPEMD-160 paper, RFC 1321 and the CRC-32 check
// value 0xCBF43926 of "123456789" (least significant byte first).
TEST(Digest, StringsOfEveryType) {
  EXPECT_EQ(DigestOf(DIGEST_SHA1, u"abc"), "a9993e364706816aba3e25717850c26c9cd0d89d");
  EXPECT_EQ(DigestOf(DIGEST_RIPEMD160, u"abc"), "8eb208f7e05d987a9b044a8e98c6b087f15a0bfc");
  EXPECT_EQ(DigestOf(DIGEST_MD5, u"abc"), "900150983cd24fb0d6963f7d28e17f72");
  EXPECT_EQ(DigestOf(DIGEST_CRC32, u"123456789"), "2639f4cb");
  EXPECT_EQ(DigestOf(DIGEST_MD5, u""), "d41d8cd98f00b204e9800998ecf8427e");
  EXPECT_EQ(DigestOf(DIGEST_SHA1, u""), "da39a3ee5e6b4b0d3255bfef95601890afd80709");
}

TEST(Digest, BuffersAccumulateUntilTheResultIsRead) {
  CEncrypt md5(DIGEST_MD5, TRUE);
  EXPECT_TRUE(md5.Digest(reinterpret_cast<const BYTE*>("mess"), 4));
  EXPECT_TRUE(md5.Digest(nullptr, 0));
  EXPECT_TRUE(md5.Digest(reinterpret_cast<const BYTE*>("age digest"), 10));
  EXPECT_EQ(OwTest::Narrow(md5.GetDigestResultString().str()), "f96b697d7cb7938d525a2f31aaf161d0");
  // Reading the result started a new message.
  EXPECT_EQ(OwTest::Narrow(md5.GetDigestResultString().str()), "d41d8cd98f00b204e9800998ecf8427e");
  EXPECT_EQ(OwTest::Narrow(md5.GetDigestResultStringAnsi().str()), "d41d8cd98f00b204e9800998ecf8427e");
  EXPECT_EQ(md5.GetDigestResultLength(TRUE), 16);
  EXPECT_EQ(md5.GetDigestResultLength(FALSE), 128);
}

TEST(Digest, ResultIntoCallerBuffer) {
  CEncrypt sha(DIGEST_SHA1, TRUE);
  BYTE buffer[64];
  int length = 19;
  try {
    sha.GetDigestResult(buffer, &length);
    ADD_FAILURE();
  } catch (LumoException::AssertionFailed2& e) {
    EXPECT_EQ(e.m_expression, Lumo::String(u"nLength >= SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE"));
    EXPECT_EQ(e.m_value1, 19);
    EXPECT_EQ(e.m_value2, 20);
  }
  std::memset(buffer, 0xEE, sizeof buffer);
  length = 64;
  sha.DigestString(u"abc");
  EXPECT_TRUE(sha.GetDigestResult(buffer, &length));
  EXPECT_EQ(length, 20);
  EXPECT_EQ(buffer[0], 0xa9);
  for (int i = 20; i < 64; ++i) EXPECT_EQ(buffer[i], 0) << i;

  CEncrypt crc(DIGEST_CRC32, TRUE);
  std::memset(buffer, 0xEE, sizeof buffer);
  length = 8;
  EXPECT_TRUE(crc.GetDigestResult(buffer, &length));
  EXPECT_EQ(length, 4);
  EXPECT_EQ(buffer[4], 0xEE);  // the CRC leaves the rest of the buffer alone

  length = 0;
  EXPECT_THROW(sha.GetDigestResult(buffer, &length), LumoException::PreconditionFailed0);
  EXPECT_THROW(sha.GetDigestResult(nullptr, &length), LumoException::PreconditionFailed0);
}

TEST(Digest, NonDigestInstances) {
  CEncrypt aes(ENC_AES_128, TRUE, CString(u"k"));
  EXPECT_THROW(aes.GetDigestResultString(), LumoException::AssertionFailed2);
  EXPECT_THROW(aes.GetDigestResultStringAnsi(), LumoException::AssertionFailed2);
  EXPECT_THROW(aes.GetDigestResultLength(TRUE), LumoException::AssertionFailed2);
  EXPECT_FALSE(aes.ResetDigest());
  EXPECT_TRUE(aes.Digest(reinterpret_cast<const BYTE*>("x"), 1));

  // No type at all: both string forms fail with the unknown type, the ANSI one included.
  CEncrypt none(0, TRUE);
  try {
    none.GetDigestResultStringAnsi();
    ADD_FAILURE();
  } catch (UnknownEncryptionType& e) {
    EXPECT_EQ(e.m_function, Lumo::String(u"CEncrypt::GetDigestResultStringAnsi"));
  }
  EXPECT_THROW(none.GetDigestResultString(), UnknownEncryptionType);
  EXPECT_THROW(none.GetDigestResultLength(FALSE), UnknownEncryptionType);
}

TEST(Digest, KeyDigest) {
  CEncrypt sha(DIGEST_SHA1, TRUE);
  sha.DigestString(u"my key \u00fc");
  const CString expected = sha.GetDigestResultString();

  CEncrypt bf(ENC_BLOWFISH, TRUE, CString(u"my key \u00fc"));
  const CString before = bf.EncryptString(u"text");
  EXPECT_EQ(bf.GetKeyDigestString(), expected);
  EXPECT_EQ(bf.EncryptString(u"text"), before);  // type and key unchanged
  BYTE out[32];
  int length = 32;
  EXPECT_TRUE(bf.GetKeyDigest(out, &length));
  EXPECT_EQ(length, 20);
  length = 19;
  EXPECT_THROW(bf.GetKeyDigest(out, &length), LumoException::AssertionFailed2);
  EXPECT_EQ(CEncrypt::GetKeyDigestLength(TRUE), 20);
  EXPECT_EQ(CEncrypt::GetKeyDigestLength(FALSE), 160);

  // An SHA-1 instance has its own SHA-1 object already.
  length = 20;
  try {
    sha.GetKeyDigest(out, &length);
    ADD_FAILURE();
  } catch (LumoException::AssertionFailed0& e) {
    EXPECT_EQ(e.m_expression, Lumo::String(u"!m_pSHA"));
  }
  // The key digest of a keyless instance is the digest of the empty text.
  CEncrypt md5(DIGEST_MD5, TRUE);
  EXPECT_EQ(OwTest::Narrow(md5.GetKeyDigestString().str()), "da39a3ee5e6b4b0d3255bfef95601890afd80709");
}

TEST(Digest, AnsiStringDigestsTheConvertedBytes) {
  CEncrypt a(DIGEST_SHA1, TRUE), b(DIGEST_SHA1, TRUE);
  a.DigestStringAnsi(u"plain ascii");
  b.DigestString(u"plain ascii");
  EXPECT_EQ(a.GetDigestResultString(), b.GetDigestResultString());
}

}  // namespace
