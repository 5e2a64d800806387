// VerifySecretKey with arbitrary key and code text and every encType, and CEncrypt's
// DecryptString with arbitrary hex under every cipher.
//
// Properties: only the documented failures leave VerifySecretKey (the precondition failures,
// the encryptor's assertion for an unknown type (once the code holds a byte), std::range_error for a code that is not
// UTF-16, the library's exception for a key that is not), never a crash or another exception;
// a code made by EncryptString of the check text with the same key and cipher verifies;
// DecryptString takes any text and gives a result or a library exception; EncryptString then
// DecryptString gives the text back.
#include <stdexcept>

#include "FuzzSupport.h"
#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/SecretKey.h"

namespace {

constexpr char16_t kCheckText[] = u"harborlanternmeadowquietstoneelm";
constexpr int kTypeCodes[] = {0, 1, 2, 3, 4, 5, 6, 9, 10, 11, 12, 13};  // by encType 0..11

bool WellFormed(const std::u16string& text) {
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] >= 0xD800 && text[i] <= 0xDBFF && i + 1 < text.size() && text[i + 1] >= 0xDC00 &&
        text[i + 1] <= 0xDFFF) {
      ++i;
    } else if (text[i] >= 0xD800 && text[i] <= 0xDFFF) {
      return false;
    }
  }
  return true;
}

std::u16string TextFrom(FuzzedDataProvider& input, size_t maxBytes) {
  const bool ascii = input.ConsumeBool();
  const std::string bytes = input.ConsumeRandomLengthString(maxBytes);
  return OwFuzz::UpToNul(ascii ? OwFuzz::Latin1(bytes) : OwFuzz::Units(bytes));
}

void CheckVerify(FuzzedDataProvider& input) {
  const int encType = input.ConsumeBool() ? input.ConsumeIntegralInRange<int>(-1, 12) : input.ConsumeIntegral<int>();
  const Lumo::String key(TextFrom(input, 24));
  bool madeCode = input.ConsumeIntegralInRange<int>(0, 3) == 0;
  Lumo::String code(TextFrom(input, 300));

  const bool knownType = encType >= 1 && encType <= 11;
  madeCode = madeCode && knownType && !key.empty() && WellFormed(key);
  if (madeCode) {
    CEncrypt encryptor(kTypeCodes[encType], TRUE, CString(static_cast<const std::u16string&>(key)));
    code = Lumo::String(encryptor.EncryptString(CString(kCheckText)).GetString());
  }
  if (std::getenv("OWFUZZ_DUMP") != nullptr) {
    std::fprintf(stderr, "encType %d, key %zu units, code %zu units, made %d\n", encType, key.size(), code.size(), madeCode);
  }
  try {
    const bool verified = VerifySecretKey(key, code, encType);
    FUZZ_CHECK(!key.empty() && !code.empty() && encType != 0);
    // An unknown type is refused by the encryptor once there is a byte to decrypt; a code of
    // one ASCII digit decodes to none, and simply does not verify.
    if (!knownType) FUZZ_CHECK(!verified && code.size() == 1 && code[0] < 0x80);
    if (madeCode) FUZZ_CHECK(verified);
  } catch (const LumoException::PreconditionFailed0&) {
    FUZZ_CHECK(key.empty() || code.empty() || encType == 0);
  } catch (const std::range_error&) {
    FUZZ_CHECK(!WellFormed(code));
  } catch (const LumoException::Exception&) {
    FUZZ_CHECK(!knownType || !WellFormed(key));
  }
}

void CheckDecrypt(FuzzedDataProvider& input) {
  const int type = input.ConsumeIntegralInRange<int>(1, 13);
  const std::u16string key = TextFrom(input, 24);
  const std::u16string hex = TextFrom(input, 300);
  const std::u16string plain = TextFrom(input, 100);
  if (key.empty() || !WellFormed(key)) return;
  CEncrypt encryptor(type, TRUE, CString(key.c_str()));
  if (!hex.empty()) {
    try {
      (void)encryptor.DecryptString(CString(hex.c_str()));
    } catch (const LumoException::Exception&) {
      FUZZ_CHECK(!WellFormed(hex));
    }
  }
  if (!plain.empty() && WellFormed(plain)) {
    const CString code = encryptor.EncryptString(CString(plain.c_str()));
    FUZZ_CHECK(code.GetLength() % 2 == 0 && code.GetLength() >= 2 * static_cast<int>(encryptor.GetBlockSize()));
    FUZZ_CHECK(std::u16string(encryptor.DecryptString(code).GetString()) == plain);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  if (input.ConsumeBool()) {
    CheckVerify(input);
  } else {
    CheckDecrypt(input);
  }
  return 0;
}
