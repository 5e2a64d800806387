// Text encodings for transports: URI percent-encoding, special-character escapes, and plain
// UTF-16 <-> UTF-8 conversion.
//
// The URI form percent-encodes every byte of the UTF-8 form except ASCII letters, digits and
// "-_.~". The special-character form escapes ASCII punctuation, symbols and control characters
// (but not letters, digits, white space or anything outside ASCII) as "%XX" of the 16-bit unit.
// Encoders write upper-case hex digits; decoders accept either case and are strict: a malformed
// escape, or an escape of a character the encoder would have left alone, fails the whole call.
//
//   Lumo::String q = Lumo::EncodeURI(u"caf\u00e9 & co");     // "caf%C3%A9%20%26%20co"
//   Lumo::String back = Lumo::DecodeURI(q.c_str());          // "caf\u00e9 & co"
//
// A null input raises PreconditionFailed0 ("pStrIn != NULL"). Other failures raise the
// LumoStringUnableTo... exception of the operation, carrying the whole input and, as its cause,
// the precise problem (LumoStringInvalidHexCharA, LumoStringInvalidDecodedCharW...).
#pragma once

#include <string>

#include "owutils/Export.h"
#include "owutils/tstring.h"

namespace Lumo {

// UTF-16 to UTF-8. Unpaired surrogates become U+FFFD rather than failing.
OWUTILS_API std::string WideToUtf8(const char16_t* pStrIn);
// UTF-8 to UTF-16. Invalid byte sequences become U+FFFD rather than failing.
OWUTILS_API String Utf8ToWide(const char* pStrIn);

OWUTILS_API String EncodeURI(const char16_t* pStrIn);
OWUTILS_API String DecodeURI(const char16_t* pStrIn);

OWUTILS_API String EncodeSpecialChars(const char16_t* pStrIn);
OWUTILS_API String DecodeSpecialChars(const char16_t* pStrIn);

// The value of a hexadecimal digit of either case (0..15); any result above 15 means `c` is not
// a hexadecimal digit.
OWUTILS_API unsigned int HexDigitValue(char c) noexcept;
OWUTILS_API unsigned int HexDigitValue(char16_t c) noexcept;

}  // namespace Lumo
