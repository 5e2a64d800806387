// The message digests of the encryptor's menu.
//
// HashModule is the interface through which CEncrypt drives every digest: feed bytes with
// Update, take the digest with Final (which leaves the object ready for a new message).
//
//   SHA160 sha;
//   sha.Update(data, length);
//   BYTE digest[20];
//   sha.Final(digest);
//
// SHA-1, RIPEMD-160 and MD5 are iterated hashes over 64-byte blocks whose bodies are Crypto++'s;
// CRC-32 is zlib's (the IEEE 802.3 polynomial, preset and final complement). Hash state is kept
// in library buffers that are wiped when released.
#pragma once

#include <cstdint>
#include <memory>

#include "owutils/WinTypes.h"

namespace CryptoPP {
class HashTransformation;
}

class HashModule {
 public:
  virtual ~HashModule();
  // Feeds `length` bytes.
  virtual void Update(const BYTE* input, unsigned int length) = 0;
  // Writes DigestSize() bytes and starts a new message.
  virtual void Final(BYTE* digest) = 0;
  virtual unsigned int DigestSize() const = 0;
  // Update, then Final.
  virtual void CalculateDigest(BYTE* digest, const BYTE* input, int length);
};

// A hash over 64-byte blocks of 32-bit words with a 64-bit message bit count.
class IteratedHash : public virtual HashModule {
 public:
  ~IteratedHash() override;
  void Update(const BYTE* input, unsigned int length) override;
  void Final(BYTE* digest) override;
  unsigned int DigestSize() const override;

  static constexpr unsigned int kBlockSize = 64;

 protected:
  explicit IteratedHash(std::unique_ptr<CryptoPP::HashTransformation> engine);
  // Sets the chaining state and the bit count back to their initial values.
  virtual void Init();
  // Feeds one whole 64-byte block.
  virtual void HashBlock(const BYTE* block);

 private:
  std::unique_ptr<CryptoPP::HashTransformation> m_pEngine;
};

// SHA-1 (FIPS 180): 20-byte digest.
class SHA160 : public IteratedHash {
 public:
  SHA160();
};

// RIPEMD-160: 20-byte digest.
class RIPEMD160 : public IteratedHash {
 public:
  RIPEMD160();
};

// MD5 (RFC 1321): 16-byte digest.
class RSAMD5 : public IteratedHash {
 public:
  RSAMD5();
};

// CRC-32 (IEEE 802.3): 4-byte digest, least significant byte first.
class CRC32 : public HashModule {
 public:
  CRC32() = default;
  void Update(const BYTE* input, unsigned int length) override;
  void Final(BYTE* digest) override;
  unsigned int DigestSize() const override { return 4; }
  // Presets the register to 0xFFFFFFFF.
  void Reset() noexcept { m_crc = 0xFFFFFFFFu; }

 private:
  std::uint32_t m_crc = 0xFFFFFFFFu;
};
