// URI and special-character encodings, and plain UTF-16 <-> UTF-8 conversion.
#include "owutils/StringEncodeDecode.h"

#include <cstddef>
#include <memory>

#include "owutils/Exceptions.h"
#include "platform/Text.h"

namespace Lumo {
namespace {

constexpr char kHexDigitsA[] = "0123456789ABCDEF";
constexpr char16_t kHexDigitsW[] = u"0123456789ABCDEF";

// Character classes of the default ("C") locale, which is what the encodings are defined over;
// classifying by hand keeps the result independent of whatever locale the client set.
bool IsAsciiAlnum(unsigned int c) noexcept {
  return (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}
bool IsAsciiSpace(unsigned int c) noexcept { return c == ' ' || (c >= 0x09 && c <= 0x0D); }

// Bytes that URI encoding leaves as they are.
bool IsUnreserved(unsigned char c) noexcept {
  return IsAsciiAlnum(c) || c == '-' || c == '_' || c == '.' || c == '~';
}

// UTF-16 units that the special-character form escapes.
bool IsSpecialChar(char16_t c) noexcept { return c < 0x80 && !IsAsciiAlnum(c) && !IsAsciiSpace(c); }

// UTF-8 bytes to UTF-16, by length, so that a decoded NUL byte stays in the result instead of
// silently cutting off everything after it.
String Utf8BytesToWide(const std::string& bytes) {
  // The length includes the string's terminator, so an empty input still converts to one unit.
  const int length = static_cast<int>(bytes.size() + 1);
  int nChars = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, bytes.c_str(), length, nullptr, 0);
  PRECONDITION(nChars != 0);
  std::unique_ptr<char16_t[]> buffer(new char16_t[static_cast<size_t>(nChars)]);
  nChars = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, bytes.c_str(), length, buffer.get(), nChars);
  PRECONDITION(nChars != 0);
  return String(buffer.get(), static_cast<size_t>(nChars - 1));
}

}  // namespace

unsigned int HexDigitValue(char c) noexcept {
  const unsigned int u = static_cast<unsigned char>(c);
  if (u >= '0' && u <= '9') return u - '0';
  const unsigned int lower = (u >= 'A' && u <= 'Z') ? u + ('a' - 'A') : u;
  return lower - 87;  // 'a' is 97; everything below wraps to a large value
}

unsigned int HexDigitValue(char16_t c) noexcept {
  const unsigned int u = c;
  if (u >= u'0' && u <= u'9') return u - u'0';
  const unsigned int lower = (u >= u'A' && u <= u'Z') ? u + (u'a' - u'A') : u;
  return lower - 87;
}

std::string WideToUtf8(const char16_t* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  int nChars = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, pStrIn, -1, nullptr, 0, nullptr, nullptr);
  PRECONDITION(nChars != 0);
  std::unique_ptr<char[]> buffer(new char[static_cast<size_t>(nChars)]);
  nChars = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, pStrIn, -1, buffer.get(), nChars, nullptr,
                                         nullptr);
  PRECONDITION(nChars != 0);
  return std::string(buffer.get());
}

String Utf8ToWide(const char* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  int nChars = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, pStrIn, -1, nullptr, 0);
  PRECONDITION(nChars != 0);
  std::unique_ptr<char16_t[]> buffer(new char16_t[static_cast<size_t>(nChars)]);
  nChars = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, pStrIn, -1, buffer.get(), nChars);
  PRECONDITION(nChars != 0);
  return String(buffer.get());
}

String EncodeURI(const char16_t* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  try {
    const std::string utf8 = WideToUtf8(pStrIn);
    std::string encoded;
    encoded.reserve(utf8.size() * 3);
    for (char ch : utf8) {
      const auto byte = static_cast<unsigned char>(ch);
      if (IsUnreserved(byte)) {
        encoded.push_back(ch);
      } else {
        encoded.push_back('%');
        encoded.push_back(kHexDigitsA[byte >> 4]);
        encoded.push_back(kHexDigitsA[byte & 0x0F]);
      }
    }
    return Utf8ToWide(encoded.c_str());
  } catch (LumoException::Exception& e) {
    THROW_AT(LumoStringUnableToEncodeStringAsURI(String(pStrIn), e));
  }
}

String DecodeURI(const char16_t* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  try {
    const std::string utf8 = WideToUtf8(pStrIn);
    const size_t n = utf8.size();
    std::string decoded;
    decoded.reserve(n);
    for (size_t i = 0; i < n;) {
      if (utf8[i] != '%' || i + 2 >= n) {
        decoded.push_back(utf8[i]);
        ++i;
        continue;
      }
      const unsigned int high = HexDigitValue(utf8[i + 1]);
      if (high > 15) THROW_AT(LumoStringInvalidHexCharA(utf8[i + 1]));
      const unsigned int low = HexDigitValue(utf8[i + 2]);
      if (low > 15) THROW_AT(LumoStringInvalidHexCharA(utf8[i + 2]));
      const auto byte = static_cast<unsigned char>(high * 16 + low);
      // The encoder never escapes these: an escaped one means the text was not made by it.
      if (IsUnreserved(byte)) THROW_AT(LumoStringInvalidDecodedCharA(static_cast<char>(byte)));
      decoded.push_back(static_cast<char>(byte));
      i += 3;
    }
    return Utf8BytesToWide(decoded);
  } catch (LumoException::Exception& e) {
    THROW_AT(LumoStringUnableToDecodeStringFromURI(String(pStrIn), e));
  }
}

String EncodeSpecialChars(const char16_t* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  try {
    String encoded;
    for (const char16_t* p = pStrIn; *p != 0; ++p) {
      if (IsSpecialChar(*p)) {
        encoded.push_back(u'%');
        encoded.push_back(kHexDigitsW[*p >> 4]);
        encoded.push_back(kHexDigitsW[*p & 0x0F]);
      } else {
        encoded.push_back(*p);
      }
    }
    return encoded;
  } catch (LumoException::Exception& e) {
    THROW_AT(LumoStringUnableToEncodeSpecialCharsInString(String(pStrIn), e));
  }
}

String DecodeSpecialChars(const char16_t* pStrIn) {
  PRECONDITION(pStrIn != NULL);
  const String input(pStrIn);
  try {
    const size_t n = input.size();
    String decoded;
    decoded.reserve(n);
    for (size_t i = 0; i < n;) {
      if (input[i] != u'%' || i + 2 >= n) {
        decoded.push_back(input[i]);
        ++i;
        continue;
      }
      const unsigned int high = HexDigitValue(input[i + 1]);
      if (high > 15) THROW_AT(LumoStringInvalidHexCharW(input[i + 1]));
      const unsigned int low = HexDigitValue(input[i + 2]);
      if (low > 15) THROW_AT(LumoStringInvalidHexCharW(input[i + 2]));
      const auto unit = static_cast<char16_t>(high * 16 + low);
      if (!IsSpecialChar(unit)) THROW_AT(LumoStringInvalidDecodedCharW(unit));
      decoded.push_back(unit);
      i += 3;
    }
    return decoded;
  } catch (LumoException::Exception& e) {
    THROW_AT(LumoStringUnableToDecodeSpecialCharsInString(input, e));
  }
}

}  // namespace Lumo
