// POSIX backend, internal: UTF-16 <-> UTF-8 for native names (file names, environment values).
#pragma once

#include <string>

#include "platform/Text.h"

namespace Platform::Posix {

// UTF-16 to UTF-8; an unpaired surrogate becomes U+FFFD.
inline std::string ToUtf8(const char16_t* text, size_t length) {
  std::string out;
  if (length == 0) return out;
  size_t i = 0;
  while (i < length && text[i] < 0x80) ++i;
  if (i == length) {
    out.resize(length);
    for (size_t k = 0; k < length; ++k) out[k] = static_cast<char>(text[k]);
    return out;
  }
  int n = WideCharToMultiByte(kCodePageUtf8, 0, text, static_cast<int>(length), nullptr, 0, nullptr, nullptr);
  if (n <= 0) return out;
  out.resize(static_cast<size_t>(n));
  WideCharToMultiByte(kCodePageUtf8, 0, text, static_cast<int>(length), out.data(), n, nullptr, nullptr);
  return out;
}
inline std::string ToUtf8(const std::u16string& text) { return ToUtf8(text.data(), text.size()); }
// A NUL-terminated text; null gives an empty string.
inline std::string ToUtf8(const char16_t* text) {
  return text == nullptr ? std::string() : ToUtf8(text, std::char_traits<char16_t>::length(text));
}

// UTF-8 to UTF-16; a byte that is not UTF-8 becomes U+FFFD.
inline std::u16string ToUtf16(const char* text, size_t length) {
  std::u16string out;
  if (length == 0) return out;
  // Most names are ASCII: widened directly.
  size_t i = 0;
  while (i < length && static_cast<unsigned char>(text[i]) < 0x80) ++i;
  if (i == length) {
    out.resize(length);
    for (size_t k = 0; k < length; ++k) out[k] = static_cast<char16_t>(text[k]);
    return out;
  }
  int n = MultiByteToWideChar(kCodePageUtf8, 0, text, static_cast<int>(length), nullptr, 0);
  if (n <= 0) return out;
  out.resize(static_cast<size_t>(n));
  MultiByteToWideChar(kCodePageUtf8, 0, text, static_cast<int>(length), out.data(), n);
  return out;
}
inline std::u16string ToUtf16(const std::string& text) { return ToUtf16(text.data(), text.size()); }
// A NUL-terminated text; null gives an empty string.
inline std::u16string ToUtf16(const char* text) {
  return text == nullptr ? std::u16string() : ToUtf16(text, std::char_traits<char>::length(text));
}

}  // namespace Platform::Posix
