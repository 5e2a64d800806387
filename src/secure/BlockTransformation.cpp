#include "secure/BlockTransformation.h"

#include <crypto++/aes.h>
#include <crypto++/blowfish.h>
#include <crypto++/des.h>
#include <crypto++/idea.h>
#include <crypto++/mars.h>
#include <crypto++/misc.h>
#include <crypto++/safer.h>
#include <crypto++/twofish.h>

#include <bit>
#include <cstring>

// ---- BlockTransformation ----------------------------------------------------------------------

BlockTransformation::~BlockTransformation() = default;

void BlockTransformation::ProcessBlocks(BYTE* data, size_t count) const {
  const unsigned int size = BlockSize();
  for (size_t i = 0; i < count; ++i) ProcessBlock(data + i * size);
}

// ---- The library engine -----------------------------------------------------------------------

namespace secure::detail {

CipherEngine::CipherEngine(std::unique_ptr<CryptoPP::BlockCipher> cipher)
    : m_pCipher(std::move(cipher)), m_blockSize(m_pCipher->BlockSize()) {}

CipherEngine::~CipherEngine() = default;

void CipherEngine::Process(const BYTE* in, BYTE* out) const { m_pCipher->ProcessBlock(in, out); }

void CipherEngine::ProcessMany(BYTE* data, size_t count) const {
  if (count == 0) return;
  // Electronic-codebook use: no chaining, no xor input, every block on its own.
  m_pCipher->AdvancedProcessBlocks(data, nullptr, data, count * m_blockSize, 0);
}

}  // namespace secure::detail

namespace {

template <class Cipher>
std::unique_ptr<CryptoPP::BlockCipher> Keyed(const BYTE* key, size_t length) {
  return std::make_unique<Cipher>(key, length);
}

template <class Cipher>
std::unique_ptr<CryptoPP::BlockCipher> KeyedRounds(const BYTE* key, size_t length, unsigned int rounds) {
  return std::make_unique<Cipher>(key, length, rounds);
}

// SAFER SK-128 from its two 64-bit key halves.
template <class Cipher>
std::unique_ptr<CryptoPP::BlockCipher> KeyedSafer(const BYTE* keyA, const BYTE* keyB, unsigned int rounds) {
  BYTE key[16];
  std::memcpy(key, keyA, 8);
  std::memcpy(key + 8, keyB, 8);
  auto cipher = std::make_unique<Cipher>(key, sizeof key, rounds);
  CryptoPP::SecureWipeArray(key, sizeof key);
  return cipher;
}

}  // namespace

// ---- Algorithm and direction classes ---------------------------------------------------------

#define OW_DEFINE_FORWARDING_(Name)                                                                 \
  void Name::ProcessBlock(const BYTE* in, BYTE* out) const { m_engine.Process(in, out); }          \
  void Name::ProcessBlock(BYTE* inout) const { m_engine.Process(inout, inout); }                   \
  unsigned int Name::BlockSize() const { return m_engine.BlockSize(); }                            \
  void Name::ProcessBlocks(BYTE* data, size_t count) const { m_engine.ProcessMany(data, count); }

#define OW_DEFINE_BLOCK_ALGORITHM_(Name) \
  Name::Name(std::unique_ptr<CryptoPP::BlockCipher> cipher) : m_engine(std::move(cipher)) {} \
  OW_DEFINE_FORWARDING_(Name)

OW_DEFINE_BLOCK_ALGORITHM_(Blowfish)
OW_DEFINE_BLOCK_ALGORITHM_(DES)
OW_DEFINE_BLOCK_ALGORITHM_(IDEA)
OW_DEFINE_BLOCK_ALGORITHM_(SAFER)
OW_DEFINE_BLOCK_ALGORITHM_(Twofish)
OW_DEFINE_BLOCK_ALGORITHM_(MARS)

BlowfishEncryption::BlowfishEncryption(const BYTE* key, unsigned int keyLength)
    : Blowfish(Keyed<CryptoPP::Blowfish::Encryption>(key, keyLength)) {}
