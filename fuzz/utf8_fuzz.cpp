// UTF-8 <-> UTF-16: Lumo::String::AssignUtf8 / ToUtf8 and the platform converters
// MultiByteToWideChar / WideCharToMultiByte.
//
// Properties: AssignUtf8 accepts exactly the well-formed UTF-8 (checked against a decoder
// written here from RFC 3629), gives the same units and round-trips to the same bytes; refused
// input raises LumoStringNarrowToWideFailed and leaves the string empty. Any UTF-16 text
// survives ToUtf8 + AssignUtf8 with unpaired surrogates turned into U+FFFD. The converters read
// no further than the length they are given, never write past the output size they are given,
// and either fill it exactly or fail with ERROR_INSUFFICIENT_BUFFER.
#include <memory>
#include <optional>

#include "FuzzSupport.h"
#include "owutils/Exceptions.h"
#include "owutils/tstring.h"
#include "platform/Errors.h"
#include "platform/Text.h"

namespace {

// Strict UTF-8 (RFC 3629, section 4): no overlong forms, no surrogates, nothing above U+10FFFF.
std::optional<std::u16string> DecodeStrict(const std::string& bytes) {
  std::u16string out;
  for (size_t i = 0; i < bytes.size();) {
    const auto b0 = static_cast<unsigned char>(bytes[i]);
    size_t extra;
    char32_t cp;
    if (b0 < 0x80) {
      extra = 0, cp = b0;
    } else if ((b0 & 0xE0) == 0xC0) {
      extra = 1, cp = b0 & 0x1F;
    } else if ((b0 & 0xF0) == 0xE0) {
      extra = 2, cp = b0 & 0x0F;
    } else if ((b0 & 0xF8) == 0xF0) {
      extra = 3, cp = b0 & 0x07;
    } else {
      return std::nullopt;
    }
    if (i + extra >= bytes.size()) return std::nullopt;
    for (size_t k = 1; k <= extra; ++k) {
      const auto b = static_cast<unsigned char>(bytes[i + k]);
      if ((b & 0xC0) != 0x80) return std::nullopt;
      cp = (cp << 6) | (b & 0x3F);
    }
    static constexpr char32_t kMinimum[] = {0, 0x80, 0x800, 0x10000};
    if (cp < kMinimum[extra] || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) return std::nullopt;
    if (cp >= 0x10000) {
      out.push_back(static_cast<char16_t>(0xD800 + ((cp - 0x10000) >> 10)));
      out.push_back(static_cast<char16_t>(0xDC00 + ((cp - 0x10000) & 0x3FF)));
    } else {
      out.push_back(static_cast<char16_t>(cp));
    }
    i += extra + 1;
  }
  return out;
}

std::u16string ReplaceLoneSurrogates(const std::u16string& text) {
  std::u16string out(text);
  for (size_t i = 0; i < out.size(); ++i) {
    const bool high = out[i] >= 0xD800 && out[i] <= 0xDBFF;
    const bool low = out[i] >= 0xDC00 && out[i] <= 0xDFFF;
    if (high && i + 1 < out.size() && out[i + 1] >= 0xDC00 && out[i + 1] <= 0xDFFF) {
      ++i;
    } else if (high || low) {
      out[i] = 0xFFFD;
    }
  }
  return out;
}

void CheckNarrowText(const std::string& bytes) {
  const std::optional<std::u16string> expected = DecodeStrict(bytes);
  Lumo::String text(u"previous");
  try {
    text.AssignUtf8(bytes.c_str());
    FUZZ_CHECK(expected.has_value());
    FUZZ_CHECK(text == *expected);
    Lumo::CharArrayHolder back = text.ToUtf8();
    FUZZ_CHECK(back.Get() != nullptr);
    FUZZ_CHECK(std::string(back.Get()) == bytes);
  } catch (const LumoStringNarrowToWideFailed& e) {
    FUZZ_CHECK(!expected.has_value());
    FUZZ_CHECK(text.empty());
    FUZZ_CHECK(e.GetCause() != nullptr);
  }
}

void CheckWideText(const std::u16string& units) {
  const Lumo::String text(units);
  Lumo::CharArrayHolder utf8 = text.ToUtf8();
  FUZZ_CHECK(utf8.Get() != nullptr);
  Lumo::String back;
  back.AssignUtf8(utf8.Get());
  FUZZ_CHECK(back == ReplaceLoneSurrogates(units));
}

// The converters over an unterminated source of exactly `length` elements (heap copies, so
// that reading one element too far is caught), into an output of exactly `outSize` elements.
void CheckConverters(const std::string& bytes, const std::u16string& units, int outSize, bool strict) {
  if (!bytes.empty()) {
    std::unique_ptr<char[]> source(new char[bytes.size()]);
    std::copy(bytes.begin(), bytes.end(), source.get());
    const int length = static_cast<int>(bytes.size());
    const DWORD flags = strict ? Platform::kMbErrInvalidChars : 0;
    Platform::SetLastError(ERROR_SUCCESS);
    const int needed = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, flags, source.get(), length, nullptr, 0);
    const std::optional<std::u16string> expected = DecodeStrict(bytes);
    if (strict) FUZZ_CHECK((needed > 0) == expected.has_value());
    if (!strict) FUZZ_CHECK(needed > 0);
    if (needed == 0) FUZZ_CHECK(Platform::GetLastError() == ERROR_NO_UNICODE_TRANSLATION);
    if (needed > 0) {
      std::unique_ptr<char16_t[]> out(new char16_t[static_cast<size_t>(outSize)]);
      Platform::SetLastError(ERROR_SUCCESS);
      const int written =
          Platform::MultiByteToWideChar(Platform::kCodePageUtf8, flags, source.get(), length, out.get(), outSize);
      if (outSize >= needed) {
        FUZZ_CHECK(written == needed);
        if (expected) FUZZ_CHECK(std::u16string(out.get(), static_cast<size_t>(written)) == *expected);
      } else {
        FUZZ_CHECK(written == 0);
        FUZZ_CHECK(Platform::GetLastError() == ERROR_INSUFFICIENT_BUFFER);
      }
    }
  }
  if (!units.empty()) {
    std::unique_ptr<char16_t[]> source(new char16_t[units.size()]);
    std::copy(units.begin(), units.end(), source.get());
    const int length = static_cast<int>(units.size());
    const DWORD flags = strict ? Platform::kWcErrInvalidChars : 0;
    const bool wellFormed = ReplaceLoneSurrogates(units) == units;
    Platform::SetLastError(ERROR_SUCCESS);
    const int needed = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, flags, source.get(), length, nullptr, 0,
                                                     nullptr, nullptr);
    if (strict) FUZZ_CHECK((needed > 0) == wellFormed);
    if (!strict) FUZZ_CHECK(needed > 0);
    if (needed > 0) {
      std::unique_ptr<char[]> out(new char[static_cast<size_t>(outSize) * 2]);
      const int size = outSize * 2;
      Platform::SetLastError(ERROR_SUCCESS);
      const int written = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, flags, source.get(), length,
                                                        out.get(), size, nullptr, nullptr);
      if (size >= needed) {
        FUZZ_CHECK(written == needed);
        // Decoding what was written gives the text back (lone surrogates replaced).
        const std::optional<std::u16string> decoded = DecodeStrict(std::string(out.get(), static_cast<size_t>(written)));
        FUZZ_CHECK(decoded.has_value());
        FUZZ_CHECK(*decoded == ReplaceLoneSurrogates(units));
      } else {
        FUZZ_CHECK(written == 0);
        FUZZ_CHECK(Platform::GetLastError() == ERROR_INSUFFICIENT_BUFFER);
      }
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const int outSize = input.ConsumeIntegralInRange<int>(1, 64);
  const bool strict = input.ConsumeBool();
  const std::string bytes = input.ConsumeRemainingBytesAsString();
  const std::u16string units = OwFuzz::Units(bytes);

  CheckNarrowText(OwFuzz::UpToNul(bytes));
  CheckWideText(OwFuzz::UpToNul(units));
  CheckConverters(bytes, units, outSize, strict);
  return 0;
}
