#include <cstring>
#include <stdexcept>
#include <string>

#include "owutils/BitCodecs.h"
#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/SecretKey.h"
#include "secure/SecureBuffer.h"

namespace {

constexpr char kCheckText[] = "harborlanternmeadowquietstoneelm";
constexpr size_t kCheckLength = sizeof kCheckText - 1;  // 32
constexpr size_t kWorkBufferSize = 128;
// Hex digits the work buffer holds: 127 bytes and the terminating zero.
constexpr size_t kMaxDigits = 2 * (kWorkBufferSize - 1);

int TypeCodeFor(int encType) noexcept {
  switch (encType) {
    case 1: return ENC_BLOWFISH;
    case 2: return ENC_TRIPLE_DES;
    case 3: return ENC_DES;
    case 4: return ENC_SAFER_SK;
    case 5: return ENC_IDEA;
    case 6: return ENC_RC5;
    case 7: return ENC_TWOFISH;
    case 8: return ENC_MARS;
    case 9: return ENC_AES_128;
    case 10: return ENC_AES_192;
    case 11: return ENC_AES_256;
    default: return 0;
  }
}

// The UTF-8 form; an unpaired surrogate fails as the standard converter does.
std::string CodeToUtf8(const Lumo::String& code) {
  try {
    return secure::StrictUtf8(code.c_str(), code.size());
  } catch (LumoException::Exception&) {
    throw std::range_error("bad conversion");
  }
}

}  // namespace

bool VerifySecretKey(const Lumo::String& secretKey, const Lumo::String& hexEncryptionCode, int encType) {
  PRECONDITION(secretKey.empty() == false);
  PRECONDITION(hexEncryptionCode.empty() == false);
  PRECONDITION(encType != 0);

  const std::string code = CodeToUtf8(hexEncryptionCode);

  // Only the first 33 bytes take part in the comparison, and they come out the same whether a
  // longer code is decoded whole or cut to what the buffer holds, since at most 48 bytes (up to
  // the end of the block holding byte 32) are ever looked at.
  secure::SecureBuffer work(kWorkBufferSize);
  const size_t digits = code.size() < kMaxDigits ? code.size() : kMaxDigits;
  const unsigned int n = AsciiToBits(code.data(), static_cast<unsigned int>(digits), work.get());

  CEncrypt encryptor(TypeCodeFor(encType), TRUE, CString(static_cast<const std::u16string&>(secretKey)));
  if (n > 0) encryptor.Decrypt(work.get(), static_cast<int>(n));

  // Constant time: every byte is looked at whatever the first difference.
  unsigned int difference = work.get()[kCheckLength];
  for (size_t i = 0; i < kCheckLength; ++i) {
    difference |= static_cast<unsigned int>(work.get()[i] ^ static_cast<BYTE>(kCheckText[i]));
  }
  return difference == 0;
}

Lumo::String MakeSecretKeyCode(const Lumo::String& secretKey, int encType) {
  PRECONDITION(secretKey.empty() == false);
  PRECONDITION(TypeCodeFor(encType) != 0);
  CEncrypt encryptor(TypeCodeFor(encType), TRUE, CString(static_cast<const std::u16string&>(secretKey)));
  Lumo::String checkText;
  checkText.AssignUtf8(kCheckText);
  return Lumo::String(encryptor.EncryptString(CString(checkText.c_str())).str());
}