BlowfishDecryption::BlowfishDecryption(const BYTE* key, unsigned int keyLength)
    : Blowfish(Keyed<CryptoPP::Blowfish::Decryption>(key, keyLength)) {}

DESEncryption::DESEncryption(const BYTE* key) : DES(Keyed<CryptoPP::DES::Encryption>(key, 8)) {}
DESDecryption::DESDecryption(const BYTE* key) : DES(Keyed<CryptoPP::DES::Decryption>(key, 8)) {}

IDEAEncryption::IDEAEncryption(const BYTE* key) : IDEA(Keyed<CryptoPP::IDEA::Encryption>(key, 16)) {}
IDEADecryption::IDEADecryption(const BYTE* key) : IDEA(Keyed<CryptoPP::IDEA::Decryption>(key, 16)) {}

RC5Encryption::RC5Encryption(const BYTE* key, unsigned int keyLength, unsigned int rounds)
    : RC5Base(key, keyLength, rounds, true) {}
RC5Decryption::RC5Decryption(const BYTE* key, unsigned int keyLength, unsigned int rounds)
    : RC5Base(key, keyLength, rounds, false) {}

// ---- RC5-32 -----------------------------------------------------------------------------------

namespace {

constexpr std::uint32_t kRC5P32 = 0xB7E15163u;
constexpr std::uint32_t kRC5Q32 = 0x9E3779B9u;
constexpr unsigned int kRC5MaxKey = 256;

std::uint32_t LoadLittle(const BYTE* p) noexcept {
  return static_cast<std::uint32_t>(p[0]) | static_cast<std::uint32_t>(p[1]) << 8 |
         static_cast<std::uint32_t>(p[2]) << 16 | static_cast<std::uint32_t>(p[3]) << 24;
}

void StoreLittle(BYTE* p, std::uint32_t v) noexcept {
  p[0] = static_cast<BYTE>(v);
  p[1] = static_cast<BYTE>(v >> 8);
  p[2] = static_cast<BYTE>(v >> 16);
  p[3] = static_cast<BYTE>(v >> 24);
}

}  // namespace

RC5Base::RC5Base(const BYTE* key, unsigned int keyLength, unsigned int rounds, bool encrypt)
    : m_rounds(rounds), m_bEncrypt(encrypt) {
  if (keyLength > kRC5MaxKey) keyLength = kRC5MaxKey;
  const unsigned int t = 2 * rounds + 2;
  m_pTable.reset(new std::uint32_t[t]);
  std::uint32_t* s = m_pTable.get();

  // Key bytes into little-endian words L, at least one word.
  const unsigned int c = keyLength == 0 ? 1 : (keyLength + 3) / 4;
  std::uint32_t l[kRC5MaxKey / 4] = {0};
  for (unsigned int i = keyLength; i-- > 0;) l[i / 4] = (l[i / 4] << 8) + key[i];

  s[0] = kRC5P32;
  for (unsigned int i = 1; i < t; ++i) s[i] = s[i - 1] + kRC5Q32;

  std::uint32_t a = 0, b = 0;
  unsigned int i = 0, j = 0;
  const unsigned int steps = 3 * (t > c ? t : c);
  for (unsigned int k = 0; k < steps; ++k) {
    a = s[i] = std::rotl(s[i] + a + b, 3);
    b = l[j] = std::rotl(l[j] + a + b, static_cast<int>((a + b) & 31));
    if (++i == t) i = 0;
    if (++j == c) j = 0;
  }
  CryptoPP::SecureWipeArray(l, kRC5MaxKey / 4);
}

RC5Base::~RC5Base() { CryptoPP::SecureWipeArray(m_pTable.get(), 2 * m_rounds + 2); }

void RC5Base::EncryptBlock(const BYTE* in, BYTE* out) const noexcept {
  const std::uint32_t* s = m_pTable.get();
  std::uint32_t a = LoadLittle(in) + s[0];
  std::uint32_t b = LoadLittle(in + 4) + s[1];
  for (unsigned int i = 1; i <= m_rounds; ++i) {
    a = std::rotl(a ^ b, static_cast<int>(b & 31)) + s[2 * i];
    b = std::rotl(b ^ a, static_cast<int>(a & 31)) + s[2 * i + 1];
  }
  StoreLittle(out, a);
  StoreLittle(out + 4, b);
}

