// The encryptor: key derivation, buffers, strings and checks.
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <stdexcept>
#include <memory>
#include <string>
#include <vector>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "secure/BlockTransformation.h"
#include "secure/HashModule.h"
#include "support/TestEnvironment.h"

namespace {

using Bytes = std::vector<BYTE>;

std::string Hex(const BYTE* data, size_t n) {
  static const char digits[] = "0123456789abcdef";
  std::string out;
  for (size_t i = 0; i < n; ++i) {
    out += digits[data[i] >> 4];
    out += digits[data[i] & 15];
  }
  return out;
}

Bytes Sha1(const BYTE* data, size_t n) {
  SHA160 sha;
  sha.Update(data, static_cast<unsigned int>(n));
  Bytes out(20);
  sha.Final(out.data());
  return out;
}

// The key stretch written out from its description: D0 = SHA-1(key text), each following
// Dn = SHA-1 of all key bytes so far, concatenated and cut to `bits`.
Bytes ExpectedKey(const std::string& keyUtf8, unsigned bits) {
  Bytes key;
  Bytes d = Sha1(reinterpret_cast<const BYTE*>(keyUtf8.data()), keyUtf8.size());
  while (key.size() < bits / 8) {
    key.insert(key.end(), d.begin(), d.end());
    d = Sha1(key.data(), key.size());
  }
  key.resize(bits / 8);
  return key;
}

// ECB with zero padding to whole blocks, as lower-case hex.
std::string ExpectedCode(const BlockTransformation& enc, const std::string& plainUtf8) {
  const size_t b = enc.BlockSize();
  Bytes buffer(((plainUtf8.size() + b - 1) / b) * b, 0);
  std::memcpy(buffer.data(), plainUtf8.data(), plainUtf8.size());
  for (size_t i = 0; i < buffer.size(); i += b) enc.ProcessBlock(buffer.data() + i);
  return Hex(buffer.data(), buffer.size());
}

std::unique_ptr<BlockTransformation> ReferenceCipher(int code, const Bytes& k) {
  switch (code) {
    case 1:
    case 7: return std::make_unique<BlowfishEncryption>(k.data(), 56);
    case 2: return std::make_unique<TripleDES_Encryption>(k.data());
    case 3:
    case 8: return std::make_unique<DES_EDE_Encryption>(k.data());
    case 4: return std::make_unique<SAFER_SK128_Encryption>(k.data(), k.data() + 8, 10);
    case 5: return std::make_unique<IDEAEncryption>(k.data());
    case 6: return std::make_unique<RC5Encryption>(k.data(), 256, 255);
    case 9: return std::make_unique<TwofishEncryption>(k.data(), 16);
    case 10: return std::make_unique<MARSEncryption>(k.data(), 16);
    default: return std::make_unique<AES_Encryption>(k.data(), static_cast<unsigned>(k.size()));
  }
}

const unsigned kFullBits[] = {0, 448, 192, 128, 128, 128, 2048, 448, 128, 128, 128, 128, 192, 256};

TEST(CEncrypt, EveryCipherCodeDerivesItsKeyAndEncryptsBlockByBlock) {
  const std::string key = "correct horse \xC3\xA4";  // non-ASCII: the key text goes in as UTF-8
  const std::string plain = "The quick brown fox jumps over the lazy dog";
  for (int code = 1; code <= 13; ++code) {
    CEncrypt encryptor(code, TRUE, CString(OwTest::Widen(key)));
    auto reference = ReferenceCipher(code, ExpectedKey(key, kFullBits[code]));
    EXPECT_EQ(encryptor.GetBlockSize(), reference->BlockSize()) << code;
    const CString code16 = encryptor.EncryptString(CString(OwTest::Widen(plain)));
    EXPECT_EQ(OwTest::Narrow(code16.str()), ExpectedCode(*reference, plain)) << "type " << code;
    EXPECT_EQ(OwTest::Narrow(encryptor.DecryptString(code16).str()), plain) << code;
  }
}

TEST(CEncrypt, ReducedStrengthKeys) {
  const std::string key = "export";
  const std::u16string wkey = OwTest::Widen(key);
  const std::string plain = "8 bytes!";
  const Bytes d0 = ExpectedKey(key, 160);

  BlowfishEncryption bf4(d0.data(), 4), bf7(d0.data(), 7);
  EXPECT_EQ(OwTest::Narrow(CEncrypt(1, FALSE, CString(wkey)).EncryptString(u"8 bytes!").str()), ExpectedCode(bf4, plain));
  EXPECT_EQ(OwTest::Narrow(CEncrypt(7, FALSE, CString(wkey)).EncryptString(u"8 bytes!").str()), ExpectedCode(bf7, plain));
  // Every other cipher code becomes 56-bit Blowfish.
  EXPECT_EQ(OwTest::Narrow(CEncrypt(11, FALSE, CString(wkey)).EncryptString(u"8 bytes!").str()), ExpectedCode(bf7, plain));
  EXPECT_EQ(CEncrypt(13, FALSE, CString(wkey)).GetBlockSize(), 8u);

  Bytes des40(d0.begin(), d0.begin() + 8), des56 = des40;
  des40[5] = des40[6] = des40[7] = 0;
  des56[7] = 0;
  DESEncryption e40(des40.data()), e56(des56.data());
  EXPECT_EQ(OwTest::Narrow(CEncrypt(3, FALSE, CString(wkey)).EncryptString(u"8 bytes!").str()), ExpectedCode(e40, plain));
  EXPECT_EQ(OwTest::Narrow(CEncrypt(8, FALSE, CString(wkey)).EncryptString(u"8 bytes!").str()), ExpectedCode(e56, plain));
}

TEST(CEncrypt, TwinCodesAgreeAtFullStrengthAndInstancesAreRepeatable) {
  const CString key(u"twin");
  EXPECT_EQ(CEncrypt(1, TRUE, key).EncryptString(u"text"), CEncrypt(7, TRUE, key).EncryptString(u"text"));
  EXPECT_EQ(CEncrypt(3, TRUE, key).EncryptString(u"text"), CEncrypt(8, TRUE, key).EncryptString(u"text"));
  EXPECT_EQ(CEncrypt(11, TRUE, key).EncryptString(u"text"), CEncrypt(11, TRUE, key).EncryptString(u"text"));
  EXPECT_NE(CEncrypt(11, TRUE, key).EncryptString(u"text"), CEncrypt(11, TRUE, CString(u"twin2")).EncryptString(u"text"));
}

TEST(CEncrypt, StringLengthsPadToWholeBlocksWithoutAnExtraBlock) {
  CEncrypt des(2, TRUE, CString(u"k"));
  EXPECT_EQ(des.EncryptString(u"0123456789abcdef").GetLength(), 32);
  EXPECT_EQ(des.EncryptString(u"0123456789abcdefg").GetLength(), 48);
  EXPECT_EQ(des.EncryptString(u"x").GetLength(), 16);
  CEncrypt aes(11, TRUE, CString(u"k"));
  EXPECT_EQ(aes.EncryptString(u"x").GetLength(), 32);
}

TEST(CEncrypt, DecryptStringAcceptsUpperCaseAndOddLengths) {
  CEncrypt aes(13, TRUE, CString(u"key"));
  const CString code = aes.EncryptString(u"h\u00e9llo w\u00f6rld \U0001F600");
  CString upper = code;
  upper.MakeUpper();
  EXPECT_EQ(aes.DecryptString(upper), CString(u"h\u00e9llo w\u00f6rld \U0001F600"));
  // One digit short: the last block is decoded with a zero low half and still decrypted.
  EXPECT_NO_THROW(aes.DecryptString(code.Left(code.GetLength() - 1)));
  EXPECT_NO_THROW(aes.DecryptString(u"zz"));
}

TEST(CEncrypt, BuffersTransformWholeBlocksOnly) {
  CEncrypt bf(1, TRUE, CString(u"k"));
  BYTE data[20];
  for (int i = 0; i < 20; ++i) data[i] = static_cast<BYTE>(i);
  BYTE copy[20];
  std::memcpy(copy, data, 20);
  EXPECT_TRUE(bf.Encrypt(data, 20));
  EXPECT_NE(0, std::memcmp(data, copy, 16));
  EXPECT_EQ(0, std::memcmp(data + 16, copy + 16, 4));
  EXPECT_TRUE(bf.Decrypt(data, 20));
  EXPECT_EQ(0, std::memcmp(data, copy, 20));
  EXPECT_TRUE(bf.Encrypt(data, 7));
  EXPECT_EQ(0, std::memcmp(data, copy, 20));
}

template <class E>
E Caught(const std::function<void()>& call) {
  try {
    call();
  } catch (E& e) {
    return std::move(e);
  } catch (LumoException::Exception& e) {
    ADD_FAILURE() << "other exception: " << OwTest::Narrow(e.ToString());
  }
  ADD_FAILURE() << "no exception";
  throw std::runtime_error("no exception");
}

TEST(CEncrypt, ChecksRaiseTheFrameworkExceptions) {
  auto emptyKey = Caught<LumoException::AssertionFailed2>([] { CEncrypt(11, TRUE, CString()); });
  EXPECT_EQ(emptyKey.m_expression, Lumo::String(u"m_bUsingEncr == FALSE || !m_strKey.IsEmpty()"));
  EXPECT_EQ(emptyKey.m_value1, 1);
  EXPECT_EQ(emptyKey.m_value2, 0);
  EXPECT_NE(emptyKey.GetHistory().front().file.find(u"secure"), Lumo::String::npos);

  CEncrypt digest(20, TRUE);
  BYTE data[16] = {0};
  auto noCipher = Caught<LumoException::AssertionFailed2>([&] { digest.Encrypt(data, 16); });
  EXPECT_EQ(noCipher.m_expression, Lumo::String(u"m_bUsingEncr == TRUE && !m_strKey.IsEmpty()"));
  Caught<LumoException::AssertionFailed2>([&] { digest.Decrypt(data, 16); });
  Caught<LumoException::AssertionFailed2>([&] { digest.EncryptString(u"x"); });
  Caught<LumoException::AssertionFailed2>([&] { digest.DecryptString(u"00"); });
  auto block = Caught<LumoException::AssertionFailed0>([&] { digest.GetBlockSize(); });
  EXPECT_EQ(block.m_expression, Lumo::String(u"m_pDecryptPtr.get() != NULL"));

  CEncrypt aes(11, TRUE, CString(u"k"));
  auto null = Caught<LumoException::PreconditionFailed0>([&] { aes.Encrypt(nullptr, 16); });
  EXPECT_EQ(null.m_expression, Lumo::String(u"data != NULL && nLength > 0"));
  Caught<LumoException::PreconditionFailed0>([&] { aes.Decrypt(data, 0); });
  auto empty = Caught<LumoException::PreconditionFailed0>([&] { aes.EncryptString(CString()); });
  EXPECT_EQ(empty.m_expression, Lumo::String(u"!cstrString.IsEmpty()"));
  auto emptyHex = Caught<LumoException::PreconditionFailed0>([&] { aes.DecryptString(CString()); });
  EXPECT_EQ(emptyHex.m_expression, Lumo::String(u"!strString.IsEmpty()"));

  // Unsupported codes construct but select nothing.
  CEncrypt none(0, TRUE);
  Caught<LumoException::AssertionFailed2>([&] { none.Encrypt(data, 16); });
}

// A key text that is not valid UTF-16 must not leave an instance keyed with zeros behind.
TEST(CEncrypt, InvalidKeyTextLeavesTheConstructor) {
  const char16_t lone[] = {u'k', 0xD800, u'y', 0};
  auto e = Caught<LumoException::Win32ErrorCode>([&] { CEncrypt(11, TRUE, CString(lone)); });
  EXPECT_EQ(e.m_error, ERROR_NO_UNICODE_TRANSLATION);
  ASSERT_GE(e.GetHistory().size(), 2u);  // thrown, then checkpointed by the key derivation
}

}  // namespace
