// CEncrypt: digests of buffers and strings, and the key digest.
#include <cstring>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "secure/HashModule.h"
#include "secure/SecureBuffer.h"

namespace {

constexpr int SHA_HASH_OUTPUT_BITS = 160;
constexpr int MD160_HASH_OUTPUT_BITS = 160;
constexpr int MD5_HASH_OUTPUT_BITS = 128;
constexpr int CRC_OUTPUT_BITS = 32;
constexpr int BITS_IN_BYTE = 8;

// Digest length in bytes of a digest code; 0 for any other code.
int DigestBytes(int type) noexcept {
  switch (type) {
    case DIGEST_SHA1: return SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE;
    case DIGEST_RIPEMD160: return MD160_HASH_OUTPUT_BITS / BITS_IN_BYTE;
    case DIGEST_MD5: return MD5_HASH_OUTPUT_BITS / BITS_IN_BYTE;
    case DIGEST_CRC32: return CRC_OUTPUT_BITS / BITS_IN_BYTE;
    default: return 0;
  }
}

}  // namespace

BOOL CEncrypt::ResetDigest() {
  switch (m_nType) {
    case DIGEST_SHA1: m_pSHA = std::make_unique<SHA160>(); return TRUE;
    case DIGEST_RIPEMD160: m_pMD160 = std::make_unique<RIPEMD160>(); return TRUE;
    case DIGEST_MD5: m_pMD5 = std::make_unique<RSAMD5>(); return TRUE;
    case DIGEST_CRC32:
      if (m_pCRC) m_pCRC->Reset();
      return TRUE;
    default: return FALSE;
  }
}

BOOL CEncrypt::Digest(const BYTE* data, int nLength) {
  if (nLength == 0) return TRUE;
  HashModule* hash = nullptr;
  switch (m_nType) {
    case DIGEST_SHA1: hash = m_pSHA.get(); break;
    case DIGEST_RIPEMD160: hash = m_pMD160.get(); break;
    case DIGEST_MD5: hash = m_pMD5.get(); break;
    case DIGEST_CRC32: hash = m_pCRC.get(); break;
    default: break;
  }
  // A negative length feeds nothing: it can only be a caller's mistake.
  if (hash != nullptr && nLength > 0) hash->Update(data, static_cast<unsigned int>(nLength));
  return TRUE;
}

BOOL CEncrypt::DigestString(const CString& text) {
  ResetDigest();
  std::string utf8 = secure::StrictUtf8(text.GetString(), static_cast<size_t>(text.GetLength()));
  const BOOL result = Digest(reinterpret_cast<const BYTE*>(utf8.data()), static_cast<int>(utf8.size()));
  secure::Wipe(utf8.data(), utf8.size());
  return result;
}

BOOL CEncrypt::DigestStringAnsi(const CString& text) {
  ResetDigest();
  if (text.IsEmpty()) return Digest(nullptr, 0);
  Lumo::CharArrayHolder ansi = Lumo::String(text.GetString()).ToAnsi();
  // The whole converted text: in a multi-byte code page it is longer than the character count.
  const size_t length = ansi.Get() != nullptr ? std::strlen(ansi.Get()) : 0;
  const BOOL result = Digest(reinterpret_cast<const BYTE*>(ansi.Get()), static_cast<int>(length));
  secure::Wipe(ansi.Get(), length);
  return result;
}

BOOL CEncrypt::GetDigestResult(BYTE* pData, int* pnLength) {
  PRECONDITION(pData != NULL);
  const int nLength = *pnLength;
  PRECONDITION(nLength > 0);
  switch (m_nType) {
    case DIGEST_SHA1:
      ASSERTION(m_pSHA);
      ASSERTION2(nLength >= SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE, nLength, SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE);
      std::memset(pData, 0, static_cast<size_t>(nLength));
      m_pSHA->Final(pData);
      *pnLength = SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE;
      break;
    case DIGEST_RIPEMD160:
      ASSERTION(m_pMD160);
      ASSERTION2(nLength >= MD160_HASH_OUTPUT_BITS / BITS_IN_BYTE, nLength, MD160_HASH_OUTPUT_BITS / BITS_IN_BYTE);
      std::memset(pData, 0, static_cast<size_t>(nLength));
      m_pMD160->Final(pData);
      *pnLength = MD160_HASH_OUTPUT_BITS / BITS_IN_BYTE;
      break;
    case DIGEST_MD5:
      ASSERTION(m_pMD5);
      ASSERTION2(nLength >= MD5_HASH_OUTPUT_BITS / BITS_IN_BYTE, nLength, MD5_HASH_OUTPUT_BITS / BITS_IN_BYTE);
      std::memset(pData, 0, static_cast<size_t>(nLength));
      m_pMD5->Final(pData);
      *pnLength = MD5_HASH_OUTPUT_BITS / BITS_IN_BYTE;
      break;
    case DIGEST_CRC32:
      ASSERTION(m_pCRC);
      ASSERTION2(nLength >= CRC_OUTPUT_BITS / BITS_IN_BYTE, nLength, CRC_OUTPUT_BITS / BITS_IN_BYTE);
      m_pCRC->Final(pData);
      *pnLength = CRC_OUTPUT_BITS / BITS_IN_BYTE;
      break;
    default:
      break;
  }
  return TRUE;
}

