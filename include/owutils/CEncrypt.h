// CEncrypt, the encryptor: block ciphers, digests and file encryption behind one class.
//
// An instance is made for one type code and, for a cipher code, one key text. The key text is
// stretched by repeated SHA-1 into a key of the length the cipher needs; buffers, strings and
// whole files are then encrypted or decrypted block by block, each block on its own (no
// chaining, no initialisation vector). Strings travel as lower-case hexadecimal ciphertext.
//
//   CEncrypt aes(ENC_AES_128, TRUE, CString(u"secret key"));
//   CString code = aes.EncryptString(u"some text");     // 32 hex digits
//   CString text = aes.DecryptString(code);             // "some text"
//
//   CEncrypt sha(DIGEST_SHA1, TRUE);
//   sha.DigestString(u"abc");
//   CString hex = sha.GetDigestResultString();          // "a9993e36..."
//
// Checks raise the framework's exceptions (owutils/Exceptions.h). The file operations never
// raise: they report a failure through the installed event logger and return FALSE. An
// instance belongs to one thread at a time and cannot be copied.
#pragma once

#include <memory>

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

class BlockTransformation;
class HashModule;
class SHA160;
class RIPEMD160;
class RSAMD5;
class CRC32;

// Type codes. Their values are stored by callers and must not change.
enum : int {
  ENC_BLOWFISH = 1,     // Blowfish, 448-bit key (32-bit in reduced strength)
  ENC_TRIPLE_DES = 2,   // three-key triple DES
  ENC_DES = 3,          // two-key triple DES (40-bit single DES in reduced strength)
  ENC_SAFER_SK = 4,     // SAFER SK-128, 10 rounds
  ENC_IDEA = 5,         // IDEA
  ENC_RC5 = 6,          // RC5-32/255/256
  ENC_BLOWFISH_2 = 7,   // Blowfish, 448-bit key (56-bit in reduced strength)
  ENC_DES_2 = 8,        // two-key triple DES (56-bit single DES in reduced strength)
  ENC_TWOFISH = 9,      // Twofish, 128-bit key
  ENC_MARS = 10,        // MARS, 128-bit key
  ENC_AES_128 = 11,
  ENC_AES_192 = 12,
  ENC_AES_256 = 13,
  DIGEST_SHA1 = 20,
  DIGEST_RIPEMD160 = 21,
  DIGEST_MD5 = 22,
  DIGEST_CRC32 = 30,
};

class OWUTILS_API CEncrypt {
 public:
  // For a digest code (no key).
  CEncrypt(int type, BOOL bStrong);
  // For a cipher code. A cipher code with an empty key text, or a key text that is not valid
  // UTF-16, throws and no instance is made.
  CEncrypt(int type, BOOL bStrong, const CString& key);
  ~CEncrypt();
  CEncrypt(const CEncrypt&) = delete;
  CEncrypt& operator=(const CEncrypt&) = delete;

  // ---- Ciphers ----
  // Transform the whole blocks of `data` in place; a trailing partial block stays as it is.
  BOOL Encrypt(BYTE* data, int nLength);
  BOOL Decrypt(BYTE* data, int nLength);
  // UTF-8 of the text, zero-padded to whole blocks, encrypted, as lower-case hex.
  CString EncryptString(const CString& cstrString);
  // The reverse; the plaintext ends at its first zero byte.
  CString DecryptString(const CString& strString);
  // Block length of the decryption object.
  unsigned int GetBlockSize();
  // The display name of a cipher code; any other code throws UnknownEncryptionType.
  static const char16_t* GetEncryptionTypeString(int type);
  // The code used in place of `type`: with reduced strength every code but 1, 3, 7, 8 and the
  // digest codes becomes 7.
  static int MapReducedType(int type, BOOL bReducedStrength);

  // Lower-case hex of n bytes into `out` (2n digits and a terminator); returns 2n.
  static int HexEncode(const BYTE* data, int n, char* out);
  // Hex text of h characters into bytes (digits in either case, others count as 0), then a
  // zero byte; `out` needs (h + 1) / 2 + 1 bytes. Returns h / 2.
  static int HexDecode(const char* text, int h, BYTE* out);

  // ---- Files (encrypted in place: same name, same length, no header) ----
  BOOL EncryptFile(const CString& strFile);
  BOOL DecryptFile(const CString& strFile);

  // ---- Digests ----
  BOOL ResetDigest();
  BOOL Digest(const BYTE* data, int nLength);
  BOOL DigestString(const CString& text);
  BOOL DigestStringAnsi(const CString& text);
  BOOL DigestFile(const CString& strFile);
  // Digests a file in slices of at least `timeout` seconds. Start with *pbFirst TRUE and
  // *pbDone FALSE, call until *pbDone is TRUE; an empty name or a timeout of 0 abandons it.
  BOOL DigestFileWTimeout(const CString& strFile, int timeout, BOOL* pbFirst, BOOL* pbDone);
  // The digest into pData (*pnLength bytes available; set to the digest length). Starts a new
  // message.
  BOOL GetDigestResult(BYTE* pData, int* pnLength);
  int GetDigestResultLength(BOOL bInBytes);
  CString GetDigestResultString();
  CString GetDigestResultStringAnsi();
  // SHA-1 of the key text, whatever the instance's type.
  BOOL GetKeyDigest(BYTE* pData, int* pnLength);
  static int GetKeyDigestLength(BOOL bInBytes);
  CString GetKeyDigestString();

  static constexpr int FILE_BUFFER_SIZE = 20480;

 private:
  void Init();
  BOOL DeriveKey();
  std::unique_ptr<BlockTransformation> MakeCipher(bool encrypt) const;
  // The cipher objects, keyed on first use; null for an instance without a cipher.
  BlockTransformation* Encryptor();
  BlockTransformation* Decryptor();
  BOOL ProcessFile(const CString& strFile, bool encrypt);
  void CloseDigestFile() noexcept;

  int m_nType = 0;
  CString m_strKey;
  std::unique_ptr<BYTE[]> m_pKey;
  unsigned int m_nKeyLength = 0;
  std::unique_ptr<BlockTransformation> m_pEncryptPtr;
  std::unique_ptr<BlockTransformation> m_pDecryptPtr;
  std::unique_ptr<SHA160> m_pSHA;
  std::unique_ptr<RIPEMD160> m_pMD160;
  std::unique_ptr<RSAMD5> m_pMD5;
  std::unique_ptr<CRC32> m_pCRC;
  HANDLE m_hFile;
  BOOL m_bUsingEncr = FALSE;
  BOOL m_bReducedStrength = FALSE;
  BOOL m_bInit = FALSE;
};