void RC5Base::DecryptBlock(const BYTE* in, BYTE* out) const noexcept {
  const std::uint32_t* s = m_pTable.get();
  std::uint32_t a = LoadLittle(in);
  std::uint32_t b = LoadLittle(in + 4);
  for (unsigned int i = m_rounds; i >= 1; --i) {
    b = std::rotr(b - s[2 * i + 1], static_cast<int>(a & 31)) ^ a;
    a = std::rotr(a - s[2 * i], static_cast<int>(b & 31)) ^ b;
  }
  StoreLittle(out, a - s[0]);
  StoreLittle(out + 4, b - s[1]);
}

void RC5Base::ProcessBlock(const BYTE* in, BYTE* out) const {
  if (m_bEncrypt) {
    EncryptBlock(in, out);
  } else {
    DecryptBlock(in, out);
  }
}

void RC5Base::ProcessBlock(BYTE* inout) const { ProcessBlock(inout, inout); }

unsigned int RC5Base::BlockSize() const { return 8; }

void RC5Base::ProcessBlocks(BYTE* data, size_t count) const {
  for (size_t n = 0; n < count; ++n) ProcessBlock(data + 8 * n, data + 8 * n);
}

SAFER_SK128_Encryption::SAFER_SK128_Encryption(const BYTE* keyA, const BYTE* keyB, unsigned int rounds)
    : SAFER(KeyedSafer<CryptoPP::SAFER_SK::Encryption>(keyA, keyB, rounds)) {}
SAFER_SK128_Decryption::SAFER_SK128_Decryption(const BYTE* keyA, const BYTE* keyB, unsigned int rounds)
    : SAFER(KeyedSafer<CryptoPP::SAFER_SK::Decryption>(keyA, keyB, rounds)) {}

TwofishEncryption::TwofishEncryption(const BYTE* key, unsigned int keyLength)
    : Twofish(Keyed<CryptoPP::Twofish::Encryption>(key, keyLength)) {}
TwofishDecryption::TwofishDecryption(const BYTE* key, unsigned int keyLength)
    : Twofish(Keyed<CryptoPP::Twofish::Decryption>(key, keyLength)) {}

MARSEncryption::MARSEncryption(const BYTE* key, unsigned int keyLength)
    : MARS(Keyed<CryptoPP::MARS::Encryption>(key, keyLength)) {}
MARSDecryption::MARSDecryption(const BYTE* key, unsigned int keyLength)
    : MARS(Keyed<CryptoPP::MARS::Decryption>(key, keyLength)) {}

#define OW_DEFINE_DIRECT_CIPHER_(Name, Params, Engine) \
  Name::Name Params : m_engine(Engine) {}              \
  OW_DEFINE_FORWARDING_(Name)

OW_DEFINE_DIRECT_CIPHER_(DES_EDE_Encryption, (const BYTE* key), (Keyed<CryptoPP::DES_EDE2::Encryption>(key, 16)))
OW_DEFINE_DIRECT_CIPHER_(DES_EDE_Decryption, (const BYTE* key), (Keyed<CryptoPP::DES_EDE2::Decryption>(key, 16)))
OW_DEFINE_DIRECT_CIPHER_(TripleDES_Encryption, (const BYTE* key), (Keyed<CryptoPP::DES_EDE3::Encryption>(key, 24)))
OW_DEFINE_DIRECT_CIPHER_(TripleDES_Decryption, (const BYTE* key), (Keyed<CryptoPP::DES_EDE3::Decryption>(key, 24)))
OW_DEFINE_DIRECT_CIPHER_(AES_Encryption, (const BYTE* key, unsigned int keyLength),
                         (Keyed<CryptoPP::AES::Encryption>(key, keyLength)))
OW_DEFINE_DIRECT_CIPHER_(AES_Decryption, (const BYTE* key, unsigned int keyLength),
                         (Keyed<CryptoPP::AES::Decryption>(key, keyLength)))
