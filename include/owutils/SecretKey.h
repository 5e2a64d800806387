// Secret-key verification: tells whether a secret key is the one that produced an encryption
// code, without the key itself being kept.
//
// The code is the hex ciphertext of a fixed 32-character check text, made by CEncrypt's
// EncryptString with the key under the cipher the external type number selects (full strength):
//
//   encType:   1 Blowfish   2 triple DES (3 keys)  3 triple DES (2 keys)  4 SAFER SK-128
//              5 IDEA       6 RC5                  7 Twofish              8 MARS
//              9 AES-128   10 AES-192             11 AES-256
//
//   if (VerifySecretKey(key, storedCode, 9)) { ... }
//
// Verification decrypts the code with the offered key and compares the result with the check
// text in constant time. An empty key or code, or encType 0, throws PreconditionFailed0; any
// other encType outside 1-11 throws the encryptor's assertion; a code that is not valid UTF-16
// throws std::range_error ("bad conversion"). A wrong key, type or code gives false.
#pragma once

#include "owutils/Export.h"
#include "owutils/tstring.h"

OWUTILS_API bool VerifySecretKey(const Lumo::String& secretKey, const Lumo::String& hexEncryptionCode, int encType);

// The code that VerifySecretKey accepts for `secretKey` and `encType` (64 lower-case hex digits):
// what a product stores when the user sets a key. An empty key, or an encType outside 1-11,
// throws PreconditionFailed0.
OWUTILS_API Lumo::String MakeSecretKeyCode(const Lumo::String& secretKey, int encType);
