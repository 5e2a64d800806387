#include "owutils/BitCodecs.h"

#include "owutils/Exceptions.h"

namespace {

constexpr char kHexDigits[] = "0123456789abcdef";

// Value of a hexadecimal digit; every other character is 0. The top bit is ignored.
unsigned char Nibble(char c) noexcept {
  const unsigned char v = static_cast<unsigned char>(c) & 0x7F;
  if (v >= '0' && v <= '9') return static_cast<unsigned char>(v - '0');
  if (v >= 'A' && v <= 'F') return static_cast<unsigned char>(v - 'A' + 10);
  if (v >= 'a' && v <= 'f') return static_cast<unsigned char>(v - 'a' + 10);
  return 0;
}

}  // namespace

unsigned int AsciiToBits(const char* input, unsigned int length, unsigned char* output) {
  PRECONDITION(input != NULL);
  PRECONDITION(output != NULL);
  unsigned int written = 0;
  for (unsigned int i = 0; 2ULL * i < length; ++i) {
    const unsigned char high = Nibble(input[2 * i]);
    // The character after an odd last digit is not read: the low half is 0.
    const unsigned char low = (2ULL * i + 1 < length) ? Nibble(input[2 * i + 1]) : 0;
    output[i] = static_cast<unsigned char>(high * 16 + low);
    written = i + 1;
  }
  output[written] = 0;
  return length / 2;
}

int BitsToAscii(const unsigned char* input, int length, char* output) {
  PRECONDITION(input != NULL);
  PRECONDITION(output != NULL);
  char* out = output;
  for (int i = 0; i < length; ++i) {
    *out++ = kHexDigits[input[i] >> 4];
    *out++ = kHexDigits[input[i] & 15];
  }
  *out = 0;
  return length * 2;
}

int BitsToDecimal(const unsigned char* input, int length, char* output) {
  PRECONDITION(input != NULL);
  PRECONDITION(output != NULL);
  char* out = output;
  for (int i = 0; i < length; ++i) {
    const unsigned b = input[i];
    *out++ = static_cast<char>('0' + b / 100);
    *out++ = static_cast<char>('0' + (b / 10) % 10);
    *out++ = static_cast<char>('0' + b % 10);
  }
  *out = 0;
  return length * 3;
}
