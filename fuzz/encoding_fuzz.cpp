// The transport encodings: EncodeURI / DecodeURI and EncodeSpecialChars / DecodeSpecialChars.
//
// Properties: the decoders take any text and either decode it or raise their own
// LumoStringUnableTo... exception carrying the input, never anything else; encoding then
// decoding gives the text back (for the URI form, with unpaired surrogates as U+FFFD, which is
// what the UTF-8 form can carry); encoded text is pure ASCII made of the allowed characters
// and escapes; a decoded escape is never a character the encoder leaves alone.
#include <cctype>

#include "FuzzSupport.h"
#include "owutils/Exceptions.h"
#include "owutils/StringEncodeDecode.h"

namespace {

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

bool IsUpperHex(char16_t c) { return (c >= u'0' && c <= u'9') || (c >= u'A' && c <= u'F'); }
bool IsUnreserved(char16_t c) {
  return c < 0x80 && (std::isalnum(c) || c == u'-' || c == u'_' || c == u'.' || c == u'~');
}
bool IsSpecial(char16_t c) { return c < 0x80 && !std::isalnum(c) && !std::isspace(c); }

// Escapes are '%' and two upper-case digits; everything else is `plain`.
template <typename Plain>
void CheckEncoded(const std::u16string& encoded, Plain plain) {
  for (size_t i = 0; i < encoded.size(); ++i) {
    if (encoded[i] == u'%') {
      FUZZ_CHECK(i + 2 < encoded.size());
      FUZZ_CHECK(IsUpperHex(encoded[i + 1]) && IsUpperHex(encoded[i + 2]));
      i += 2;
    } else {
      FUZZ_CHECK(plain(encoded[i]));
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  // ASCII-shaped text finds the escapes sooner; UTF-16 units cover the rest.
  const bool ascii = input.ConsumeBool();
  const std::string bytes = input.ConsumeRemainingBytesAsString();
  const std::u16string text = OwFuzz::UpToNul(ascii ? OwFuzz::Latin1(bytes) : OwFuzz::Units(bytes));

  // Arbitrary text through the decoders.
  try {
    const Lumo::String decoded = Lumo::DecodeURI(text.c_str());
    FUZZ_CHECK(decoded.size() <= 3 * text.size());
  } catch (const LumoStringUnableToDecodeStringFromURI& e) {
    FUZZ_CHECK(e.GetCause() != nullptr);
  }
  try {
    const Lumo::String decoded = Lumo::DecodeSpecialChars(text.c_str());
    FUZZ_CHECK(decoded.size() <= text.size());
  } catch (const LumoStringUnableToDecodeSpecialCharsInString& e) {
    FUZZ_CHECK(e.GetCause() != nullptr);
  }

  // Encode, then decode.
  const Lumo::String uri = Lumo::EncodeURI(text.c_str());
  CheckEncoded(uri, [](char16_t c) { return IsUnreserved(c); });
  FUZZ_CHECK(Lumo::DecodeURI(uri.c_str()) == ReplaceLoneSurrogates(text));

  const Lumo::String special = Lumo::EncodeSpecialChars(text.c_str());
  CheckEncoded(special, [](char16_t c) { return !IsSpecial(c); });
  FUZZ_CHECK(Lumo::DecodeSpecialChars(special.c_str()) == text);
  return 0;
}
