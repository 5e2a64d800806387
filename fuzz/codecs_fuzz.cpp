// The byte-string codecs: AsciiToBits, CEncrypt::HexDecode, BitsToAscii and BitsToDecimal.
//
// Every buffer is exactly as large as the codec's comment says it needs (heap copies of that
// size), so a read or write one byte too far is caught. Properties: the decoders agree with a
// decoder written here (non-digits count as 0, an odd last digit is a high half) and return
// length / 2; bytes written with BitsToAscii decode back to themselves; BitsToDecimal writes
// three decimal digits per byte.
#include <cstring>
#include <memory>

#include "FuzzSupport.h"
#include "owutils/BitCodecs.h"
#include "owutils/CEncrypt.h"

namespace {

unsigned Nibble(char c) {
  const unsigned v = static_cast<unsigned char>(c) & 0x7F;
  if (v >= '0' && v <= '9') return v - '0';
  if (v >= 'a' && v <= 'f') return v - 'a' + 10;
  if (v >= 'A' && v <= 'F') return v - 'A' + 10;
  return 0;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const bool useHexDecode = input.ConsumeBool();
  const std::string text = input.ConsumeRemainingBytesAsString();
  const unsigned length = static_cast<unsigned>(text.size());

  // Hex text to bytes, the input unterminated and exactly `length` long.
  std::unique_ptr<char[]> hex(new char[length == 0 ? 1 : length]);
  std::memcpy(hex.get(), text.data(), length);
  const size_t outSize = (length + 1) / 2 + 1;
  std::unique_ptr<unsigned char[]> bytes(new unsigned char[outSize]);
  const unsigned decoded = useHexDecode
                               ? static_cast<unsigned>(CEncrypt::HexDecode(hex.get(), static_cast<int>(length), bytes.get()))
                               : AsciiToBits(hex.get(), length, bytes.get());
  FUZZ_CHECK(decoded == length / 2);
  for (unsigned i = 0; i < (length + 1) / 2; ++i) {
    const unsigned high = Nibble(text[2 * i]);
    const unsigned low = 2 * i + 1 < length ? Nibble(text[2 * i + 1]) : 0;
    FUZZ_CHECK(bytes[i] == high * 16 + low);
  }
  FUZZ_CHECK(bytes[(length + 1) / 2] == 0);

  // The input bytes themselves, to hex and back, and to decimal.
  const int n = static_cast<int>(length);
  std::unique_ptr<char[]> ascii(new char[2 * length + 1]);
  FUZZ_CHECK(BitsToAscii(reinterpret_cast<const unsigned char*>(text.data()), n, ascii.get()) == 2 * n);
  FUZZ_CHECK(std::strlen(ascii.get()) == 2 * length);
  std::unique_ptr<unsigned char[]> back(new unsigned char[length + 1]);
  FUZZ_CHECK(AsciiToBits(ascii.get(), 2 * length, back.get()) == length);
  FUZZ_CHECK(std::memcmp(back.get(), text.data(), length) == 0);
  FUZZ_CHECK(back[length] == 0);

  std::unique_ptr<char[]> decimal(new char[3 * length + 1]);
  FUZZ_CHECK(BitsToDecimal(reinterpret_cast<const unsigned char*>(text.data()), n, decimal.get()) == 3 * n);
  for (unsigned i = 0; i < length; ++i) {
    const unsigned value = static_cast<unsigned>(decimal[3 * i] - '0') * 100 +
                           static_cast<unsigned>(decimal[3 * i + 1] - '0') * 10 +
                           static_cast<unsigned>(decimal[3 * i + 2] - '0');
    FUZZ_CHECK(value == static_cast<unsigned char>(text[i]));
  }
  FUZZ_CHECK(decimal[3 * length] == 0);
  return 0;
}