int CEncrypt::GetDigestResultLength(BOOL bInBytes) {
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == FALSE && m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  const int bytes = DigestBytes(m_nType);
  if (bytes == 0) THROW_AT(UnknownEncryptionType(u"CEncrypt::GetDigestResultLength", m_nType));
  return bInBytes ? bytes : bytes * BITS_IN_BYTE;
}

CString CEncrypt::GetDigestResultString() {
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == FALSE && m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  const int bytes = DigestBytes(m_nType);
  if (bytes == 0) THROW_AT(UnknownEncryptionType(u"CEncrypt::GetDigestResultString", m_nType));
  CString result;
  CHECKPOINT_TRY
    BYTE digest[SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE] = {0};
    char text[2 * sizeof digest + 3] = {0};
    int length = bytes;
    if (GetDigestResult(digest, &length)) {
      HexEncode(digest, length, text);
      result = secure::WideFromUtf8(text);
    }
  CHECKPOINT_CATCH
  return result;
}

// The ANSI form gives the same text: hex digits are the same in every code page. A code that
// is not a digest code fails as in the wide form.
CString CEncrypt::GetDigestResultStringAnsi() {
  ASSERTION(m_bInit == TRUE);
  ASSERTION2(m_bUsingEncr == FALSE && m_strKey.IsEmpty(), m_bUsingEncr, !m_strKey.IsEmpty());
  const int bytes = DigestBytes(m_nType);
  if (bytes == 0) THROW_AT(UnknownEncryptionType(u"CEncrypt::GetDigestResultStringAnsi", m_nType));
  CString result;
  CHECKPOINT_TRY
    BYTE digest[SHA_HASH_OUTPUT_BITS / BITS_IN_BYTE] = {0};
    char text[2 * sizeof digest + 3] = {0};
    int length = bytes;
    if (GetDigestResult(digest, &length)) {
      HexEncode(digest, length, text);
      Lumo::String wide;
      wide.AssignAnsi(text);
      result = CString(static_cast<const std::u16string&>(wide));
    }
  CHECKPOINT_CATCH
  return result;
}

BOOL CEncrypt::GetKeyDigest(BYTE* pData, int* pnLength) {
  const int nHashLength = GetKeyDigestLength(TRUE);
  PRECONDITION(pData != NULL);
  const int nLength = *pnLength;
  ASSERTION2(nLength >= nHashLength, nLength, nHashLength);
  ASSERTION(!m_pSHA);

  m_pSHA = std::make_unique<SHA160>();
  const int savedType = m_nType;
  m_nType = DIGEST_SHA1;
  try {
    std::memset(pData, 0, static_cast<size_t>(nLength));
    DigestString(m_strKey);
    int length = nLength;
    GetDigestResult(pData, &length);
  } catch (...) {
    m_pSHA.reset();
    m_nType = savedType;
    throw;
  }
  m_pSHA.reset();
  m_nType = savedType;
  *pnLength = nHashLength;
  return TRUE;
}

int CEncrypt::GetKeyDigestLength(BOOL bInBytes) { return bInBytes ? 20 : 160; }

CString CEncrypt::GetKeyDigestString() {
  CString result;
  try {
    CHECKPOINT_TRY
      BYTE digest[20] = {0};
      char text[43] = {0};
      int length = sizeof digest;
      if (GetKeyDigest(digest, &length)) {
        HexEncode(digest, length, text);
        result = secure::WideFromUtf8(text);
      }
    CHECKPOINT_CATCH
  } catch (LumoException::Exception&) {
    throw;
  } catch (...) {
    THROW_AT(LumoException::UnhandledException());
  }
  return result;
}
