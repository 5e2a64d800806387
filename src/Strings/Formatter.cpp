#include "Strings/Formatter.h"

#include <cinttypes>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>

namespace Lumo::detail {
namespace {

constexpr int kMaxField = 100000;  // widths and precisions beyond this are refused

class Sink {
 public:
  Sink(char16_t* out, size_t capacity) : m_out(out), m_capacity(capacity) {}
  void Put(char16_t c) {
    if (m_length + 1 < m_capacity) m_out[m_length] = c;
    ++m_length;
  }
  void Repeat(char16_t c, size_t count) {
    for (size_t i = 0; i < count; ++i) Put(c);
  }
  void Finish() {
    if (m_capacity == 0) return;
    m_out[m_length < m_capacity ? m_length : m_capacity - 1] = 0;
  }
  size_t Length() const { return m_length; }

 private:
  char16_t* m_out;
  size_t m_capacity;
  size_t m_length = 0;
};

enum class Size { Default, Char, Short, Long32, Long64, Pointer, LongDouble };

struct Conversion {
  bool left = false, plus = false, space = false, alt = false, zero = false;
  int width = 0;
  int precision = -1;
  Size size = Size::Default;
};

// Decodes one code point of lenient UTF-8 from `s` (at most `n` bytes left); invalid bytes come
// out as U+FFFD one at a time.
char32_t NextUtf8(const unsigned char*& s, size_t n) {
  unsigned char b = *s++;
  if (b < 0x80) return b;
  int extra = (b >= 0xF0 && b < 0xF5) ? 3 : (b >= 0xE0) ? 2 : (b >= 0xC2 && b < 0xE0) ? 1 : -1;
  if (extra < 0 || static_cast<size_t>(extra) >= n) return 0xFFFD;
  char32_t cp = b & (0x3F >> extra);
  for (int i = 0; i < extra; ++i) {
    if ((s[i] & 0xC0) != 0x80) return 0xFFFD;
    cp = (cp << 6) | (s[i] & 0x3F);
  }
  static constexpr char32_t kMin[] = {0, 0x80, 0x800, 0x10000};
  if (cp < kMin[extra] || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) return 0xFFFD;
  s += extra;
  return cp;
}

void PutPadded(Sink& sink, const Conversion& conv, const char16_t* text, size_t length) {
  size_t pad = conv.width > 0 && static_cast<size_t>(conv.width) > length ? conv.width - length : 0;
  if (!conv.left) sink.Repeat(conv.zero ? u'0' : u' ', pad);
  for (size_t i = 0; i < length; ++i) sink.Put(text[i]);
  if (conv.left) sink.Repeat(u' ', pad);
}

void PutWideString(Sink& sink, const Conversion& conv, const char16_t* s) {
  if (s == nullptr) s = u"(null)";
  size_t length = 0;
  while ((conv.precision < 0 || length < static_cast<size_t>(conv.precision)) && s[length] != 0) {
    ++length;
  }
  PutPadded(sink, conv, s, length);
}

void PutNarrowString(Sink& sink, const Conversion& conv, const char* s) {
  if (s == nullptr) s = "(null)";
  // Widen first (UTF-8), then treat like a wide string so precision counts UTF-16 units. Only as
  // much is read as the precision needs, so an unterminated array with a precision is safe; the
  // decoder never reads past the terminator, which is never a continuation byte.
  const size_t limit = conv.precision < 0 ? SIZE_MAX : static_cast<size_t>(conv.precision);
  std::u16string wide;
  const auto* p = reinterpret_cast<const unsigned char*>(s);
  while (wide.size() < limit && *p != 0) {
    char32_t cp = NextUtf8(p, SIZE_MAX);
    if (cp >= 0x10000) {
      cp -= 0x10000;
      wide.push_back(static_cast<char16_t>(0xD800 + (cp >> 10)));
      wide.push_back(static_cast<char16_t>(0xDC00 + (cp & 0x3FF)));
    } else {
      wide.push_back(static_cast<char16_t>(cp));
    }
  }
  PutWideString(sink, conv, wide.c_str());
}

// Builds "%<flags><width>.<precision><length><conversion>" for snprintf.
void BuildNarrowSpec(char* buffer, const Conversion& conv, const char* length, char conversion) {
  char* p = buffer;
  *p++ = '%';
  if (conv.left) *p++ = '-';
  if (conv.plus) *p++ = '+';
  if (conv.space) *p++ = ' ';
  if (conv.alt) *p++ = '#';
  if (conv.zero) *p++ = '0';
  if (conv.width > 0) p += std::snprintf(p, 12, "%d", conv.width);
  if (conv.precision >= 0) p += std::snprintf(p, 13, ".%d", conv.precision);
  while (*length != 0) *p++ = *length++;
  *p++ = conversion;
  *p = 0;
}

template <typename... Value>
bool PutNumber(Sink& sink, const char* narrowSpec, Value... value) {
  char small[128];
  int n = std::snprintf(small, sizeof small, narrowSpec, value...);
  if (n < 0) return false;
  if (static_cast<size_t>(n) < sizeof small) {
    for (int i = 0; i < n; ++i) sink.Put(static_cast<unsigned char>(small[i]));
    return true;
  }
  std::string large(static_cast<size_t>(n) + 1, '\0');
  std::snprintf(large.data(), large.size(), narrowSpec, value...);
  for (int i = 0; i < n; ++i) sink.Put(static_cast<unsigned char>(large[i]));
  return true;
}

bool ReadNumber(const char16_t*& f, int& value) {
  value = 0;
  while (*f >= u'0' && *f <= u'9') {
    value = value * 10 + (*f - u'0');
    if (value > kMaxField) return false;
    ++f;
  }
  return true;
}

}  // namespace

int FormatUtf16(char16_t* out, size_t capacity, const char16_t* format, va_list args) {
  Sink sink(out, capacity);
  va_list ap;
  va_copy(ap, args);
  bool ok = true;
  for (const char16_t* f = format; ok && *f != 0;) {
    if (*f != u'%') {
      sink.Put(*f++);
      continue;
    }
    ++f;
    if (*f == u'%') {
      sink.Put(u'%');
      ++f;
      continue;
    }
    Conversion conv;
    for (bool flag = true; flag;) {
      switch (*f) {
        case u'-': conv.left = true; ++f; break;
        case u'+': conv.plus = true; ++f; break;
        case u' ': conv.space = true; ++f; break;
        case u'#': conv.alt = true; ++f; break;
        case u'0': conv.zero = true; ++f; break;
        default: flag = false;
      }
    }
    if (*f == u'*') {
      ++f;
      int w = va_arg(ap, int);
      if (w < 0) {
        conv.left = true;
        w = w == INT32_MIN ? kMaxField + 1 : -w;
      }
      conv.width = w;
    } else if (!ReadNumber(f, conv.width)) {
      ok = false;
      break;
    }
    if (*f == u'.') {
      ++f;
      if (*f == u'*') {
        ++f;
        int p = va_arg(ap, int);
        conv.precision = p < 0 ? -1 : p;
      } else if (!ReadNumber(f, conv.precision)) {
        ok = false;
        break;
      }
    }
    if (conv.width > kMaxField || conv.precision > kMaxField) {
      ok = false;
      break;
    }
    bool narrowText = false, wideText = false;
    switch (*f) {
      case u'h':
        ++f;
        if (*f == u'h') {
          ++f;
          conv.size = Size::Char;
        } else {
          conv.size = Size::Short;
        }
        narrowText = true;
        break;
      case u'l':
        ++f;
        if (*f == u'l') {
          ++f;
          conv.size = Size::Long64;
        } else {
          conv.size = Size::Long32;
          wideText = true;
        }
        break;
      case u'w': ++f; wideText = true; break;
      case u'L': ++f; conv.size = Size::LongDouble; break;
      case u'j': ++f; conv.size = Size::Long64; break;
      case u'z':
      case u't': ++f; conv.size = Size::Pointer; break;
      case u'I':
        ++f;
        if (f[0] == u'6' && f[1] == u'4') {
          f += 2;
          conv.size = Size::Long64;
        } else if (f[0] == u'3' && f[1] == u'2') {
          f += 2;
          conv.size = Size::Long32;
        } else {
          conv.size = Size::Pointer;
        }
        break;
      default: break;
    }
    char narrowSpec[64];
    char16_t conversion = *f;
    if (conversion == 0) {
      ok = false;
      break;
    }
    ++f;
    switch (conversion) {
      case u'd':
      case u'i':
      case u'u':
      case u'o':
      case u'x':
      case u'X': {
        bool isSigned = conversion == u'd' || conversion == u'i';
        char narrowConversion = conversion == u'i' ? 'd' : static_cast<char>(conversion);
        BuildNarrowSpec(narrowSpec, conv, "ll", narrowConversion);
        long long sv = 0;
        unsigned long long uv = 0;
        switch (conv.size) {
          case Size::Long64:
            sv = va_arg(ap, long long);
            uv = static_cast<unsigned long long>(sv);
            break;
          case Size::Pointer:
            sv = static_cast<long long>(va_arg(ap, std::intptr_t));
            uv = isSigned ? static_cast<unsigned long long>(sv)
                          : static_cast<unsigned long long>(static_cast<std::uintptr_t>(sv));
            break;
          default: {
            int v = va_arg(ap, int);
            if (conv.size == Size::Short) v = isSigned ? static_cast<short>(v) : static_cast<unsigned short>(v);
            if (conv.size == Size::Char) v = isSigned ? static_cast<signed char>(v) : static_cast<unsigned char>(v);
            sv = v;
            uv = static_cast<unsigned int>(v);
            break;
          }
        }
        ok = isSigned ? PutNumber(sink, narrowSpec, sv) : PutNumber(sink, narrowSpec, uv);
        break;
      }
      case u'e':
      case u'E':
      case u'f':
      case u'F':
      case u'g':
      case u'G':
      case u'a':
      case u'A':
        if (conv.size == Size::LongDouble) {
          BuildNarrowSpec(narrowSpec, conv, "L", static_cast<char>(conversion));
          ok = PutNumber(sink, narrowSpec, va_arg(ap, long double));
        } else {
          BuildNarrowSpec(narrowSpec, conv, "", static_cast<char>(conversion));
          ok = PutNumber(sink, narrowSpec, va_arg(ap, double));
        }
        break;
      case u'p': {
        Conversion hex = conv;
        hex.zero = !conv.left;
        hex.alt = false;
        hex.precision = -1;
        if (hex.width < static_cast<int>(2 * sizeof(void*))) hex.width = 2 * sizeof(void*);
        BuildNarrowSpec(narrowSpec, hex, "ll", 'X');
        ok = PutNumber(sink, narrowSpec,
                       static_cast<unsigned long long>(reinterpret_cast<std::uintptr_t>(va_arg(ap, void*))));
        break;
      }
      case u'c':
      case u'C': {
        int v = va_arg(ap, int);
        char16_t unit;
        bool narrow = narrowText || (conversion == u'C' && !wideText);
        unit = narrow ? static_cast<char16_t>(static_cast<unsigned char>(v)) : static_cast<char16_t>(v);
        Conversion text = conv;
        text.precision = -1;
        PutPadded(sink, text, &unit, 1);
        break;
      }
      case u's':
      case u'S': {
        bool narrow = narrowText || (conversion == u'S' && !wideText);
        if (narrow) {
          PutNarrowString(sink, conv, va_arg(ap, const char*));
        } else {
          PutWideString(sink, conv, va_arg(ap, const char16_t*));
        }
        break;
      }
      default:
        ok = false;  // %n and unknown conversions
        break;
    }
  }
  va_end(ap);
  sink.Finish();
  if (!ok) return -1;
  return sink.Length() > static_cast<size_t>(INT32_MAX) ? -1 : static_cast<int>(sink.Length());
}

}  // namespace Lumo::detail
