// The block ciphers of the encryptor's menu.
//
// BlockTransformation is the one interface through which CEncrypt drives every cipher: one
// block at a time (the virtual operations every cipher has), or many blocks at once through
// ProcessBlocks, which the library-backed ciphers route to the library's multi-block path
// (AES-NI and the like). Each cipher comes as an algorithm class and two direction classes
// that differ only in how the key schedule is built:
//
//   AES_Encryption enc(key, 16);
//   enc.ProcessBlock(block);             // one 16-byte block in place
//   enc.ProcessBlocks(buffer, count);    // `count` whole blocks in place, each independently
//
// The algorithm bodies are Crypto++'s, except RC5: the menu keys it with 256 bytes, one more
// than the library's RC5 accepts, so RC5 is our own, checked against the published vectors.
// Every key schedule is wiped when released.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

#include "owutils/WinTypes.h"

namespace CryptoPP {
class BlockCipher;
}

class BlockTransformation {
 public:
  virtual ~BlockTransformation();
  // Transforms the block at `in` into `out`; the two may be the same block.
  virtual void ProcessBlock(const BYTE* in, BYTE* out) const = 0;
  // Transforms one block in place.
  virtual void ProcessBlock(BYTE* inout) const = 0;
  // Block length in bytes (8 or 16).
  virtual unsigned int BlockSize() const = 0;
  // Transforms `count` whole blocks in place, each independently of the others.
  virtual void ProcessBlocks(BYTE* data, size_t count) const;
};

namespace secure::detail {
// One keyed Crypto++ cipher, the shared body of the catalogue's ciphers.
class CipherEngine {
 public:
  explicit CipherEngine(std::unique_ptr<CryptoPP::BlockCipher> cipher);
  ~CipherEngine();
  CipherEngine(const CipherEngine&) = delete;
  CipherEngine& operator=(const CipherEngine&) = delete;

  void Process(const BYTE* in, BYTE* out) const;
  void ProcessMany(BYTE* data, size_t count) const;
  unsigned int BlockSize() const noexcept { return m_blockSize; }

 private:
  std::unique_ptr<CryptoPP::BlockCipher> m_pCipher;
  unsigned int m_blockSize;
};
}  // namespace secure::detail

// An algorithm class: a BlockTransformation over one keyed engine, built by its direction
// classes only.
#define OW_DECLARE_BLOCK_ALGORITHM_(Name)                                       \
  class Name : public BlockTransformation {                                     \
   public:                                                                      \
    void ProcessBlock(const BYTE* in, BYTE* out) const override;                \
    void ProcessBlock(BYTE* inout) const override;                              \
    unsigned int BlockSize() const override;                                    \
    void ProcessBlocks(BYTE* data, size_t count) const override;                \
                                                                                \
   protected:                                                                   \
    explicit Name(std::unique_ptr<CryptoPP::BlockCipher> cipher);               \
                                                                                \
   private:                                                                     \
    secure::detail::CipherEngine m_engine;                                      \
  };

OW_DECLARE_BLOCK_ALGORITHM_(Blowfish)
OW_DECLARE_BLOCK_ALGORITHM_(DES)
OW_DECLARE_BLOCK_ALGORITHM_(IDEA)
OW_DECLARE_BLOCK_ALGORITHM_(SAFER)
OW_DECLARE_BLOCK_ALGORITHM_(Twofish)
OW_DECLARE_BLOCK_ALGORITHM_(MARS)

// Blowfish, 16 rounds; key of 4 to 56 bytes.
class BlowfishEncryption : public Blowfish {
 public:
  BlowfishEncryption(const BYTE* key, unsigned int keyLength);
};
class BlowfishDecryption : public Blowfish {
 public:
  BlowfishDecryption(const BYTE* key, unsigned int keyLength);
};

// Single DES; 8-byte key, parity bits ignored.
class DESEncryption : public DES {
 public:
  explicit DESEncryption(const BYTE* key);
};
class DESDecryption : public DES {
 public:
  explicit DESDecryption(const BYTE* key);
};

// IDEA; 16-byte key.
class IDEAEncryption : public IDEA {
 public:
  explicit IDEAEncryption(const BYTE* key);
};
class IDEADecryption : public IDEA {
 public:
  explicit IDEADecryption(const BYTE* key);
};

