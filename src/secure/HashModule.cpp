#include "secure/HashModule.h"

#define CRYPTOPP_ENABLE_NAMESPACE_WEAK 1
#include <crypto++/md5.h>
#include <crypto++/ripemd.h>
#include <crypto++/sha.h>
#include <zlib.h>

HashModule::~HashModule() = default;

void HashModule::CalculateDigest(BYTE* digest, const BYTE* input, int length) {
  Update(input, length > 0 ? static_cast<unsigned int>(length) : 0u);
  Final(digest);
}

// ---- Iterated hashes --------------------------------------------------------------------------

IteratedHash::IteratedHash(std::unique_ptr<CryptoPP::HashTransformation> engine) : m_pEngine(std::move(engine)) {}

IteratedHash::~IteratedHash() = default;

void IteratedHash::Update(const BYTE* input, unsigned int length) {
  if (length != 0) m_pEngine->Update(input, length);
}

void IteratedHash::Final(BYTE* digest) { m_pEngine->Final(digest); }

unsigned int IteratedHash::DigestSize() const { return m_pEngine->DigestSize(); }

void IteratedHash::Init() { m_pEngine->Restart(); }

void IteratedHash::HashBlock(const BYTE* block) { m_pEngine->Update(block, kBlockSize); }

SHA160::SHA160() : IteratedHash(std::make_unique<CryptoPP::SHA1>()) {}
RIPEMD160::RIPEMD160() : IteratedHash(std::make_unique<CryptoPP::RIPEMD160>()) {}
RSAMD5::RSAMD5() : IteratedHash(std::make_unique<CryptoPP::Weak::MD5>()) {}

// ---- CRC-32 -----------------------------------------------------------------------------------

void CRC32::Update(const BYTE* input, unsigned int length) {
  // zlib works on the complemented register.
  m_crc = ~static_cast<std::uint32_t>(crc32_z(~m_crc, input, length));
}

void CRC32::Final(BYTE* digest) {
  const std::uint32_t value = ~m_crc;
  digest[0] = static_cast<BYTE>(value);
  digest[1] = static_cast<BYTE>(value >> 8);
  digest[2] = static_cast<BYTE>(value >> 16);
  digest[3] = static_cast<BYTE>(value >> 24);
  Reset();
}
