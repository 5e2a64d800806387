// POSIX backend: UTF-8 <-> UTF-16 with the Win32 rules, and current-locale conversions.
#include "platform/Text.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cwchar>
#include <string>

#include "platform/Errors.h"

namespace Platform {
namespace {

constexpr char16_t kReplacement = 0xFFFD;

size_t NarrowLength(const char* text, int length) {
  return length < 0 ? std::char_traits<char>::length(text) + 1 : static_cast<size_t>(length);
}

size_t WideLength(const char16_t* text, int length) {
  return length < 0 ? std::char_traits<char16_t>::length(text) + 1 : static_cast<size_t>(length);
}

// Decodes one UTF-8 sequence at s[0..n). Returns the number of bytes consumed (at least 1) and
// sets `cp`, or returns 0 for an invalid sequence (of which one byte is to be skipped).
size_t DecodeUtf8(const unsigned char* s, size_t n, char32_t& cp) {
  unsigned char b = s[0];
  if (b < 0x80) {
    cp = b;
    return 1;
  }
  size_t extra;
  char32_t min;
  if (b >= 0xC2 && b <= 0xDF) {
    extra = 1;
    min = 0x80;
  } else if (b >= 0xE0 && b <= 0xEF) {
    extra = 2;
    min = 0x800;
  } else if (b >= 0xF0 && b <= 0xF4) {
    extra = 3;
    min = 0x10000;
  } else {
    return 0;
  }
  if (extra >= n) return 0;
  char32_t value = b & (0x3F >> extra);
  for (size_t i = 1; i <= extra; ++i) {
    if ((s[i] & 0xC0) != 0x80) return 0;
    value = (value << 6) | (s[i] & 0x3F);
  }
  if (value < min || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF)) return 0;
  cp = value;
  return extra + 1;
}

}  // namespace

int MultiByteToWideChar(UINT codePage, DWORD flags, const char* text, int length, char16_t* out,
                        int outSize) noexcept {
  if ((flags & ~kMbErrInvalidChars) != 0) {
    SetLastError(ERROR_INVALID_FLAGS);
    return 0;
  }
  if (codePage != kCodePageUtf8 || text == nullptr || length == 0 || outSize < 0 ||
      (outSize > 0 && out == nullptr)) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  const bool strict = (flags & kMbErrInvalidChars) != 0;
  const auto* s = reinterpret_cast<const unsigned char*>(text);
  const size_t n = NarrowLength(text, length);
  size_t written = 0;
  auto emit = [&](char16_t unit) -> bool {
    if (outSize > 0) {
      if (written >= static_cast<size_t>(outSize)) return false;
      out[written] = unit;
    }
    ++written;
    return true;
  };
  for (size_t i = 0; i < n;) {
    char32_t cp = 0;
    size_t used = DecodeUtf8(s + i, n - i, cp);
    if (used == 0) {
      if (strict) {
        SetLastError(ERROR_NO_UNICODE_TRANSLATION);
        return 0;
      }
      cp = kReplacement;
      used = 1;
    }
    i += used;
    bool ok;
    if (cp >= 0x10000) {
      cp -= 0x10000;
      ok = emit(static_cast<char16_t>(0xD800 + (cp >> 10))) && emit(static_cast<char16_t>(0xDC00 + (cp & 0x3FF)));
    } else {
      ok = emit(static_cast<char16_t>(cp));
    }
    if (!ok) {
      SetLastError(ERROR_INSUFFICIENT_BUFFER);
      return 0;
    }
    if (written > static_cast<size_t>(INT_MAX)) {
      SetLastError(ERROR_ARITHMETIC_OVERFLOW);
      return 0;
    }
  }
  return static_cast<int>(written);
}

