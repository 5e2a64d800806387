#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/SecretKey.h"

namespace {

const char16_t kCheckText[] = u"harborlanternmeadowquietstoneelm";
const int kTypeCodes[] = {0, 1, 2, 3, 4, 5, 6, 9, 10, 11, 12, 13};  // by encType

Lumo::String CodeFor(int encType, const char16_t* key) {
  CEncrypt encryptor(kTypeCodes[encType], TRUE, CString(key));
  return Lumo::String(encryptor.EncryptString(CString(kCheckText)).GetString());
}

TEST(VerifySecretKey, EveryEncTypeVerifiesItsOwnCodeOnly) {
  for (int encType = 1; encType <= 11; ++encType) {
    const Lumo::String code = CodeFor(encType, u"s3cret key");
    ASSERT_EQ(code.size(), 64u) << encType;
    EXPECT_TRUE(VerifySecretKey(u"s3cret key", code, encType)) << encType;
    EXPECT_FALSE(VerifySecretKey(u"s3cret kez", code, encType)) << encType;
    EXPECT_FALSE(VerifySecretKey(u"s3cret key", code, encType % 11 + 1)) << encType;
  }
}

TEST(VerifySecretKey, MadeCodesAreTheEncryptedCheckText) {
  for (int encType = 1; encType <= 11; ++encType) {
    const Lumo::String code = MakeSecretKeyCode(u"s3cret key", encType);
    EXPECT_EQ(code, CodeFor(encType, u"s3cret key")) << encType;
    EXPECT_TRUE(VerifySecretKey(u"s3cret key", code, encType)) << encType;
  }
  EXPECT_THROW(MakeSecretKeyCode(u"", 9), LumoException::PreconditionFailed0);
  EXPECT_THROW(MakeSecretKeyCode(u"k", 0), LumoException::PreconditionFailed0);
  EXPECT_THROW(MakeSecretKeyCode(u"k", 12), LumoException::PreconditionFailed0);
}

TEST(VerifySecretKey, CodeVariantsFromTheDefinition) {
  const Lumo::String code = CodeFor(7, u"K");
  EXPECT_TRUE(VerifySecretKey(u"K", code, 7));
  EXPECT_FALSE(VerifySecretKey(u"K", code, 8));

  Lumo::String upper = code;
  for (auto& c : upper) c = static_cast<char16_t>(std::toupper(c));
  EXPECT_TRUE(VerifySecretKey(u"K", upper, 7));

  // A trailing zero byte is a partial block: it stays as decoded and ends the compared text.
  EXPECT_TRUE(VerifySecretKey(u"K", code + u"00", 7));
  EXPECT_FALSE(VerifySecretKey(u"K", code + u"01", 7));
  EXPECT_FALSE(VerifySecretKey(u"K", code.substr(0, 63), 7));
  EXPECT_FALSE(VerifySecretKey(u"K", u"0", 7));
}

// Codes of any length stay inside the work buffer and answer as a longer buffer would.
TEST(VerifySecretKey, LongCodesNeverOverrunTheWorkBuffer) {
  const Lumo::String code = CodeFor(9, u"K");
  for (size_t extra : {188u, 189u, 190u, 191u, 192u, 300u, 5000u}) {
    Lumo::String zeros(extra, u'0');
    // Block 2 (bytes 32-47) then decrypts to garbage: no match, and no crash.
    EXPECT_FALSE(VerifySecretKey(u"K", code + zeros, 9)) << extra;
  }
  // A code whose third block decrypts to a zero-led block still verifies however long it is.
  CEncrypt aes(11, TRUE, CString(u"K"));
  BYTE third[16] = {0};
  aes.Encrypt(third, 16);
  char hex[33];
  CEncrypt::HexEncode(third, 16, hex);
  Lumo::String longCode = code;
  longCode.AssignUtf8((code.ToUtf8().Get() + std::string(hex) + std::string(400, 'f')).c_str());
  EXPECT_TRUE(VerifySecretKey(u"K", longCode, 9));
}

TEST(VerifySecretKey, ArgumentFailures) {
  const Lumo::String code = CodeFor(1, u"K");
  auto expectPrecondition = [](auto call, const char16_t* text) {
    try {
      call();
      ADD_FAILURE() << "no exception";
    } catch (LumoException::PreconditionFailed0& e) {
      EXPECT_EQ(e.m_expression, Lumo::String(text));
    }
  };
  expectPrecondition([&] { VerifySecretKey(u"", code, 1); }, u"secretKey.empty() == false");
  expectPrecondition([&] { VerifySecretKey(u"K", u"", 1); }, u"hexEncryptionCode.empty() == false");
  expectPrecondition([&] { VerifySecretKey(u"K", code, 0); }, u"encType != 0");

  try {
    VerifySecretKey(u"K", code, 12);
    ADD_FAILURE() << "no exception";
  } catch (LumoException::AssertionFailed2& e) {
    EXPECT_EQ(e.m_expression, Lumo::String(u"m_bUsingEncr == TRUE && !m_strKey.IsEmpty()"));
  }

  const char16_t lone[] = {u'a', 0xDC00, 0};
  try {
    VerifySecretKey(u"K", lone, 1);
    ADD_FAILURE() << "no exception";
  } catch (const std::range_error& e) {
    EXPECT_STREQ(e.what(), "bad conversion");
  }
}

}  // namespace
