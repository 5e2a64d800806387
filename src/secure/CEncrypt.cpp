#include "owutils/CEncrypt.h"

#include <cstring>

#include "owutils/BitCodecs.h"
#include "owutils/Exceptions.h"
#include "secure/BlockTransformation.h"
#include "secure/HashModule.h"
#include "secure/SecureBuffer.h"

using secure::SecureBuffer;

namespace {

constexpr int kSafer128Rounds = 10;
constexpr unsigned int kRC5Rounds = 255;
constexpr unsigned int kRC5KeyBytes = 256;
constexpr unsigned int kShaBits = 160;

bool IsCipherCode(int type) noexcept { return type >= 1 && type <= 13; }

// Derived key length in bits for a type; 0 where reduced strength has no key for it.
unsigned int KeyBitsFor(int type, BOOL reduced) noexcept {
  if (reduced) {
    switch (type) {
      case ENC_BLOWFISH: return 32;
      case ENC_DES:
      case ENC_DES_2: return 64;
      case ENC_BLOWFISH_2: return 56;
      default: return 0;
    }
  }
  switch (type) {
    case ENC_BLOWFISH:
    case ENC_BLOWFISH_2: return 448;
    case ENC_TRIPLE_DES:
    case ENC_AES_192: return 192;
    case ENC_RC5: return 2048;
    case ENC_AES_256: return 256;
    default: return 128;
  }
}

}  // namespace

// ---- Construction -----------------------------------------------------------------------------

CEncrypt::CEncrypt(int type, BOOL bStrong) : m_hFile(INVALID_HANDLE_VALUE) {
  m_bReducedStrength = !bStrong;
  m_nType = MapReducedType(type, m_bReducedStrength);
  try {
    Init();
  } catch (...) {
    secure::Wipe(m_pKey.get(), m_nKeyLength);
    throw;
  }
}

CEncrypt::CEncrypt(int type, BOOL bStrong, const CString& key) : m_hFile(INVALID_HANDLE_VALUE) {
  m_bReducedStrength = !bStrong;
  m_nType = MapReducedType(type, m_bReducedStrength);
  m_strKey = key;
  try {
    Init();
  } catch (...) {
    secure::Wipe(m_pKey.get(), m_nKeyLength);
    throw;
  }
}

CEncrypt::~CEncrypt() {
  CloseDigestFile();
  m_pCRC.reset();
  m_pMD5.reset();
  m_pMD160.reset();
  m_pSHA.reset();
  secure::Wipe(m_pKey.get(), m_nKeyLength);
  m_pKey.reset();
  m_pDecryptPtr.reset();
  m_pEncryptPtr.reset();
}

int CEncrypt::MapReducedType(int type, BOOL bReducedStrength) {
  if (!bReducedStrength) return type;
  switch (type) {
    case ENC_BLOWFISH:
    case ENC_DES:
    case ENC_BLOWFISH_2:
    case ENC_DES_2:
    case DIGEST_SHA1:
    case DIGEST_RIPEMD160:
    case DIGEST_MD5:
    case DIGEST_CRC32: return type;
    default: return ENC_BLOWFISH_2;
  }
}

const char16_t* CEncrypt::GetEncryptionTypeString(int type) {
  switch (type) {
    case ENC_BLOWFISH:
    case ENC_BLOWFISH_2: return u"448-bit BlowFish";
    case ENC_TRIPLE_DES: return u"192-bit Triple-DES";
    case ENC_DES:
    case ENC_DES_2: return u"128-bit DES";
    case ENC_SAFER_SK: return u"128-bit Safer-SK";
    case ENC_IDEA: return u"128-bit IDEA";
    case ENC_RC5: return u"2048-bit RC5";
    case ENC_TWOFISH: return u"128-bit TwoFish";
    case ENC_MARS: return u"128-bit Mars";
    case ENC_AES_128: return u"128-bit AES";
    case ENC_AES_192: return u"192-bit AES";
    case ENC_AES_256: return u"256-bit AES";
    default: THROW_AT(UnknownEncryptionType(u"CEncrypt::GetEncryptionTypeString", type));
  }
}

