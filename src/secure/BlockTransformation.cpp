#include "secure/BlockTransformation.h"

#include <crypto++/aes.h>
#include <crypto++/algparam.h>
#include <crypto++/argnames.h>
#include <crypto++/blowfish.h>
#include <crypto++/des.h>
#include <crypto++/idea.h>
#include <crypto++/mars.h>
#include <crypto++/rc5.h>
#include <crypto++/safer.h>
#include <crypto++/twofish.h>

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

// RC5 keyed through the unchecked set-up: the checked one refuses keys above 255 bytes.
template <class Cipher>
std::unique_ptr<CryptoPP::BlockCipher> KeyedRC5(const BYTE* key, unsigned int length, unsigned int rounds) {
  auto cipher = std::make_unique<Cipher>();
  cipher->UncheckedSetKey(key, length, CryptoPP::MakeParameters(CryptoPP::Name::Rounds(), static_cast<int>(rounds)));
  return cipher;
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
OW_DEFINE_BLOCK_ALGORITHM_(RC5Base)
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
    : RC5Base(KeyedRC5<CryptoPP::RC5::Encryption>(key, keyLength, rounds)) {}
RC5Decryption::RC5Decryption(const BYTE* key, unsigned int keyLength, unsigned int rounds)
    : RC5Base(KeyedRC5<CryptoPP::RC5::Decryption>(key, keyLength, rounds)) {}

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