// RC5 with 32-bit words (Rivest's RC5-32/r/b): key of 0 to 256 bytes, 1 to 255 rounds. Our own
// body: the library's stops at 255 key bytes, and its key set-up is the slowest part of a
// secret-key check.
class RC5Base : public BlockTransformation {
 public:
  ~RC5Base() override;
  void ProcessBlock(const BYTE* in, BYTE* out) const override;
  void ProcessBlock(BYTE* inout) const override;
  unsigned int BlockSize() const override;
  void ProcessBlocks(BYTE* data, size_t count) const override;

 protected:
  RC5Base(const BYTE* key, unsigned int keyLength, unsigned int rounds, bool encrypt);

 private:
  void EncryptBlock(const BYTE* in, BYTE* out) const noexcept;
  void DecryptBlock(const BYTE* in, BYTE* out) const noexcept;

  std::unique_ptr<std::uint32_t[]> m_pTable;  // the expanded key S, 2r + 2 words
  unsigned int m_rounds;
  bool m_bEncrypt;
};

class RC5Encryption : public RC5Base {
 public:
  RC5Encryption(const BYTE* key, unsigned int keyLength, unsigned int rounds);
};
class RC5Decryption : public RC5Base {
 public:
  RC5Decryption(const BYTE* key, unsigned int keyLength, unsigned int rounds);
};

// SAFER SK-128: the first key half from key bytes 0-7, the second from 8-15.
class SAFER_SK128_Encryption : public SAFER {
 public:
  SAFER_SK128_Encryption(const BYTE* keyA, const BYTE* keyB, unsigned int rounds);
};
class SAFER_SK128_Decryption : public SAFER {
 public:
  SAFER_SK128_Decryption(const BYTE* keyA, const BYTE* keyB, unsigned int rounds);
};

// Twofish and MARS; key of 16 to 32 bytes (the menu uses 16).
class TwofishEncryption : public Twofish {
 public:
  TwofishEncryption(const BYTE* key, unsigned int keyLength);
};
class TwofishDecryption : public Twofish {
 public:
  TwofishDecryption(const BYTE* key, unsigned int keyLength);
};
class MARSEncryption : public MARS {
 public:
  MARSEncryption(const BYTE* key, unsigned int keyLength);
};
class MARSDecryption : public MARS {
 public:
  MARSDecryption(const BYTE* key, unsigned int keyLength);
};

// Ciphers keyed directly, without a separate algorithm class.
#define OW_DECLARE_DIRECT_CIPHER_(Name, ...)                                    \
  class Name : public BlockTransformation {                                     \
   public:                                                                      \
    explicit Name(__VA_ARGS__);                                                 \
    void ProcessBlock(const BYTE* in, BYTE* out) const override;                \
    void ProcessBlock(BYTE* inout) const override;                              \
    unsigned int BlockSize() const override;                                    \
    void ProcessBlocks(BYTE* data, size_t count) const override;                \
                                                                                \
   private:                                                                     \
    secure::detail::CipherEngine m_engine;                                      \
  };

// Triple DES in its two keying options: E(K1) D(K2) E(K1) from a 16-byte key (K1 = bytes 0-7,
// K2 = bytes 8-15) and E(K1) D(K2) E(K3) from a 24-byte key; decryption applies the inverse.
OW_DECLARE_DIRECT_CIPHER_(DES_EDE_Encryption, const BYTE* key)
OW_DECLARE_DIRECT_CIPHER_(DES_EDE_Decryption, const BYTE* key)
OW_DECLARE_DIRECT_CIPHER_(TripleDES_Encryption, const BYTE* key)
OW_DECLARE_DIRECT_CIPHER_(TripleDES_Decryption, const BYTE* key)

// AES (FIPS 197): 16-byte block, key of 16, 24 or 32 bytes (10, 12 or 14 rounds).
OW_DECLARE_DIRECT_CIPHER_(AES_Encryption, const BYTE* key, unsigned int keyLength)
OW_DECLARE_DIRECT_CIPHER_(AES_Decryption, const BYTE* key, unsigned int keyLength)

#undef OW_DECLARE_BLOCK_ALGORITHM_
#undef OW_DECLARE_DIRECT_CIPHER_