void CEncrypt::Init() {
  m_bUsingEncr = IsCipherCode(m_nType) ? TRUE : FALSE;
  ASSERTION2(m_bUsingEncr == FALSE || !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  if (m_bUsingEncr == FALSE) {
    m_bInit = TRUE;
  } else {
    DeriveKey();
    m_bInit = TRUE;
    ASSERTION(m_pKey != nullptr);
  }

  switch (m_nType) {
    case ENC_DES:
    case ENC_DES_2:
      if (m_bReducedStrength) {
        // Export-grade single DES: 40 (code 3) or 56 (code 8) effective key bits.
        if (m_nType == ENC_DES) {
          m_pKey[5] = 0;
          m_pKey[6] = 0;
        }
        m_pKey[7] = 0;
      }
      break;
    case DIGEST_SHA1:
      m_pSHA = std::make_unique<SHA160>();
      ResetDigest();
      break;
    case DIGEST_RIPEMD160:
      m_pMD160 = std::make_unique<RIPEMD160>();
      ResetDigest();
      break;
    case DIGEST_MD5:
      m_pMD5 = std::make_unique<RSAMD5>();
      ResetDigest();
      break;
    case DIGEST_CRC32:
      m_pCRC = std::make_unique<CRC32>();
      ResetDigest();
      break;
    default:
      break;
  }
}

// The cipher objects are keyed on first use: a caller that only decrypts (the secret-key check)
// never pays for the encryption key schedule, which for Blowfish and RC5 costs more than the
// decryption itself.
std::unique_ptr<BlockTransformation> CEncrypt::MakeCipher(bool encrypt) const {
  const BYTE* key = m_pKey.get();
  switch (m_nType) {
    case ENC_BLOWFISH:
    case ENC_BLOWFISH_2: {
      const unsigned int length = m_bReducedStrength ? (m_nType == ENC_BLOWFISH ? 4u : 7u) : 56u;
      if (encrypt) return std::make_unique<BlowfishEncryption>(key, length);
      return std::make_unique<BlowfishDecryption>(key, length);
    }
    case ENC_TRIPLE_DES:
      if (encrypt) return std::make_unique<TripleDES_Encryption>(key);
      return std::make_unique<TripleDES_Decryption>(key);
    case ENC_DES:
    case ENC_DES_2:
      if (m_bReducedStrength) {
        if (encrypt) return std::make_unique<DESEncryption>(key);
        return std::make_unique<DESDecryption>(key);
      }
      if (encrypt) return std::make_unique<DES_EDE_Encryption>(key);
      return std::make_unique<DES_EDE_Decryption>(key);
    case ENC_SAFER_SK:
      if (encrypt) return std::make_unique<SAFER_SK128_Encryption>(key, key + 8, kSafer128Rounds);
      return std::make_unique<SAFER_SK128_Decryption>(key, key + 8, kSafer128Rounds);
    case ENC_IDEA:
      if (encrypt) return std::make_unique<IDEAEncryption>(key);
      return std::make_unique<IDEADecryption>(key);
    case ENC_RC5:
      if (encrypt) return std::make_unique<RC5Encryption>(key, kRC5KeyBytes, kRC5Rounds);
      return std::make_unique<RC5Decryption>(key, kRC5KeyBytes, kRC5Rounds);
    case ENC_TWOFISH:
      if (encrypt) return std::make_unique<TwofishEncryption>(key, 16);
      return std::make_unique<TwofishDecryption>(key, 16);
    case ENC_MARS:
      if (encrypt) return std::make_unique<MARSEncryption>(key, 16);
      return std::make_unique<MARSDecryption>(key, 16);
    case ENC_AES_128:
    case ENC_AES_192:
    case ENC_AES_256: {
      const unsigned int length = m_nType == ENC_AES_128 ? 16u : m_nType == ENC_AES_192 ? 24u : 32u;
      if (encrypt) return std::make_unique<AES_Encryption>(key, length);
      return std::make_unique<AES_Decryption>(key, length);
    }
    default:
      return nullptr;
  }
}

BlockTransformation* CEncrypt::Encryptor() {
  if (!m_pEncryptPtr && m_bUsingEncr && m_pKey) m_pEncryptPtr = MakeCipher(true);
  return m_pEncryptPtr.get();
}

BlockTransformation* CEncrypt::Decryptor() {
  if (!m_pDecryptPtr && m_bUsingEncr && m_pKey) m_pDecryptPtr = MakeCipher(false);
  return m_pDecryptPtr.get();
}

// The key is D0 || D1 || D2 ... cut to the key length, where D0 is the SHA-1 of the key text in
// UTF-8 and every following Dn the SHA-1 of all key bytes produced so far. A failure on the way
// leaves the constructor: an instance must never go on with a partly zero key.
BOOL CEncrypt::DeriveKey() {
  ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  const unsigned int bits = KeyBitsFor(m_nType, m_bReducedStrength);
  if (bits == 0) return FALSE;

  const int savedType = m_nType;
  m_nType = DIGEST_SHA1;
  m_pSHA = std::make_unique<SHA160>();
  BYTE digest[kShaBits / 8] = {0};
  auto restore = [&]() noexcept {
    secure::Wipe(digest, sizeof digest);
    m_pSHA.reset();
    m_nType = savedType;
  };

  try {
    CHECKPOINT_TRY
      DigestString(m_strKey);
      int length = sizeof digest;
      GetDigestResult(digest, &length);

      m_nKeyLength = bits / 8;
      m_pKey.reset(new BYTE[m_nKeyLength]());
      unsigned int i = kShaBits;
      for (; bits >= i; i += kShaBits) {
        std::memcpy(m_pKey.get() + (i - kShaBits) / 8, digest, sizeof digest);
        ResetDigest();
        Digest(m_pKey.get(), static_cast<int>(i / 8));
        length = sizeof digest;
        GetDigestResult(digest, &length);
      }
      std::memcpy(m_pKey.get() + (i - kShaBits) / 8, digest, (bits - (i - kShaBits)) / 8);
    CHECKPOINT_CATCH
  } catch (...) {
    restore();
    throw;
  }
  restore();
  return TRUE;
}

// ---- Buffers ----------------------------------------------------------------------------------

BOOL CEncrypt::Encrypt(BYTE* data, int nLength) {
  PRECONDITION(data != NULL && nLength > 0);
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  BlockTransformation* cipher = Encryptor();
  cipher->ProcessBlocks(data, static_cast<size_t>(nLength) / cipher->BlockSize());
  return TRUE;
}

BOOL CEncrypt::Decrypt(BYTE* data, int nLength) {
  PRECONDITION(data != NULL && nLength > 0);
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  BlockTransformation* cipher = Decryptor();
  cipher->ProcessBlocks(data, static_cast<size_t>(nLength) / cipher->BlockSize());
  return TRUE;
}

unsigned int CEncrypt::GetBlockSize() {
  Decryptor();
  ASSERTION(m_pDecryptPtr.get() != NULL);
  return m_pDecryptPtr->BlockSize();
}

// ---- Strings ----------------------------------------------------------------------------------

int CEncrypt::HexEncode(const BYTE* data, int n, char* out) { return BitsToAscii(data, n, out); }

int CEncrypt::HexDecode(const char* text, int h, BYTE* out) {
  return static_cast<int>(AsciiToBits(text, h > 0 ? static_cast<unsigned int>(h) : 0u, out));
}

CString CEncrypt::EncryptString(const CString& cstrString) {
  PRECONDITION(!cstrString.IsEmpty());
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());

  std::string utf8 = secure::StrictUtf8(cstrString.GetString(), static_cast<size_t>(cstrString.GetLength()));
  const size_t n = utf8.size();
  BlockTransformation* cipher = Encryptor();
  const size_t block = cipher->BlockSize();
  const size_t blocks = n / block + (n % block != 0 ? 1 : 0);
  const size_t total = (blocks == 0 ? 1 : blocks) * block;

  SecureBuffer buffer(total + 1);
  std::memcpy(buffer.get(), utf8.data(), n);
  secure::Wipe(utf8.data(), utf8.size());
  cipher->ProcessBlocks(buffer.get(), total / block);

  std::string hex(2 * total + 1, '\0');
  HexEncode(buffer.get(), static_cast<int>(total), hex.data());
  hex.resize(2 * total);
  return secure::WideFromUtf8(hex.c_str());
}

CString CEncrypt::DecryptString(const CString& strString) {
  PRECONDITION(!strString.IsEmpty());
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == TRUE && !m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());

  const std::string hex = secure::StrictUtf8(strString.GetString(), static_cast<size_t>(strString.GetLength()));
  const size_t h = hex.size();
  BlockTransformation* cipher = Decryptor();
  const size_t block = cipher->BlockSize();
  const size_t q = (h / 2) / block;
  const size_t total = (2 * q * block < h) ? (q + 1) * block : q * block;

  // (h + 1) / 2 decoded bytes and a zero byte always fit in total + 1.
  SecureBuffer buffer(total + 1);
  HexDecode(hex.c_str(), static_cast<int>(h), buffer.get());
  cipher->ProcessBlocks(buffer.get(), total / block);
  buffer.get()[total] = 0;
  return secure::WideFromUtf8(buffer.chars());
}