int WideCharToMultiByte(UINT codePage, DWORD flags, const char16_t* text, int length, char* out,
                        int outSize, const char* defaultChar, BOOL* usedDefault) noexcept {
  // For UTF-8, Windows requires defaultChar and usedDefault to be null.
  if (codePage != kCodePageUtf8 || (flags & ~kWcErrInvalidChars) != 0 || defaultChar != nullptr ||
      usedDefault != nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  if (text == nullptr || length == 0 || outSize < 0 || (outSize > 0 && out == nullptr)) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  const bool strict = (flags & kWcErrInvalidChars) != 0;
  const size_t n = WideLength(text, length);
  size_t written = 0;
  for (size_t i = 0; i < n; ++i) {
    char32_t cp = text[i];
    if (cp >= 0xD800 && cp <= 0xDBFF && i + 1 < n && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF) {
      cp = 0x10000 + ((cp - 0xD800) << 10) + (text[i + 1] - 0xDC00);
      ++i;
    } else if (cp >= 0xD800 && cp <= 0xDFFF) {
      if (strict) {
        SetLastError(ERROR_NO_UNICODE_TRANSLATION);
        return 0;
      }
      cp = kReplacement;
    }
    unsigned char bytes[4];
    size_t count;
    if (cp < 0x80) {
      bytes[0] = static_cast<unsigned char>(cp);
      count = 1;
    } else if (cp < 0x800) {
      bytes[0] = static_cast<unsigned char>(0xC0 | (cp >> 6));
      bytes[1] = static_cast<unsigned char>(0x80 | (cp & 0x3F));
      count = 2;
    } else if (cp < 0x10000) {
      bytes[0] = static_cast<unsigned char>(0xE0 | (cp >> 12));
      bytes[1] = static_cast<unsigned char>(0x80 | ((cp >> 6) & 0x3F));
      bytes[2] = static_cast<unsigned char>(0x80 | (cp & 0x3F));
      count = 3;
    } else {
      bytes[0] = static_cast<unsigned char>(0xF0 | (cp >> 18));
      bytes[1] = static_cast<unsigned char>(0x80 | ((cp >> 12) & 0x3F));
      bytes[2] = static_cast<unsigned char>(0x80 | ((cp >> 6) & 0x3F));
      bytes[3] = static_cast<unsigned char>(0x80 | (cp & 0x3F));
      count = 4;
    }
    if (outSize > 0) {
      if (written + count > static_cast<size_t>(outSize)) {
        SetLastError(ERROR_INSUFFICIENT_BUFFER);
        return 0;
      }
      for (size_t k = 0; k < count; ++k) out[written + k] = static_cast<char>(bytes[k]);
    }
    written += count;
    if (written > static_cast<size_t>(INT_MAX)) {
      SetLastError(ERROR_ARITHMETIC_OVERFLOW);
      return 0;
    }
  }
  return static_cast<int>(written);
}

int LocaleToWide(size_t* needed, char16_t* out, size_t outSize, const char* text) {
  if (needed != nullptr) *needed = 0;
  if (text == nullptr) return EINVAL;
  std::mbstate_t state{};
  const char* src = text;
  size_t count = std::mbsrtowcs(nullptr, &src, 0, &state);
  if (count == static_cast<size_t>(-1)) return EILSEQ;
  // wchar_t holds code points here; UTF-16 needs two units above the BMP.
  std::wstring wide(count, L'\0');
  state = std::mbstate_t{};
  src = text;
  std::mbsrtowcs(wide.data(), &src, count, &state);
  std::u16string result;
  result.reserve(count + 1);
  for (wchar_t w : wide) {
    auto cp = static_cast<char32_t>(w);
    if (cp >= 0x10000 && cp <= 0x10FFFF) {
      cp -= 0x10000;
      result.push_back(static_cast<char16_t>(0xD800 + (cp >> 10)));
      result.push_back(static_cast<char16_t>(0xDC00 + (cp & 0x3FF)));
    } else if (cp > 0x10FFFF) {
      return EILSEQ;
    } else {
      result.push_back(static_cast<char16_t>(cp));
    }
  }
  if (needed != nullptr) *needed = result.size() + 1;
  if (out == nullptr) return 0;
  if (outSize < result.size() + 1) return ERANGE;
  result.copy(out, result.size());
  out[result.size()] = 0;
  return 0;
}

int WideToLocale(size_t* needed, char* out, size_t outSize, const char16_t* text) {
  if (needed != nullptr) *needed = 0;
  if (text == nullptr) return EINVAL;
  std::wstring wide;
  for (size_t i = 0; text[i] != 0; ++i) {
    char32_t cp = text[i];
    if (cp >= 0xD800 && cp <= 0xDBFF && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF) {
      cp = 0x10000 + ((cp - 0xD800) << 10) + (text[i + 1] - 0xDC00);
      ++i;
    } else if (cp >= 0xD800 && cp <= 0xDFFF) {
      return EILSEQ;
    }
    wide.push_back(static_cast<wchar_t>(cp));
  }
  std::mbstate_t state{};
  const wchar_t* src = wide.c_str();
  size_t count = std::wcsrtombs(nullptr, &src, 0, &state);
  if (count == static_cast<size_t>(-1)) return EILSEQ;
  if (needed != nullptr) *needed = count + 1;
  if (out == nullptr) return 0;
  if (outSize < count + 1) return ERANGE;
  state = std::mbstate_t{};
  src = wide.c_str();
  std::wcsrtombs(out, &src, count + 1, &state);
  return 0;
}

}  // namespace Platform
